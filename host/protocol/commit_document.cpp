#include "host/protocol/commit_document.h"

#include "host/history/commit_hash.h"
#include "host/history/reference_name.h"
#include "host/history/tree.h"
#include "host/protocol/document.h"
#include "host/protocol/members.h"
#include "host/protocol/refusal.h"
#include "host/protocol/timestamp.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"

#include "common/mu_common_json_keys.h"

#include <algorithm>
#include <cstddef>
#include <memory>
#include <utility>

namespace tav {

namespace {

namespace keys = common::json;

constexpr wchar_t const* kExpected = L"expected";
std::int64_t readDate(Part const& part)
{
    auto const seconds = secondsOf(part.text());
    if (!seconds) {
        part.refuse("must be a time such as '2024-03-05T14:07:09Z'");
    }
    return *seconds;
}

FileRecord readFile(Part const& part)
{
    FileRecord file;
    file.path = readPath(part.member(keys::s_path.c_str()));
    file.url = readUrl(part.member(keys::s_storage_path.c_str()));
    if (auto const previous = part.optionalMember(keys::s_previous_path.c_str())) {
        OdString const path = readPath(*previous);
        file.previousPath = path == file.path ? OdString() : path;
    }
    return file;
}

std::vector<FileRecord> readFiles(Part const& part)
{
    std::vector<FileRecord> files;
    std::size_t const count = part.size();
    files.reserve(count);
    for (std::size_t i = 0; i < count; ++i) {
        files.push_back(readFile(part[i]));
    }
    if (auto const fault = whyNotTree(files)) {
        part.refuse(*fault);
    }
    return files;
}

CommitRecord readCommit(Part const& part)
{
    CommitRecord commit;
    commit.hash = readHash(part.member(keys::s_hash.c_str()));
    Part const annotation = part.member(keys::s_annotation.c_str());
    commit.author = annotation.member(L"author").soundText();
    commit.message = annotation.member(L"message").soundText();
    commit.date = readDate(annotation.member(L"date"));
    commit.parents = readParents(part.member(keys::s_parents.c_str()));
    if (std::count(commit.parents.begin(), commit.parents.end(), commit.hash) > 0) {
        part.refuse("must not be its own parent");
    }
    return commit;
}

common::EType readType(Part const& part)
{
    auto const type = common::toType(part.text());
    if (!type.hasValue()) {
        part.refuse("must be 'branch' or 'tag'");
    }
    return type.value();
}

OdString readReferenceName(Part const& part)
{
    OdString name = part.text();
    if (auto const fault = whyNotReferenceName(name)) {
        part.refuse(*fault);
    }
    return name;
}

/// An empty text, or a hash.
std::optional<OdString> readExpected(Part const& part)
{
    auto const expected = part.optionalMember(kExpected);
    if (!expected || expected->text().isEmpty()) {
        return expected ? std::optional(OdString()) : std::nullopt;
    }
    return readHash(*expected);
}

/// Who removes a reference says what it names.
OdString readTarget(Part const& part, std::optional<OdString> const& expected)
{
    bool const mayBeRemoved = expected && !expected->isEmpty();
    return mayBeRemoved && part.text().isEmpty() ? OdString() : readHash(part);
}

ReferenceChange readReference(Part const& part)
{
    std::optional<OdString> expected = readExpected(part);
    common::Reference const reference(
        readReferenceName(part.member(keys::s_ref_name.c_str())),
        readTarget(part.member(keys::s_commitHash.c_str()), expected), readType(part.member(L"refType")));
    return {reference, std::move(expected)};
}

void checkNames(Part const& part, std::vector<ReferenceChange> const& changes)
{
    std::vector<OdString> names;
    names.reserve(changes.size());
    for (ReferenceChange const& change : changes) {
        names.push_back(change.reference.name);
    }
    std::sort(names.begin(), names.end());
    auto const twice = std::adjacent_find(names.begin(), names.end());
    if (twice != names.end()) {
        part.refuse("must not hold the name " + quoted(*twice) + " twice");
    }
}

std::vector<ReferenceChange> readReferences(Part const& part)
{
    std::vector<ReferenceChange> references;
    std::size_t const count = part.size();
    for (std::size_t i = 0; i < count; ++i) {
        references.push_back(readReference(part[i]));
    }
    checkNames(part, references);
    return references;
}

kutils::json::Array referenceArray(std::vector<ReferenceChange> const& changes)
{
    kutils::json::Array array;
    for (ReferenceChange const& change : changes) {
        kutils::json::Object object;
        object[keys::s_commitHash.c_str()] = jsonText(change.reference.commitHash);
        object[keys::s_ref_name.c_str()] = jsonText(change.reference.name);
        object[L"refType"] = change.reference.type == common::EType::branch ? L"branch" : L"tag";
        if (change.expected) {
            object[kExpected] = jsonText(*change.expected);
        }
        array.emplace_back(std::move(object));
    }
    return array;
}

common::RepoFile recorded(FileRecord const& file)
{
    if (file.previousPath.isEmpty()) {
        return {withPairs(file.path), file.url};
    }
    return {withPairs(file.path), file.url, std::make_unique<common::BaseFile>(withPairs(file.previousPath))};
}

} // namespace

OdString commitInfoDocument(NewCommit const& commit)
{
    common::CommitInfo info;
    for (FileRecord const& file : commit.files) {
        info.files.push_back(recorded(file));
    }
    info.parents = commit.commit.parents;
    info.hash = commit.commit.hash;
    info.author = withPairs(commit.commit.author);
    info.message = withPairs(commit.commit.message);
    kutils::json::Value document = common::serializeCommitInfo(info);
    kutils::json::Object& whole = document.get_object();
    kutils::json::Object& only = whole[L"commits"].get_array().front().get_object();
    only[keys::s_annotation.c_str()].get_object()[L"date"] = jsonText(timeText(commit.commit.date));
    whole[keys::s_references.c_str()] = referenceArray(commit.references);
    return compactText(document);
}

void requireHash(NewCommit const& commit)
{
    OdString const hash = commitHash(commit.commit, commit.files);
    if (hash != commit.commit.hash) {
        throw refusal(
            ServerError::wrongHash,
            "'commits[0].hash' is " + quoted(commit.commit.hash) + ", but the hash of this commit is " + quoted(hash) +
                ".",
            kNothingChanged);
    }
}

OdString referenceChanges(std::vector<ReferenceChange> const& changes)
{
    return compactText(referenceArray(changes));
}

NewCommit readCommitInfo(OdString const& document)
{
    kutils::json::Value const value = parsed(document);
    Part const whole(value);
    Part const commits = whole.member(L"commits");
    if (commits.size() != 1) {
        commits.refuse("must hold one commit, not " + std::to_string(commits.size()));
    }
    Part const commit = commits[0];
    NewCommit result;
    result.commit = readCommit(commit);
    result.files = readFiles(commit.member(L"files"));
    result.references = readReferences(whole.member(keys::s_references.c_str()));
    return result;
}

std::vector<ReferenceChange> readReferences(OdString const& document)
{
    kutils::json::Value const value = parsed(document);
    return readReferences(Part(value));
}

std::int64_t readLastNumber(OdString const& document)
{
    std::int64_t last = 0;
    for (CommitNumber const& pair : readNumbers(document)) {
        last = std::max(last, pair.number);
    }
    return last;
}

std::vector<CommitNumber> readNumbers(OdString const& document)
{
    kutils::json::Value const value = parsed(document);
    Part const whole(value);
    std::size_t const count = whole.size();
    std::vector<CommitNumber> numbers;
    numbers.reserve(count);
    for (std::size_t i = 0; i < count; ++i) {
        Part const pair = whole[i];
        OdString hash = pair.member(keys::s_hash.c_str()).text();
        numbers.push_back({pair.member(L"commitNo").integer(), std::move(hash)});
    }
    return numbers;
}

NewRepository readNewRepository(OdString const& document)
{
    kutils::json::Value const value = parsed(document);
    Part const whole(value);
    Part const part = whole.member(keys::s_ref_name.c_str());
    OdString name = part.text();
    if (auto const fault = whyNotName(name)) {
        part.refuse(*fault);
    }
    auto const id = whole.optionalMember(L"id");
    if (id && !isRepositoryId(id->text())) {
        id->refuse("must be an identifier of 32 lower-case hexadecimal digits");
    }
    return {std::move(name), id ? id->text() : OdString()};
}

} // namespace tav
