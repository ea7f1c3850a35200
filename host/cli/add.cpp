#include "host/changes/changes.h"
#include "host/changes/index_record.h"
#include "host/changes/last_commit.h"
#include "host/changes/staging.h"
#include "host/changes/stored_copies.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/cli/typed_command.h"
#include "host/cli/unreadable_folders.h"
#include "host/errors/failure.h"
#include "host/repository/log_entry.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"

#include <algorithm>
#include <optional>
#include <string>
#include <vector>

namespace tav {

namespace {

/// The committed file that `name` means, and that is as it was committed; null when there is none.
common::VersionedFile const*
unchangedFile(std::string const& name, common::RepoChanges const& changes, common::RootPath const& root)
{
    OdString const path = pathInRepository(root, name);
    auto const find = [&](OdString const& wanted) {
        auto const isIt = [&](common::VersionedFile const& file) { return file.path == wanted; };
        return std::find_if(changes.unchanged.begin(), changes.unchanged.end(), isIt);
    };
    auto file = find(path);
    if (file == changes.unchanged.end()) {
        file = find(findUnchanged(name, changes, root));
    }
    return file == changes.unchanged.end() ? nullptr : &*file;
}

/// Whether `name` is a folder in which all is as it was committed. The working folder is one even when it is empty.
bool isUnchangedFolder(std::string const& name, common::RepoChanges const& changes, common::RootPath const& root)
{
    OdString const folder = pathInRepository(root, name);
    OdString const prefix = folder + L"/";
    auto const isInside = [&](common::VersionedFile const& file) {
        return file.path.left(prefix.getLength()) == prefix;
    };
    return folder.isEmpty() || std::any_of(changes.unchanged.begin(), changes.unchanged.end(), isInside);
}

/// Whether `path` is a link to a folder that the last commit has, or lies behind a link.
bool isBehindLink(OdString const& path, FolderChanges const& changes, common::RootPath const& root)
{
    OdString const prefix = path + L"/";
    auto const isInside = [&](common::VersionedFile const& file) {
        return file.path.left(prefix.getLength()) == prefix;
    };
    return FolderView(root).look(path).presence == Presence::isBehindLink ||
           std::any_of(changes.unreachable.begin(), changes.unreachable.end(), isInside);
}

[[noreturn]] void failForUnknown(std::string const& name, FolderChanges const& changes, common::RootPath const& root)
{
    OdString const path = pathInRepository(root, name);
    if (isBehindLink(path, changes, root)) {
        throw Failure(
            "'" + name + "' is behind a link to a folder, which tav does not enter.",
            "Replace the link with the folder itself.");
    }
    if (isBelow(changes.unreadable, path + L"/")) {
        throw Failure("'" + name + "' is a folder that cannot be read, or in one.", "Check your permissions for it.");
    }
    for (auto const& file : changes.removed) {
        if (file.committed.path == path) {
            throw Failure("'" + name + "' has been removed.", "The next commit includes that without staging.");
        }
    }
    throw Failure("No changed file matches '" + name + "'.", "Run 'tav status --ignored' to see what there is.");
}

/// What the names of a command mean.
struct Chosen {
    std::vector<common::StagedFile> files;
    std::vector<common::VersionedFile> unchanged; ///< files that were named, and are as they were committed
};

Chosen chosenFiles(AddOptions const& options, FolderChanges const& changes, common::RootPath const& root)
{
    NameFinder const finder(changes, root);
    if (options.all) {
        return {finder.all(), {}};
    }
    Chosen chosen;
    for (std::string const& name : options.names) {
        std::vector<common::StagedFile> const found = finder.find(name);
        chosen.files.insert(chosen.files.end(), found.begin(), found.end());
        if (!found.empty() || isUnchangedFolder(name, changes, root)) {
            continue;
        }
        common::VersionedFile const* const unchanged = unchangedFile(name, changes, root);
        if (!unchanged) {
            failForUnknown(name, changes, root);
        }
        chosen.unchanged.push_back(*unchanged);
    }
    return chosen;
}

/// Adding a file means to keep what it has: what is as it was committed may be damaged in the storage.
std::size_t repair(std::vector<common::VersionedFile> const& files, common::RootPath const& root)
{
    LocalStorage storage(root);
    std::size_t count = 0;
    for (common::VersionedFile const& file : files) {
        count += requireStored(storage, file.path, file.storagePath) ? 1 : 0;
    }
    return count;
}

} // namespace

void addFilesToStage(AddOptions const& options)
{
    WriteSession session(openRepository(""), "add", Recovery::attempted);
    common::RootPath const& root = session.root();
    VerifiedFileList verified;
    FolderChanges const changes =
        compare(root, matchFolder(root, lastCommitFiles(root), session.database().verifiedFiles()), &verified);
    keepVerified(settledFiles(verified, session.start()), session.database());
    std::size_t count = 0;
    std::size_t repaired = 0;
    std::optional<LogEntry> entry;
    changeState(root, [&](common::Cache& cache) {
        entry.emplace(session.database(), typedCommand("add", options.names, options.all), cache.read());
        enterVerified(verified, session.start(), cache.write());
        Chosen const chosen = chosenFiles(options, changes, root);
        repaired = repair(chosen.unchanged, root);
        count = stage(chosen.files, cache.write());
        entry->write(cache.read());
    });
    entry->keep();
    if (options.all) {
        noteUnreadable(
            "Nothing has been staged of these folders, which cannot be read. Check your permissions for them:",
            changes.unreadable);
    }
    if (repaired > 0) {
        report("Repaired " + counted(repaired, "stored version") + ".\n");
    }
    report(count == 0 ? "Nothing new to stage.\n" : "Staged " + counted(count, "file") + ".\n");
}

} // namespace tav
