#include "host/changes/committed_changes.h"

#include <map>
#include <optional>
#include <set>
#include <utility>

namespace tav {

namespace {

CommittedChange changeOf(FileRecord const& record, Tree const& before)
{
    auto const old = before.find(record.previousPath.isEmpty() ? record.path : record.previousPath);
    common::FileChange const change = record.url.isEmpty()            ? common::FileChange::removed
                                      : before.count(record.path) > 0 ? common::FileChange::modified
                                                                      : common::FileChange::added;
    return {record.path, change, record.previousPath, record.url, old == before.end() ? OdString() : old->second};
}

/// The former path, at the commit `from`, of each file that was renamed up to `to`; nothing when `from` is not on the
/// line of first parents.
std::map<OdString, OdString> renamesBetween(CommitTables const& commits, CommitRecord const& from, CommitRecord to)
{
    std::vector<OdString> line;
    while (to.number > from.number && !to.parents.empty()) {
        line.push_back(to.hash);
        to = commits.find(to.parents.front()).value();
    }
    std::map<OdString, OdString> former;
    if (to.hash != from.hash) {
        return former;
    }
    for (auto hash = line.rbegin(); hash != line.rend(); ++hash) {
        std::map<OdString, OdString> renamed;
        for (FileRecord const& record : commits.changes(*hash)) {
            if (!record.previousPath.isEmpty()) {
                auto const earlier = former.find(record.previousPath);
                renamed[record.path] = earlier == former.end() ? record.previousPath : earlier->second;
            }
        }
        for (auto& [path, previous] : renamed) {
            former[path] = std::move(previous);
        }
    }
    return former;
}

std::optional<CommittedChange> changeOf(OdString const& path, Tree const& before, Tree const& after)
{
    auto const old = before.find(path);
    auto const now = after.find(path);
    if (old == before.end()) {
        return CommittedChange{path, common::FileChange::added, OdString(), now->second, OdString()};
    }
    if (now == after.end()) {
        return CommittedChange{path, common::FileChange::removed, OdString(), OdString(), old->second};
    }
    return now->second == old->second ? std::nullopt
                                      : std::optional(CommittedChange{
                                            path, common::FileChange::modified, OdString(), now->second, old->second});
}

} // namespace

std::vector<CommittedChange>
changesBetween(CommitTables const& commits, CommitRecord const& from, CommitRecord const& to)
{
    Tree const before = commits.files(from.hash);
    Tree const after = commits.files(to.hash);
    Tree all = before;
    all.insert(after.begin(), after.end());
    std::map<OdString, CommittedChange> changes;
    for (auto const& [path, url] : all) {
        if (auto change = changeOf(path, before, after)) {
            changes.emplace(path, std::move(*change));
        }
    }
    for (auto const& [path, previous] : renamesBetween(commits, from, to)) {
        auto const renamed = changes.find(path);
        auto const gone = changes.find(previous);
        bool const isPair = renamed != changes.end() && gone != changes.end() && gone->second.url.isEmpty();
        if (isPair) {
            renamed->second.previousPath = previous;
            renamed->second.oldUrl = gone->second.oldUrl;
            changes.erase(gone);
        }
    }
    std::vector<CommittedChange> list;
    for (auto& [path, change] : changes) {
        list.push_back(std::move(change));
    }
    return list;
}

std::vector<CommittedChange> committedChanges(CommitTables const& commits, CommitRecord const& commit)
{
    Tree const before = commits.files(commit.parents.empty() ? OdString() : commit.parents.front());
    std::vector<FileRecord> const records = commits.changes(commit.hash);
    std::set<OdString> renamed;
    for (FileRecord const& record : records) {
        renamed.insert(record.previousPath);
    }
    std::vector<CommittedChange> changes;
    for (FileRecord const& record : records) {
        bool const isOldName = record.url.isEmpty() && renamed.count(record.path) > 0;
        if (!isOldName) {
            changes.push_back(changeOf(record, before));
        }
    }
    return changes;
}

} // namespace tav
