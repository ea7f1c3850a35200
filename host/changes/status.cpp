#include "host/changes/status.h"

#include "host/changes/changes.h"
#include "host/changes/missing_files.h"
#include "host/changes/scan_order.h"
#include "host/changes/staging.h"
#include "host/repository/conflicts.h"
#include "host/repository/journal.h"
#include "host/repository/local_database.h"
#include "host/repository/working_state.h"

#include <algorithm>
#include <functional>
#include <future>
#include <memory>
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
    FolderView view(root);
    for (common::StagedFile const& file : state.stagedFiles) {
        bool const isMissing = file.change != common::FileChange::removed &&
                               !ut::FileName::fileExists(root.pathTo(file.path)) &&
                               !isUnread(view.look(file.path).presence, file.path, match.unreadable);
        entries.push_back({file.path, file.change, previousPath(file.path, state, match), isMissing});
    }
    auto const byPath = [](StagedEntry const& a, StagedEntry const& b) { return a.path < b.path; };
    std::stable_sort(entries.begin(), entries.end(), byPath);
    return entries;
}

/// What the database knows.
struct History {
    OdString base; ///< hash of the commit that the working folder is at
    std::int64_t number = 0;
    FileList files; ///< of that commit
    VerifiedFileList known;
    std::vector<common::Reference> references;
};

History readHistory(LocalDatabase& database)
{
    ReadTransaction const transaction(database.database());
    CommitTables const& commits = database.commits();
    OdString const base = database.currentCommit();
    auto const commit = commits.find(base);
    return {base, commit ? commit->number : 0, commits.fileList(base), database.verifiedFiles(), commits.references()};
}

struct Findings {
    History history;
    FolderMatch match;
    std::shared_ptr<common::Cache const> cache;
};

/// Looking for the files takes as long as reading what the database knows of them, and looking at them longer than
/// reading the state; so each goes on beside the other.
Findings lookOnce(common::RootPath const& root, LocalDatabase& database)
{
    Findings found;
    auto scanning = std::async([&] { return scan(root); });
    found.history = readHistory(database);
    found.match = matchPaths(scanning.get(), std::move(found.history.files));
    Examination examination(found.match.committed, found.history.known, root);
    auto looking = std::async([&] { examination.run(); });
    found.cache = readState(root);
    examination.run();
    looking.get();
    return found;
}

/// A commit may come to its end between reading the database and reading the state, which speak of different commits
/// then: each file that it took would seem to be as committed.
Findings lookAround(common::RootPath const& root, LocalDatabase& database)
{
    Findings found = lookOnce(root, database);
    while (database.currentCommit() != found.history.base) {
        found = lookOnce(root, database);
    }
    return found;
}

void enterPlace(History const& history, common::State const& state, Status& status)
{
    auto const isHead = [&](common::Reference const& reference) { return reference.name == state.head; };
    auto const end = std::find_if(history.references.begin(), history.references.end(), isHead);
    status.branch = state.head;
    status.commit = history.number;
    status.isAtEnd = end == history.references.end() || end->commitHash == history.base;
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

/// The commit asks for the user's word when too much is missing, files with copies included.
void enterDoubts(Renames const& renames, Paths const& moved, common::RootPath const& root, Status& status)
{
    std::vector<OdString> missing = status.removed;
    for (auto const& [path, previous] : renames) {
        if (moved.count(previous) == 0) {
            missing.push_back(previous);
        }
    }
    status.isRemovalDoubtful = mayBeMistake(missing, root);
    status.isRenameDoubtful = status.isRemovalDoubtful && missing.size() > status.removed.size();
}

} // namespace

Status statusOf(common::RootPath const& root, bool withIgnored)
{
    Status status;
    LocalDatabase database = LocalDatabase::open(root);
    auto [history, match, cache] = lookAround(root, database);
    common::State const& state = cache->read();
    enterPlace(history, state, status);
    status.unfinishedWork = pendingNotice(root, database);
    status.conflicts = openConflicts(root);
    status.staged = stagedEntries(state, match, root);
    dropKnown(match);
    FolderChanges changes = compare(root, std::move(match));
    Paths left = claimedPaths(state); // They are accounted for when they are missing.
    Renames const renames = findRenames(changes, state, database, root);
    enterRenames(renames, left, status);
    Paths named = stagedPaths(state);
    for (auto const& [path, previous] : status.renamed) {
        named.insert(path);
    }
    auto const workingPath = [](auto& file) -> OdString& { return file.working.path; };
    auto const committedPath = [](auto& file) -> OdString& { return file.committed.path; };
    status.modified = takeSorted(changes.modified, named, workingPath);
    status.untracked = takeSorted(changes.untracked, named, workingPath);
    status.removed = takeSorted(changes.removed, left, committedPath);
    enterDoubts(renames, formerPathsOfMoves(renames, database, root), root, status);
    auto const pathOf = [](auto& file) -> OdString& { return file.path; };
    status.unreachable = takeSorted(changes.unreachable, left, pathOf);
    status.unreadable.assign(changes.unreadable.begin(), changes.unreadable.end());
    if (withIgnored) {
        status.ignored = ignoredFiles(root);
        sortScanned(status.ignored, std::less<>());
    }
    return status;
}

} // namespace tav
