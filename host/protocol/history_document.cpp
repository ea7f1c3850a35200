#include "host/protocol/history_document.h"

#include "host/protocol/document.h"
#include "host/protocol/members.h"
#include "host/text/characters.h"
#include "host/text/json_text.h"

#include "common/mu_common_json_keys.h"

#include <set>
#include <utility>

namespace tav {

namespace {

using kutils::json::Array;
using kutils::json::Object;

namespace keys = common::json;

Object changeDocument(FileRecord const& change)
{
    Object document;
    document[keys::s_path.c_str()] = jsonText(change.path);
    if (!change.previousPath.isEmpty()) {
        document[keys::s_previous_path.c_str()] = jsonText(change.previousPath);
    }
    if (!change.url.isEmpty()) {
        document[keys::s_storage_path.c_str()] = jsonText(change.url);
    }
    return document;
}

Object commitDocument(CommitRecord const& commit, std::vector<FileRecord> const& changes)
{
    Object annotation;
    annotation[L"author"] = jsonText(commit.author);
    annotation[L"date"] = commit.date;
    annotation[L"message"] = jsonText(commit.message);
    Array changed;
    changed.reserve(changes.size());
    for (FileRecord const& change : changes) {
        changed.emplace_back(changeDocument(change));
    }
    Array parents;
    for (OdString const& parent : commit.parents) {
        parents.emplace_back(jsonText(parent));
    }
    Object document;
    document[keys::s_annotation.c_str()] = std::move(annotation);
    document[L"changes"] = std::move(changed);
    document[L"commitNo"] = commit.number;
    document[keys::s_hash.c_str()] = jsonText(commit.hash);
    document[keys::s_parents.c_str()] = std::move(parents);
    return document;
}

FileRecord readChange(Part const& part)
{
    FileRecord change;
    change.path = readPath(part.member(keys::s_path.c_str()));
    if (auto const url = part.optionalMember(keys::s_storage_path.c_str())) {
        change.url = readUrl(*url);
    }
    if (auto const previous = part.optionalMember(keys::s_previous_path.c_str())) {
        change.previousPath = readPath(*previous);
    }
    return change;
}

std::vector<FileRecord> readChanges(Part const& part)
{
    std::vector<FileRecord> changes;
    std::set<OdString> paths;
    std::size_t const count = part.size();
    changes.reserve(count);
    for (std::size_t i = 0; i < count; ++i) {
        changes.push_back(readChange(part[i]));
        if (!paths.insert(changes.back().path).second) {
            part.refuse("must not hold the path " + quoted(changes.back().path) + " twice");
        }
    }
    return changes;
}

ChangedCommit readCommit(Part const& part)
{
    ChangedCommit result;
    CommitRecord& commit = result.commit;
    commit.hash = readHash(part.member(keys::s_hash.c_str()));
    commit.number = part.member(L"commitNo").integer();
    Part const annotation = part.member(keys::s_annotation.c_str());
    commit.author = annotation.member(L"author").soundText();
    commit.message = annotation.member(L"message").soundText();
    commit.date = annotation.member(L"date").integer();
    commit.parents = readParents(part.member(keys::s_parents.c_str()));
    result.changes = readChanges(part.member(L"changes"));
    return result;
}

} // namespace

OdString changedCommitText(ChangedCommit const& commit)
{
    return compactText(commitDocument(commit.commit, commit.changes));
}

std::vector<ChangedCommit> readHistoryPage(OdString const& document)
{
    kutils::json::Value const value = parsed(document);
    Part const whole(value);
    Part const commits = whole.member(L"commits");
    std::vector<ChangedCommit> result;
    std::size_t const count = commits.size();
    for (std::size_t i = 0; i < count; ++i) {
        result.push_back(readCommit(commits[i]));
        if (i > 0 && result[i].commit.number <= result[i - 1].commit.number) {
            commits[i].refuse("must have a higher number than the one before it");
        }
    }
    return result;
}

} // namespace tav
