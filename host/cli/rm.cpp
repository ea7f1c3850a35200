#include "host/changes/changes.h"
#include "host/changes/last_commit.h"
#include "host/changes/staging.h"
#include "host/changes/stored_copies.h"
#include "host/checkout/file_moves.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/paths/recorded_path.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/work.h"
#include "host/repository/working_state.h"
#include "host/text/wide.h"

#include "platform/os/os_files.h"

#include <algorithm>
#include <filesystem>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace tav {

namespace {

template <class List, class PathOf>
bool holds(List const& list, OdString const& path, PathOf const& pathOf)
{
    return std::any_of(list.begin(), list.end(), [&](auto const& item) { return pathOf(item) == path; });
}

[[noreturn]] void failForChanges(std::string const& name)
{
    throw Failure("'" + name + "' has changes that are in no commit.", "Commit them first.");
}

/// A folder is removed only when no work in it would be lost.
void failForChangesIn(OdString const& folder, common::RepoChanges const& changes)
{
    OdString const prefix = folder + L"/";
    for (auto const& file : changes.modified) {
        if (file.working.path.left(prefix.getLength()) == prefix) {
            failForChanges(file.working.path.ansi_str());
        }
    }
}

/// The committed files that `name` means. Only content that a commit keeps may be removed.
std::vector<common::StagedFile> removableFiles(
    std::string const& name, common::RepoChanges const& changes, NameFinder const& committed,
    common::RootPath const& root)
{
    OdString const typed = pathInRepository(root, name);
    auto const workingPath = [](auto const& file) { return file.working.path; };
    if (holds(changes.untracked, typed, workingPath)) {
        throw Failure(
            "'" + name + "' is in no commit: removing it would lose it.",
            "Use 'tav unstage' if it is staged, and delete it yourself if you do not need it.");
    }
    if (holds(changes.modified, typed, workingPath)) {
        failForChanges(name);
    }
    failForChangesIn(typed, changes);
    std::vector<common::StagedFile> found = committed.find(name);
    if (found.empty()) {
        throw Failure("No committed file matches '" + name + "'.", "Run 'tav status' to see what there is.");
    }
    return found;
}

/// A file that has been renamed is gone already, and the commit says so.
void failIfRenamed(std::string const& name, common::State const& state, common::RootPath const& root)
{
    OdString const typed = pathInRepository(root, name);
    auto const isIt = [&](auto const& rename) { return rename.second == typed; };
    auto const rename = std::find_if(state.renames.begin(), state.renames.end(), isIt);
    if (rename != state.renames.end() && !ut::FileName::fileExists(root.pathTo(typed))) {
        throw Failure(
            "'" + name + "' has been renamed to '" + rename->first.ansi_str() + "'.", "The next commit takes that.");
    }
}

/// The removal of a renamed file is staged with its rename.
std::vector<common::StagedFile> without(std::set<OdString> const& renamed, std::vector<common::StagedFile> files)
{
    auto const isRenamed = [&](common::StagedFile const& file) { return renamed.count(file.path) > 0; };
    files.erase(std::remove_if(files.begin(), files.end(), isRenamed), files.end());
    return files;
}

NameFinder finderOfCommitted(common::RepoChanges const& changes, common::RootPath const& root)
{
    std::vector<common::StagedFile> files;
    for (common::VersionedFile const& file : changes.unchanged) {
        files.emplace_back(file.path, common::FileChange::removed);
    }
    for (auto const& file : changes.removed) {
        files.emplace_back(file.committed.path, common::FileChange::removed);
    }
    return {files, root};
}

/// The paths come from a database that anybody may have made, and folders may have become links meanwhile.
void checkPath(OdString const& path, common::RootPath const& root)
{
    if (auto const fault = whyUnsafe(path)) {
        throw Failure(*fault, "Nothing has been removed.");
    }
    std::filesystem::path const folder = std::filesystem::path(path.ansi_str()).parent_path();
    auto const link = folder.empty() ? std::nullopt : linkOnTheWay(root.path().ansi_str(), wide(folder.string()));
    if (link) {
        throw Failure(*link, "Nothing has been removed; move that away first.");
    }
}

/// The file may be the last good copy of what it was committed with. `unchanged` is in the order of paths.
void keepContent(
    OdString const& path, std::vector<common::VersionedFile> const& unchanged, common::RootPath const& root)
{
    auto const isBefore = [](common::VersionedFile const& file, OdString const& other) { return file.path < other; };
    auto const file = std::lower_bound(unchanged.begin(), unchanged.end(), path, isBefore);
    if (file != unchanged.end() && file->path == path) {
        LocalStorage storage;
        requireStored(root, storage, path, file->storagePath);
    }
}

/// Where a removed file waits until the new state is safe. A command that was killed may have left such files.
std::string waitingName(common::RootPath const& root, std::size_t number)
{
    std::string const prefix = ".tav/removed-";
    std::string const top = root.path().ansi_str() + "/";
    while (std::filesystem::exists(std::filesystem::symlink_status(top + prefix + std::to_string(number)))) {
        ++number;
    }
    return prefix + std::to_string(number);
}

} // namespace

void removeFiles(std::vector<std::string> const& names)
{
    Work const work(openRepository(""), "rm", Work::Unfinished::mayStay);
    common::RootPath const& root = work.root();
    std::string const top = root.path().ansi_str();
    FileMoves moves(top);
    std::vector<std::string> waiting;
    std::size_t count = 0;
    changeState(root, [&](common::Cache& cache) {
        common::RepoChanges const changes = compare(root, matchFolder(root, lastCommitFiles(root)), cache.read());
        std::set<OdString> const renamed = formerPaths(cache.read());
        NameFinder const committed = finderOfCommitted(changes, root);
        std::vector<common::StagedFile> staged;
        for (std::string const& name : names) {
            failIfRenamed(name, cache.read(), root);
            std::vector<common::StagedFile> const found = removableFiles(name, changes, committed, root);
            staged.insert(staged.end(), found.begin(), found.end());
        }
        for (common::StagedFile const& file : staged) {
            if (ut::FileName::fileExists(root.pathTo(file.path))) {
                checkPath(file.path, root);
                keepContent(file.path, changes.unchanged, root);
                waiting.push_back(waitingName(root, waiting.size()));
                moves.move(file.path.ansi_str(), waiting.back());
                count += renamed.count(file.path); // Those are not staged below.
            }
        }
        count += stage(without(renamed, staged), cache.write());
    });
    moves.keep();
    for (std::string const& name : waiting) {
        std::string const file = std::string(top).append("/").append(name);
        if (std::error_code const error = os::removeFile(file)) {
            printError("'" + file + "' is left over: " + error.message() + ".", "Delete it yourself.");
        }
    }
    print("Removed " + counted(count, "file") + "; the next commit takes that.\n");
}

} // namespace tav
