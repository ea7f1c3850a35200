/// What a reader makes of a document, in words, so that a test compares the whole of it at once.
#pragma once

#include "common/mu_common_json.h"
#include "common/mu_common_serialization.h"

#include "platform/sdk/OdString.h"
#include "tests/support/utf8.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include <cstddef>
#include <gtest/gtest.h>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace server {

using kutils::json::Array;
using kutils::json::Object;
using kutils::json::Value;
using kutils::json::Value_type;

/// The value of a text that a test takes for a document.
inline Value parsed(std::string_view text)
{
    Value value;
    if (!kutils::json::read_string(value, support::fromUtf8(text))) {
        throw std::invalid_argument("the test's own document is not JSON: " + std::string(text));
    }
    return value;
}

inline Object object(std::string_view text)
{
    return parsed(text).get_object();
}

inline Array array(std::string_view text)
{
    return parsed(text).get_array();
}

/// A document in the pretty layout.
inline std::string pretty(Value const& document)
{
    std::wstring const text = kutils::json::write_string(document, true);
    return OdString(text.c_str(), text.size()).ansi_str();
}

inline std::string inWords(OdString const& text)
{
    return text.ansi_str();
}

inline std::string inWords(common::EType type)
{
    return std::to_string(static_cast<int>(type));
}

inline std::string inWords(common::Annotation const& annotation)
{
    return inWords(annotation.author) + " said '" + inWords(annotation.message) + "' at " +
           std::to_string(annotation.date.packedValue());
}

inline std::string inWords(common::Reference const& reference)
{
    std::string const kind = reference.type == common::EType::branch ? "branch " : "tag ";
    std::string const note = reference.annotation ? ", " + inWords(*reference.annotation) : "";
    return kind + inWords(reference.name) + " -> " + inWords(reference.commitHash) + note;
}

inline std::string inWords(common::RepoData const& repository)
{
    return inWords(repository.name) + " is " + inWords(repository.id) + " '" + inWords(repository.description) + "'";
}

inline std::string inWords(common::ReceivedFile const& file)
{
    std::string const previous = file.previous ? " from " + inWords(file.previous->path) : "";
    std::string const info = file.metaInfo ? " with information" : "";
    return inWords(file.current.path) + " in " + inWords(file.current.storagePath) + previous + info;
}

inline std::string inWords(common::CommitNumberPair const& pair)
{
    return inWords(pair.hash) + " is " + std::to_string(pair.commitNo);
}

template <class T>
std::string inWords(std::vector<T> const& items);

inline std::string inWords(common::Commit const& commit)
{
    return std::to_string(commit.commitNo) + " " + inWords(commit.hash) + " of " + inWords(commit.parents) + ": " +
           inWords(commit.annotation) + " " + inWords(commit.files);
}

inline std::string inWords(common::FetchData const& data)
{
    return inWords(data.repository) + "; commits " + inWords(data.commits) + "; references " + inWords(data.references);
}

template <class T>
std::string inWords(std::vector<T> const& items)
{
    std::string words;
    for (T const& item : items) {
        words += (words.empty() ? "" : ", ") + inWords(item);
    }
    return "[" + words + "]";
}

inline std::string inWords(ErrorMessage const& error)
{
    return "error" + (error.code == 0 ? "" : " " + std::to_string(error.code)) + ": " + error.message.ansi_str();
}

template <class T>
std::string inWords(Expected<T> const& result)
{
    return result.hasValue() ? inWords(result.value()) : inWords(result.error());
}

/// The result of `read` in words, "error: ..." for an error that it returns, "throws: ..." for a document that it
/// throws over.
template <class Read>
std::string outcomeOf(Read const& read)
{
    try {
        return inWords(read());
    } catch (common::JsonParseError const& error) {
        return "throws: " + error.description().ansi_str();
    }
}

/// What the typed accessors throw over a member of another type than they want.
inline std::string mismatch(std::string const& wanted, std::string const& found, std::string const& key)
{
    std::string const place = key.empty() ? "" : "\njson key:\t\"" + key + "\"";
    return "throws: Error:\tExpected json type '" + wanted + "', found '" + found + "'" + place;
}

/// What they throw over one that is not there.
inline std::string missing(std::string const& key)
{
    return "throws: Unable to find json key '" + key + "'\njson key:\t\"" + key + "\"";
}

/// The error of an element that is no object.
inline std::string noObject(std::string const& found)
{
    return "error: Encounterd 'object', found '" + found + ". While parsing json vector.'";
}

/// A document and what is to come of it.
struct Row {
    char const* name;
    std::string document;
    std::string outcome;
};

inline void PrintTo(Row const& row, std::ostream* out)
{
    *out << row.document;
}

/// A value of each type, and the type's name in messages.
struct Sample {
    char const* type;
    char const* text;
};

inline constexpr Sample kSamples[] = {
    {"object", "{}"}, {"array", "[]"}, {"string", "\"text\""}, {"bool", "true"},
    {"int", "1"},     {"real", "1.5"}, {"null", "null"},
};

/// A member of a document and the type that it must have.
struct Member {
    char const* key;
    char const* type;
};

/// Puts a value of each type into each of `members` of the complete document `complete` in turn. `read`, which takes an
/// object, must throw over each of the wrong types and name the member.
template <class Read>
void expectsTypes(std::string_view complete, std::vector<Member> const& members, Read const& read)
{
    for (Member const& member : members) {
        for (Sample const& sample : kSamples) {
            if (std::string_view(sample.type) == member.type) {
                continue;
            }
            Object document = object(complete);
            document[support::fromUtf8(member.key).c_str()] = parsed(sample.text);
            EXPECT_EQ(outcomeOf([&] { return read(document); }), mismatch(member.type, sample.type, member.key));
        }
    }
}

} // namespace server
