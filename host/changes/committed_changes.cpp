#include "host/changes/committed_changes.h"

#include <set>

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

} // namespace

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
