#include "host/checkout/shelving.h"

#include "host/changes/changes.h"
#include "host/changes/last_commit.h"
#include "host/changes/staging.h"
#include "host/checkout/permissions.h"
#include "host/checkout/present_contents.h"
#include "host/errors/failure.h"
#include "host/repository/conflicts.h"
#include "host/repository/log_entry.h"
#include "host/repository/working_state.h"

#include <algorithm>
#include <iterator>
#include <map>
#include <string>

namespace tav {

namespace {

constexpr char const* kNothingYet = "Nothing has changed; correct that and run the command again.";

/// Brings the contents into the storage, for good.
std::vector<ShelvedFile>
storeAll(common::RootPath const& root, LocalDatabase const& database, std::vector<UnfinishedFile> const& files)
{
    std::map<OdString, OdString> bases;
    for (UnfinishedFile const& file : files) {
        bases.emplace(file.path, file.base);
    }
    LocalStorage storage(
        root, {[&](OdString const& path) { return bases[path]; },
               [&](Digest const& digest) { return database.urlOf(digest); },
               {}});
    std::vector<ShelvedFile> stored;
    for (UnfinishedFile const& file : files) {
        ShelvedFile shelved{file.path, file.base, OdString()};
        if (file.isThere) {
            shelved.content = valueOrFail(storage.store(file.path), kNothingYet);
            shelved.permissions = ownPermissions(root.pathTo(file.path).ansi_str());
        }
        stored.push_back(std::move(shelved));
    }
    valueOrFail(storage.flush(), kNothingYet);
    for (ShelvedFile const& file : stored) {
        if (!file.content.isEmpty()) {
            valueOrFail(storage.verify(file.content), "Nothing has changed; the disk may be failing.");
        }
    }
    return stored;
}

/// Takes what is staged at `paths` out of `state`, and returns it.
common::State takeStaged(std::set<OdString> const& paths, common::State& state)
{
    common::State taken;
    auto const isTaken = [&](common::StagedFile const& file) { return paths.count(file.path) > 0; };
    auto& staged = state.stagedFiles;
    std::copy_if(staged.begin(), staged.end(), std::back_inserter(taken.stagedFiles), isTaken);
    staged.erase(std::remove_if(staged.begin(), staged.end(), isTaken), staged.end());
    for (auto rename = state.renames.begin(); rename != state.renames.end();) {
        bool const isOurs = paths.count(rename->first) > 0;
        if (isOurs) {
            taken.renames.insert(*rename);
        }
        rename = isOurs ? state.renames.erase(rename) : std::next(rename);
    }
    for (OdString const& path : paths) {
        state.index.erase(path);
    }
    return taken;
}

/// Two shelved files go back to what they were at the commit, or forward to what they were when they were put aside.
TreeUpdate updateTo(Side to, std::vector<ShelvedFile> const& files)
{
    TreeUpdate update;
    for (ShelvedFile const& file : files) {
        OdString const& wanted = to == Side::before ? file.base : file.content;
        OdString const& present = to == Side::before ? file.content : file.base;
        (wanted.isEmpty() ? update.removals : update.writes).emplace(file.path, wanted.isEmpty() ? present : wanted);
        if (!present.isEmpty()) {
            update.expected.emplace(file.path, present);
        }
        if (to == Side::after && file.permissions != 0) {
            update.permissions.emplace(file.path, file.permissions);
        }
    }
    return update;
}

/// What the update does to the files, for the log.
std::vector<FileContents> replacedFiles(TreeUpdate const& update, common::RootPath const& root)
{
    std::vector<FileContents> files;
    for (Tree const* const tree : {&update.writes, &update.removals}) {
        for (auto const& [path, url] : *tree) {
            auto const present = update.expected.find(path);
            bool const isThere = present != update.expected.end() && update.marks.at(path).isThere;
            files.push_back(
                {path, isThere ? present->second : OdString(), tree == &update.writes ? url : OdString(),
                 isThere ? ownPermissions(root.pathTo(path).ansi_str()) : 0});
        }
    }
    return files;
}

/// What was staged then, in the words of the current commit: it may have other files.
common::State stagingNow(Shelf const& shelf, Tree const& current)
{
    common::State staging;
    for (common::StagedFile file : shelf.staging.stagedFiles) {
        bool const isCommitted = current.count(file.path) > 0;
        if (file.change != common::FileChange::removed) {
            file.change = isCommitted ? common::FileChange::modified : common::FileChange::added;
        } else if (!isCommitted) {
            continue;
        }
        staging.stagedFiles.push_back(std::move(file));
    }
    for (auto const& rename : shelf.staging.renames) {
        if (current.count(rename.second) > 0) {
            staging.renames.insert(rename);
        }
    }
    return staging;
}

void stageAll(common::State const& staging, std::vector<ShelvedFile> const& files, common::State& state)
{
    std::set<OdString> const staged = stagedPaths(state);
    for (common::StagedFile const& file : staging.stagedFiles) {
        if (staged.count(file.path) == 0) {
            state.stagedFiles.push_back(file);
        }
    }
    state.renames.insert(staging.renames.begin(), staging.renames.end());
    for (ShelvedFile const& file : files) {
        state.index.erase(file.path);
    }
}

/// Paths at which something else is staged by now.
std::set<OdString>
stagedOtherwise(common::State const& staging, std::vector<ShelvedFile> const& files, common::State const& state)
{
    std::set<OdString> ours = claimedPaths(staging);
    for (ShelvedFile const& file : files) {
        ours.insert(file.path);
    }
    std::set<OdString> found;
    for (common::StagedFile const& file : state.stagedFiles) {
        auto const& own = staging.stagedFiles;
        if (ours.count(file.path) > 0 && std::find(own.begin(), own.end(), file) == own.end()) {
            found.insert(file.path);
        }
    }
    for (auto const& [path, previous] : state.renames) {
        auto const own = staging.renames.find(path);
        bool const isSame = own != staging.renames.end() && own->second == previous;
        if ((ours.count(path) > 0 || ours.count(previous) > 0) && !isSame) {
            found.insert(path);
        }
    }
    return found;
}

void failForAny(std::set<OdString> const& paths)
{
    if (paths.empty()) {
        return;
    }
    Failure failure(
        "These files have other changes by now than what was put aside.",
        "Nothing has changed; commit these changes or put them aside too, and run the command again:");
    for (OdString const& path : paths) {
        failure.details.push_back(path.ansi_str());
    }
    throw failure;
}

} // namespace

std::vector<UnfinishedFile> unfinishedFiles(common::RootPath const& root, LocalDatabase& database)
{
    FolderChanges const changes = compare(root, matchFolder(root, lastCommitFiles(root), database.verifiedFiles()));
    std::vector<UnfinishedFile> files;
    for (auto const& file : changes.modified) {
        files.push_back({file.committed.path, file.committed.storagePath, true});
    }
    for (auto const& file : changes.untracked) {
        files.push_back({file.working.path, OdString(), true});
    }
    for (auto const& file : changes.removed) {
        files.push_back({file.committed.path, file.committed.storagePath, false});
    }
    std::sort(files.begin(), files.end(), [](auto const& a, auto const& b) { return a.path < b.path; });
    return files;
}

Shelf putAside(
    common::RootPath const& root, LocalDatabase& database, std::vector<UnfinishedFile> const& files,
    std::set<OdString> const& staged, ShelvingOrder const& order)
{
    requireNoConflicts(root);
    common::State after = readState(root)->read();
    LogEntry entry(database, order.command, after);
    std::set<OdString> paths = staged;
    for (UnfinishedFile const& file : files) {
        paths.insert(file.path);
    }
    Shelf shelf;
    shelf.message = order.message;
    shelf.commit = database.currentCommit();
    shelf.branch = after.head;
    shelf.files = storeAll(root, database, files);
    shelf.fileCount = shelf.files.size();
    shelf.staging = takeStaged(paths, after);
    TreeUpdate update = updateTo(Side::before, shelf.files);
    LocalStorage storage(root);
    checkUpdate(root, database, storage, {}, Discard::nothing, update);
    entry.operation().files = replacedFiles(update, root);
    Updated const updated = carryOut(root, storage, update, order.start, [&] {
        entry.write(after, [&](std::int64_t id) { shelf.id = database.shelves().add(shelf, id); });
        entry.keep(); // What is written from here on stays.
    });
    changeState(root, [&](common::Cache& cache) { takeStaged(paths, cache.write()); });
    keepVerified(updated.verified, database);
    return shelf;
}

BroughtBack bringBack(
    common::RootPath const& root, LocalDatabase& database, Shelf const& shelf, Shelved afterwards,
    ShelvingOrder const& order)
{
    requireNoConflicts(root);
    common::State after = readState(root)->read();
    common::State const staging = stagingNow(shelf, database.commits().files(database.currentCommit()));
    TreeUpdate update = updateTo(Side::after, shelf.files);
    std::set<OdString> inTheWay = pathsInTheWay(root, update);
    inTheWay.merge(stagedOtherwise(staging, shelf.files, after));
    failForAny(inTheWay);
    LocalStorage storage(root);
    checkUpdate(root, database, storage, {}, Discard::nothing, update);
    LogEntry entry(database, order.command, after);
    stageAll(staging, shelf.files, after);
    entry.operation().files = replacedFiles(update, root);
    std::int64_t operation = 0;
    Updated const updated = carryOut(
        root, storage, update, order.start, [&] { entry.write(after, [&](std::int64_t id) { operation = id; }); },
        [&] { entry.keep(); });
    changeState(root, [&](common::Cache& cache) { stageAll(staging, shelf.files, cache.write()); });
    WriteTransaction transaction(database.database());
    if (afterwards == Shelved::goes) {
        database.shelves().take(shelf.id, operation);
    }
    database.addVerified(updated.verified);
    transaction.commit();
    return {update.writes.size(), update.removals.size()};
}

void drop(common::RootPath const& root, LocalDatabase& database, Shelf const& shelf, OdString const& command)
{
    auto const cache = readState(root);
    LogEntry entry(database, command, cache->read());
    entry.write(cache->read(), [&](std::int64_t id) { database.shelves().take(shelf.id, id); });
    entry.keep();
}

} // namespace tav
