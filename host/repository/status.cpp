#include "host/repository/status.h"

#include "host/repository/changes.h"
#include "host/repository/local_database.h"
#include "host/repository/scan_order.h"
#include "host/repository/work.h"
#include "host/repository/working_state.h"

#include "common/mu_common_file_utils.h"

#include <algorithm>
#include <functional>
#include <future>
#include <set>
#include <utility>

namespace tav {

namespace {

using Paths = std::set<OdString>;

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
    sortScanned(paths, std::less<>());
    return paths;
}

/// The path that a file to be staged had in the last commit; empty when it had none.
OdString previousPath(OdString const& path, common::State const& state, FolderMatch const& match)
{
    auto const rename = state.renames.find(path);
    if (rename == state.renames.end()) {
        return {};
    }
    auto const isBefore = [](CommittedFile const& file, OdString const& other) { return file.path < other; };
    auto const file = std::lower_bound(match.committed.begin(), match.committed.end(), rename->second, isBefore);
    return file != match.committed.end() && file->path == rename->second ? file->path : OdString();
}

std::vector<StagedEntry>
stagedEntries(common::State const& state, FolderMatch const& match, common::RootPath const& root)
{
    std::vector<StagedEntry> entries;
    for (common::StagedFile const& file : state.stagedFiles) {
        bool const isMissing =
            file.change != common::FileChange::removed && !ut::FileName::fileExists(root.pathTo(file.path));
        entries.push_back({file.path, file.change, previousPath(file.path, state, match), isMissing});
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

void enterPlace(LocalDatabase const& database, OdString const& base, common::State const& state, Status& status)
{
    auto const commit = database.commits().find(base);
    auto const end = database.commits().reference(state.head);
    status.branch = state.head;
    status.commit = commit ? commit->number : 0;
    status.isAtEnd = !end || end->commitHash == base;
    status.unfinishedWork = noteOnUnfinished(database);
}

/// A staged file that turns out to be renamed is shown so; other renamed files are a group of their own.
void enterRenames(Renames const& renames, Paths& left, Status& status)
{
    for (auto const& [path, previous] : renames) {
        left.insert(previous);
        auto const isIt = [&path = path](StagedEntry const& entry) { return entry.path == path; };
        auto const staged = std::find_if(status.staged.begin(), status.staged.end(), isIt);
        if (staged == status.staged.end()) {
            status.renamed.emplace(path, previous);
        } else {
            staged->previousPath = previous;
        }
    }
}

/// Enters where the working folder stands, and gives the files of that commit.
Tree readHistory(LocalDatabase& database, common::State const& state, Status& status)
{
    Snapshot const snapshot(database.database());
    OdString const base = database.base();
    enterPlace(database, base, state, status);
    return database.commits().files(base);
}

} // namespace

Status statusOf(common::RootPath const& root, bool withIgnored)
{
    // Looking for the files takes as long as reading what is known of them.
    auto scanning = std::async([&] { return scan(root); });
    auto const cache = readState(root);
    common::State const& state = cache->read();
    LocalDatabase database = LocalDatabase::open(root);
    Status status;
    Tree committed = readHistory(database, state, status);
    FolderMatch match = matchFolder(root, scanning.get(), std::move(committed));
    status.conflicts = conflictsOf(root);
    status.staged = stagedEntries(state, match, root);
    common::RepoChanges changes = compare(root, std::move(match), state);
    Paths left = pathsLeft(state);
    enterRenames(findRenames(changes, state, database, root), left, status);
    Paths named = stagedPaths(state);
    for (auto const& [path, previous] : status.renamed) {
        named.insert(path);
    }
    auto const workingPath = [](auto& file) -> OdString& { return file.working.path; };
    auto const committedPath = [](auto& file) -> OdString& { return file.committed.path; };
    status.modified = takeSorted(changes.modified, named, workingPath);
    status.untracked = takeSorted(changes.untracked, named, workingPath);
    status.removed = takeSorted(changes.removed, left, committedPath);
    if (withIgnored) {
        status.ignored = ignoredFiles(root);
        sortScanned(status.ignored, std::less<>());
    }
    return status;
}

} // namespace tav
