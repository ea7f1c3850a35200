/// A server in a temporary folder, driven through its documents alone.
///
/// In the texts here "<a>" stands for the hash of the commit that `commit` has made last under the name 'a', for a hash
/// of 64 characters 'a' where there is none and for contents ("po:<a>"), and "<id>" for the identifier of the
/// repository.
#pragma once

#include "host/history/commit_hash.h"
#include "host/protocol/commit_document.h"
#include "host/server/embedded_server.h"

#include "tests/support/temp_folder.h"

#include <algorithm>
#include <cctype>
#include <cstddef>
#include <gtest/gtest.h>
#include <map>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace server {

inline OdString wideText(std::string_view text)
{
    return {text.data(), text.size(), CP_UTF_8};
}

inline std::string replaced(std::string text, std::string const& what, std::string const& with)
{
    std::size_t const place = text.find(what);
    if (place == std::string::npos) {
        throw std::invalid_argument("no '" + what + "' in: " + text);
    }
    return text.replace(place, what.size(), with);
}

/// Hashes of commits by their names in texts.
inline std::map<char, std::string>& commitHashes()
{
    static std::map<char, std::string> hashes;
    return hashes;
}

inline std::string hashNamed(char name)
{
    auto const known = commitHashes().find(name);
    return known == commitHashes().end() ? std::string(64, name) : known->second;
}

/// Writes out what stands for hashes.
inline std::string expanded(std::string const& text)
{
    std::string result;
    for (std::size_t i = 0; i < text.size(); ++i) {
        bool const isHash = i + 2 < text.size() && text[i] == '<' && text[i + 2] == '>';
        bool const isContent = isHash && i > 0 && (text[i - 1] == ':' || text[i - 1] == '#');
        result += isContent ? std::string(64, text[i + 1]) : isHash ? hashNamed(text[i + 1]) : std::string(1, text[i]);
        i += isHash ? 2 : 0;
    }
    return result;
}

/// The way back.
inline std::string shortened(std::string text)
{
    std::multimap<char, std::string> names(commitHashes().begin(), commitHashes().end());
    for (char const name : std::string("0123456789abcdef")) {
        names.emplace(name, std::string(64, name));
    }
    for (auto const& [name, hash] : names) {
        for (std::size_t place = text.find(hash); place != std::string::npos; place = text.find(hash)) {
            text.replace(place, hash.size(), std::string("<") + name + ">");
        }
    }
    return text;
}

inline std::string joined(std::vector<std::string> const& items)
{
    std::string text;
    for (std::string const& item : items) {
        text += (text.empty() ? "" : ",") + item;
    }
    return "[" + text + "]";
}

/// References, each as "branch main a", or as "branch main a b" where it is expected to name b; "-" is none.
inline std::string references(std::vector<std::string> const& lines)
{
    std::vector<std::string> items;
    for (std::string const& line : lines) {
        std::istringstream words(line);
        std::string type, name, hash, expected;
        words >> type >> name >> hash >> expected;
        if (!expected.empty()) {
            expected = R"("expected":")" + (expected == "-" ? "" : "<" + expected + ">") + R"(",)";
        }
        items.push_back(
            R"({"commitHash":"<)" + hash + R"(>",)" + expected + R"("name":")" + name + R"(","refType":")" + type +
            R"("})");
    }
    return joined(items);
}

/// Files, each as "plan.dwg 1", or as "plan.dwg 1 draft.dwg" with its previous path.
inline std::string files(std::vector<std::string> const& lines)
{
    std::vector<std::string> items;
    for (std::string const& line : lines) {
        std::istringstream words(line);
        std::string path, content, previous;
        words >> path >> content >> previous;
        previous = previous.empty() ? "" : R"("previousPath":")" + previous + R"(",)";
        items.push_back(R"({"path":")" + path + R"(",)" + previous + R"("storagePath":"po:<)" + content + R"(>"})");
    }
    return joined(items);
}

/// The file that `files` writes for one of its lines.
inline tav::FileRecord fileRecord(std::string const& line)
{
    std::istringstream words(line);
    std::string path, content, previous;
    words >> path >> content >> previous;
    previous = previous == path ? "" : previous; // No renaming.
    return {wideText(path), wideText(expanded("po:<" + content + ">")), wideText(previous)};
}

inline std::string hashOf(std::string const& parents, std::vector<std::string> const& fileLines)
{
    tav::CommitRecord commit;
    commit.author = L"ann";
    commit.message = L"moves the stairs";
    for (char const parent : parents) {
        commit.parents.push_back(wideText(hashNamed(parent)));
    }
    std::vector<tav::FileRecord> files(fileLines.size());
    std::transform(fileLines.begin(), fileLines.end(), files.begin(), fileRecord);
    return tav::commitHash(commit, files).ansi_str();
}

/// A commit-info document for a commit behind the commits `parents`, one character each, that has the name `hash` in
/// texts from now on.
inline std::string commit(
    char hash, std::string const& parents, std::vector<std::string> const& fileLines,
    std::vector<std::string> const& referenceLines)
{
    commitHashes()[hash] = hashOf(parents, fileLines);
    std::vector<std::string> hashes;
    for (char const parent : parents) {
        hashes.push_back(std::string("\"<") + parent + ">\"");
    }
    return R"({"commits":[{"annotation":{"author":"ann","date":"2024-03-05T14:07:09Z","message":"moves the stairs"},)"
           R"("files":)" +
           files(fileLines) + R"(,"hash":"<)" + hash + R"(>","parentsHashes":)" + joined(hashes) + R"(}],)" +
           R"("references":)" + references(referenceLines) + "}";
}

/// Lets `name` stand for the hash that a document with another content needs.
inline void renameCommit(char name, std::string const& document)
{
    tav::NewCommit const changed = tav::readCommitInfo(wideText(expanded(document)));
    commitHashes()[name] = tav::commitHash(changed.commit, changed.files).ansi_str();
}

class ServerTest : public testing::Test {
protected:
    ServerTest()
    {
        commitHashes().clear();
        id_ = init("bridge"); // Asking looks at the identifier already.
    }

    /// The server's answer, or "error: " and its message.
    std::string ask(std::string const& verb, std::string const& document) { return ask(server_, verb, document); }

    std::string ask(tav::Server& server, std::string const& verb, std::string const& document)
    {
        std::string const request = verb.find("<id>") == std::string::npos ? verb : replaced(verb, "<id>", id_);
        auto const answer = server.request(wideText(request), wideText(expanded(document)));
        std::string text =
            answer.hasValue() ? answer.value().ansi_str() : "error: " + answer.error().message.ansi_str();
        text = shortened(text);
        return id_.empty() || text.find(id_) == std::string::npos ? text : replaced(text, id_, "<id>");
    }

    /// Makes a repository and returns its identifier.
    std::string init(std::string const& name)
    {
        std::string const answer = ask("init", R"({"name":")" + name + R"("})");
        std::string const before = R"({"id":")";
        return answer.size() > before.size() + 2 ? answer.substr(before.size(), answer.size() - before.size() - 2) : "";
    }

    std::string const& id() const { return id_; }
    support::TempFolder const& folder() const { return folder_; }
    std::string serverFolder() const { return folder_.pathTo("server"); }

private:
    support::TempFolder folder_;
    tav::EmbeddedServer server_{folder_.pathTo("server")};
    std::string id_;
};

} // namespace server
