#include "host/checkout/checkout.h"

#include "host/changes/index_record.h"
#include "host/changes/staging.h"
#include "host/repository/conflicts.h"
#include "host/repository/working_state.h"

#include <algorithm>

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
    TreeUpdate const whole = updateBetween(
        database.commits().files(database.currentCommit()), filesOf(begun, database),
        database.commits().files(destination.commit));
    TreeUpdate update = whole;
    LocalStorage storage(root);
    checkUpdate(root, database, storage, claimedPaths(readState(root)->read()), discard, update);
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
    return {update.writes.size(), update.removals.size()};
}

void finishCheckout(common::RootPath const& root, LocalDatabase& database, PendingCheckout const& move)
{
    changeState(root, [&](common::Cache& cache) {
        cache.write().head = move.branch;
        applyIndexUpdates(move.files, cache.write());
    });
    clearJournal(database);
}

} // namespace tav
