#include "host/repository/status.h"

#include "host/repository/changes.h"
#include "host/repository/local_database.h"
#include "host/repository/work.h"
#include "host/repository/working_state.h"

#include "common/mu_common_file_utils.h"

#include <algorithm>
#include <set>
#include <utility>

namespace tav {

namespace {

using Paths = std::set<OdString>;

/// Scans are nearly in order: often only the last folder stands elsewhere. Sorting what follows the ordered beginning
/// takes the status of 200,000 new files from 0.21 s of processor time to 0.07 s.
void sortScanned(std::vector<OdString>& paths)
{
    auto const middle = std::is_sorted_until(paths.begin(), paths.end());
    std::sort(middle, paths.end());
    std::inplace_merge(paths.begin(), middle, paths.end());
}

/// Takes the paths out of `list`, but for those in `left`.
template <class List, class PathOf>
std::vector<OdString> takeSorted(List& list, Paths const& left, PathOf const& pathOf)
{
    std::vector<OdString> paths;
    paths.reserve(list.size());
    for (auto& item : list) {
        if (left.count(pathOf(item)) == 0) {
            paths.push_back(std::move(pathOf(item)));
        }
    }
    sortScanned(paths);
    return paths;
}

StagedEntry
entryOf(common::StagedFile const& file, common::State const& state, Tree const& base, common::RootPath const& root)
{
    StagedEntry entry{file.path, file.change, OdString(), false};
    auto const rename = state.renames.find(file.path);
    if (rename != state.renames.end() && base.count(rename->second) > 0) {
        entry.previousPath = rename->second;
    }
    entry.isMissing = file.change != common::FileChange::removed && !ut::FileName::fileExists(root.pathTo(file.path));
    return entry;
}

std::vector<StagedEntry> stagedEntries(common::State const& state, Tree const& base, common::RootPath const& root)
{
    std::vector<StagedEntry> entries;
    for (common::StagedFile const& file : state.stagedFiles) {
        entries.push_back(entryOf(file, state, base, root));
    }
    auto const byPath = [](StagedEntry const& a, StagedEntry const& b) { return a.path < b.path; };
    std::stable_sort(entries.begin(), entries.end(), byPath);
    return entries;
}

Paths stagedPaths(common::State const& state)
{
    Paths paths;
    for (common::StagedFile const& file : state.stagedFiles) {
        paths.insert(file.path);
    }
    return paths;
}

/// Committed files that are accounted for when they are missing: staged as removed, or renamed.
Paths pathsLeft(common::State const& state)
{
    Paths paths = stagedPaths(state);
    for (auto const& [path, previous] : state.renames) {
        paths.insert(previous);
    }
    return paths;
}

std::vector<common::ConflictInfo> conflictsOf(common::RootPath const& root)
{
    std::vector<common::ConflictInfo> conflicts;
    for (auto const& conflict : common::collectConflictPaths(root)) {
        conflicts.push_back(*conflict);
    }
    return conflicts;
}

void enterPlace(LocalDatabase const& database, common::State const& state, Status& status)
{
    OdString const base = database.base();
    auto const commit = database.commits().find(base);
    auto const end = database.commits().reference(state.head);
    status.branch = state.head;
    status.commit = commit ? commit->number : 0;
    status.isAtEnd = !end || end->commitHash == base;
    status.unfinishedWork = noteOnUnfinished(database);
}

} // namespace

Status statusOf(common::RootPath const& root, bool withIgnored)
{
    auto const cache = readState(root);
    common::State const& state = cache->read();
    LocalDatabase const database = LocalDatabase::open(root);
    Tree const base = database.commits().files(database.base());
    common::RepoChanges changes = compare(root, base, state);
    Paths staged = stagedPaths(state);
    Paths left = pathsLeft(state);
    auto const workingPath = [](auto& file) -> OdString& { return file.working.path; };
    auto const committedPath = [](auto& file) -> OdString& { return file.committed.path; };

    Status status;
    enterPlace(database, state, status);
    for (auto const& [path, previous] : findRenames(changes, database, root)) {
        if (staged.insert(path).second && left.insert(previous).second) {
            status.renamed.emplace(path, previous);
        }
    }
    status.conflicts = conflictsOf(root);
    status.staged = stagedEntries(state, base, root);
    status.modified = takeSorted(changes.modified, staged, workingPath);
    status.untracked = takeSorted(changes.untracked, staged, workingPath);
    status.removed = takeSorted(changes.removed, left, committedPath);
    if (withIgnored) {
        status.ignored = ignoredFiles(root);
        sortScanned(status.ignored);
    }
    return status;
}

} // namespace tav
