#include "host/changes/changes.h"
#include "host/changes/last_commit.h"
#include "host/changes/staging.h"
#include "host/changes/stored_copies.h"
#include "host/checkout/file_moves.h"
#include "host/checkout/permissions.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/planned_update.h"
#include "host/cli/typed_command.h"
#include "host/errors/failure.h"
#include "host/history/tracked_path.h"
#include "host/repository/log_entry.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"

#include "platform/os/os_files.h"

#include <algorithm>
#include <filesystem>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace tav {

namespace {

namespace fs = std::filesystem;

[[noreturn]] void failForChanges(std::string const& name)
{
    throw Failure("'" + name + "' has changes that are in no commit.", "Commit them first.");
}

/// The committed files, and where the storage has what they hold.
struct CommittedFiles {
    Tree reachable; ///< in the working folder, unless they are gone already
    Tree others;    ///< behind links: they are not touched
    Tree unread;    ///< their folders cannot be read
    Tree changed;   ///< they hold what no commit has
};

CommittedFiles committedFiles(FolderChanges const& changes)
{
    CommittedFiles files;
    for (common::VersionedFile const& file : changes.unchanged) {
        files.reachable.emplace(file.path, file.storagePath);
    }
    for (auto const& file : changes.removed) {
        files.reachable.emplace(file.committed.path, file.committed.storagePath);
    }
    for (common::VersionedFile const& file : changes.unreachable) {
        files.others.emplace(file.path, file.storagePath);
    }
    for (common::VersionedFile const& file : changes.unread) {
        files.unread.emplace(file.path, file.storagePath);
    }
    for (auto const& file : changes.modified) {
        files.changed.emplace(file.committed.path, file.committed.storagePath);
    }
    return files;
}

NameFinder finderOf(CommittedFiles const& files, common::RootPath const& root)
{
    std::vector<common::StagedFile> all;
    for (Tree const* const tree : {&files.reachable, &files.others, &files.unread, &files.changed}) {
        for (auto const& [path, url] : *tree) {
            all.emplace_back(path, common::FileChange::removed);
        }
    }
    return {all, root};
}

/// The committed files that `name` means. Only content that a commit keeps may be removed.
std::vector<common::StagedFile> removableFiles(
    std::string const& name, common::RepoChanges const& changes, CommittedFiles const& files, NameFinder const& finder,
    common::RootPath const& root)
{
    OdString const typed = pathInRepository(root, name);
    if (typed == OdString(L".tav")) {
        throw Failure("'" + name + "' belongs to the repository itself.", "It cannot be removed.");
    }
    auto const isTyped = [&](auto const& file) { return file.working.path == typed; };
    if (std::any_of(changes.untracked.begin(), changes.untracked.end(), isTyped)) {
        throw Failure(
            "'" + name + "' is in no commit: removing it would lose it.",
            "Use 'tav unstage' if it is staged, and delete it yourself if you do not need it.");
    }
    std::vector<common::StagedFile> found = finder.find(name);
    if (found.empty()) {
        throw Failure("No committed file matches '" + name + "'.", "Run 'tav status' to see what there is.");
    }
    for (common::StagedFile const& file : found) { // A folder is removed only when no work in it would be lost.
        if (files.changed.count(file.path) > 0) {
            failForChanges(file.path.ansi_str());
        }
        if (files.unread.count(file.path) > 0) {
            throw Failure(
                "'" + file.path.ansi_str() + "' is in a folder that cannot be read.", "Check your permissions for it.");
        }
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

/// The paths come from a database that anybody may have made, and folders may have become links meanwhile.
void checkPath(OdString const& path, common::RootPath const& root)
{
    if (auto const fault = whyUnsafe(path)) {
        throw Failure(*fault, "Nothing has been removed.");
    }
    fs::path const folder = fs::path(path.ansi_str()).parent_path();
    auto const link = folder.empty() ? std::nullopt : linkOnTheWay(root.path().ansi_str(), fromUtf8(folder.string()));
    if (link) {
        throw Failure(*link, "Nothing has been removed; move that away first.");
    }
}

/// Files on their way out: they wait in the repository's own folder until the new state is safe. A command that was
/// killed may have left some.
class Departures {
public:
    explicit Departures(common::RootPath const& root)
        : root_(root)
        , top_(root.path().ansi_str())
        , storage_(root)
        , moves_(top_)
    {
    }

    /// Takes a file away; false when it is gone. Throws `Failure` when it does not hold the content at `url`, and when
    /// it is the last copy of that. It is compared where it waits: nobody writes to it there, and all files go back to
    /// their places after a failure.
    bool take(OdString const& path, OdString const& url)
    {
        if (!ut::FileName::fileExists(root_.pathTo(path))) {
            return false;
        }
        checkPath(path, root_);
        requireStored(storage_, path, url);
        waiting_.push_back(freeName());
        std::string const& place = waiting_.back();
        moves_.move(path.ansi_str(), place);
        bool const isLink = fs::is_symlink(fs::symlink_status(fullPath(place))); // What it leads to stays.
        if (!isLink && hasOtherContent(fromUtf8(place), url, root_)) {
            failForChanges(path.ansi_str());
        }
        return true;
    }

    void finish()
    {
        moves_.keep();
        for (std::string const& name : waiting_) {
            if (std::error_code const error = os::removeFile(fullPath(name))) {
                printError("'" + fullPath(name) + "' is left over: " + error.message() + ".", "Delete it yourself.");
            }
        }
    }

private:
    std::string fullPath(std::string const& name) const { return std::string(top_).append("/").append(name); }

    std::string freeName() const
    {
        std::size_t number = waiting_.size();
        auto const name = [&] { return ".tav/removed-" + std::to_string(number); };
        while (fs::exists(fs::symlink_status(fullPath(name())))) {
            ++number;
        }
        return name();
    }

    common::RootPath const& root_;
    std::string const top_;
    LocalStorage storage_;
    FileMoves moves_;
    std::vector<std::string> waiting_;
};

std::vector<common::StagedFile> chosenFiles(
    std::vector<std::string> const& names, FolderChanges const& changes, CommittedFiles const& files,
    common::State const& state, common::RootPath const& root)
{
    NameFinder const finder = finderOf(files, root);
    std::vector<common::StagedFile> chosen;
    for (std::string const& name : names) {
        failIfRenamed(name, state, root);
        std::vector<common::StagedFile> const found = removableFiles(name, changes, files, finder, root);
        chosen.insert(chosen.end(), found.begin(), found.end());
    }
    return chosen;
}

/// The chosen files that are there.
std::vector<FileContents>
filesToGo(std::vector<common::StagedFile> const& chosen, Tree const& reachable, common::RootPath const& root)
{
    std::vector<FileContents> files;
    for (common::StagedFile const& file : chosen) {
        auto const version = reachable.find(file.path);
        if (version != reachable.end() && ut::FileName::fileExists(root.pathTo(file.path))) {
            files.push_back(
                {file.path, version->second, OdString(), ownPermissions(root.pathTo(file.path).ansi_str())});
        }
    }
    return files;
}

struct Removal {
    std::vector<common::StagedFile> chosen;
    std::vector<FileContents> files; ///< those of them that are in the folder
};

Removal planRemoval(
    std::vector<std::string> const& names, common::State const& state, LocalDatabase const& database,
    common::RootPath const& root)
{
    FolderChanges const changes = compare(root, matchFolder(root, lastCommitFiles(root), database.verifiedFiles()));
    CommittedFiles const files = committedFiles(changes);
    std::vector<common::StagedFile> chosen = chosenFiles(names, changes, files, state, root);
    std::vector<FileContents> toGo = filesToGo(chosen, files.reachable, root);
    return {std::move(chosen), std::move(toGo)};
}

void preview(std::vector<std::string> const& names)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    notePending(root, database);
    TreeUpdate update;
    for (FileContents const& file : planRemoval(names, readState(root)->read(), database, root).files) {
        checkPath(file.path, root);
        update.removals.emplace(file.path, file.before);
    }
    printPlan(update, {});
}

} // namespace

void removeFiles(RmOptions const& options)
{
    if (options.dryRun) {
        preview(options.names);
        return;
    }
    WriteSession session(openRepository(""), "rm", Recovery::attempted);
    common::RootPath const& root = session.root();
    std::optional<LogEntry> entry; // Goes last: after a failure the files are back by then.
    Departures departures(root);
    std::size_t count = 0;
    changeState(root, [&](common::Cache& cache) {
        entry.emplace(session.database(), typedCommand("rm", options.names), cache.read());
        Removal removal = planRemoval(options.names, cache.read(), session.database(), root);
        std::set<OdString> const renamed = formerPaths(cache.read());
        count = stage(without(renamed, std::move(removal.chosen)), cache.write());
        entry->operation().files = std::move(removal.files);
        entry->write(cache.read());
        for (FileContents const& file : entry->operation().files) {
            bool const isTaken = departures.take(file.path, file.before);
            count += isTaken ? renamed.count(file.path) : 0; // Those are not staged above.
        }
    });
    entry->keep();
    departures.finish();
    report(
        count == 0 ? "Nothing new to remove: the next commit takes that already.\n"
                   : "Removed " + counted(count, "file") + "; the next commit takes that.\n");
}

} // namespace tav
