#include "host/checkout/checkout.h"

#include "host/changes/changes.h"
#include "host/changes/index_record.h"
#include "host/changes/staging.h"
#include "host/repository/conflicts.h"
#include "host/repository/working_state.h"

#include <algorithm>
#include <iterator>
#include <set>
#include <utility>

namespace tav {

namespace {

/// The targets of moves whose files may be in the working folder beside those of the last commit.
std::vector<OdString> begunCheckouts(LocalDatabase const& database)
{
    PendingOperation const pending = readJournal(database);
    auto const* const move = std::get_if<PendingCheckout>(&pending);
    if (!move) {
        return {};
    }
    std::vector<OdString> targets = move->begun;
    if (std::find(targets.begin(), targets.end(), move->target) == targets.end()) {
        targets.push_back(move->target);
    }
    return targets;
}

std::vector<Tree> filesOf(std::vector<OdString> const& commits, LocalDatabase const& database)
{
    std::vector<Tree> files;
    for (OdString const& commit : commits) {
        files.push_back(database.commits().files(commit));
    }
    return files;
}

/// The files of the current commit that have another content in the working folder, or are gone.
struct Changed {
    Tree modified;
    Tree removed;
};

Changed changedFiles(common::RootPath const& root, LocalDatabase& database, std::uint64_t start)
{
    FolderMatch match = matchPaths({}, database.commits().fileList(database.currentCommit()));
    VerifiedFileList const known = database.verifiedFiles();
    Examination(match.committed, known, root).run();
    dropKnown(match);
    VerifiedFileList verified;
    FolderChanges const changes = compare(root, std::move(match), &verified);
    keepVerified(settledFiles(std::move(verified), start), database);
    Changed changed;
    for (auto const& file : changes.modified) {
        changed.modified.emplace(file.committed.path, file.committed.storagePath);
    }
    for (auto const& file : changes.removed) {
        changed.removed.emplace(file.committed.path, file.committed.storagePath);
    }
    return changed;
}

/// Adds to `update` the changed files that both commits have alike. What the update touches anyway stands first.
void addChanged(Changed const& changed, TreeUpdate& update)
{
    for (Tree const* const files : {&changed.modified, &changed.removed}) {
        for (auto const& file : *files) {
            if (update.removals.count(file.first) == 0) {
                update.writes.insert(file);
            }
        }
    }
}

/// How many changed files the move leaves alone, and nobody has staged.
std::size_t countKept(Changed const& changed, TreeUpdate const& update, std::set<OdString> const& staged)
{
    return static_cast<std::size_t>(
        std::count_if(changed.modified.begin(), changed.modified.end(), [&](auto const& file) {
            OdString const& path = file.first;
            return update.writes.count(path) == 0 && update.removals.count(path) == 0 && staged.count(path) == 0;
        }));
}

/// A file that is back at its first path has not been renamed.
void dropRenamesOf(IndexUpdates const& files, common::State& state)
{
    for (auto rename = state.renames.begin(); rename != state.renames.end();) {
        auto const file = files.find(rename->second);
        bool const isBack = file != files.end() && file->second;
        rename = isBack ? state.renames.erase(rename) : std::next(rename);
    }
}

/// `whole` is the update before the check: also a file that was found as it shall be is no change any more. What stays
/// of an interrupted move may be no file of the commit.
IndexUpdates settledBy(TreeUpdate const& whole, TreeUpdate const& update, Updated const& updated, std::uint64_t start)
{
    IndexUpdates files;
    for (auto const& [path, url] : whole.removals) {
        files.emplace(path, std::nullopt);
    }
    for (auto const& [path, url] : whole.writes) {
        auto const time = updated.times.find(path);
        if (time != updated.times.end()) {
            files[path] = common::IndexData{time->second, false};
        } else if (update.leftovers.count(path) == 0) {
            files[path] = indexRecord(static_cast<std::uint64_t>(update.marks.at(path).modified), start);
        } else {
            files[path] = std::nullopt;
        }
    }
    return files;
}

} // namespace

CheckedOut checkOutCommit(
    common::RootPath const& root, LocalDatabase& database, Destination const& destination, Discard discard,
    std::uint64_t start)
{
    requireNoConflicts(root);
    std::vector<OdString> const begun = begunCheckouts(database);
    TreeUpdate whole = updateBetween(
        database.commits().files(database.currentCommit()), filesOf(begun, database),
        database.commits().files(destination.commit));
    Changed const changed = changedFiles(root, database, start);
    if (discard == Discard::everything) {
        addChanged(changed, whole);
    }
    std::set<OdString> const staged = claimedPaths(readState(root)->read());
    std::size_t const kept = countKept(changed, whole, staged);
    TreeUpdate update = whole;
    LocalStorage storage(root);
    checkUpdate(root, database, storage, staged, discard, update);
    PendingCheckout move{destination.commit, destination.branch, false, begun};
    Updated const updated = carryOut(root, storage, update, start, [&] { writeJournal(move, database); });
    WriteTransaction transaction(database.database());
    database.setCurrentCommit(destination.commit);
    move.isWritten = true;
    move.files = settledBy(whole, update, updated, start);
    writeJournal(move, database);
    database.addVerified(updated.verified);
    transaction.commit();
    finishCheckout(root, database, move);
    return {update.writes.size(), update.removals.size(), kept};
}

void finishCheckout(common::RootPath const& root, LocalDatabase& database, PendingCheckout const& move)
{
    changeState(root, [&](common::Cache& cache) {
        cache.write().head = move.branch;
        applyIndexUpdates(move.files, cache.write());
        dropRenamesOf(move.files, cache.write());
    });
    clearJournal(database);
}

} // namespace tav
