#include "host/checkout/removed_files.h"
#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/current_settings.h"
#include "host/cli/output.h"
#include "host/cli/planned_update.h"
#include "host/client/contents.h"
#include "host/client/history.h"
#include "host/commits/turn_over.h"
#include "host/errors/failure.h"
#include "host/repository/journal.h"
#include "host/repository/open.h"
#include "host/session/write_session.h"
#include "host/storage/local_storage.h"
#include "host/text/plural.h"
#include "host/text/size.h"
#include "host/undo/log_size.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <optional>
#include <set>
#include <string>
#include <variant>
#include <vector>

namespace tav {

namespace {

std::set<OdString> setOf(std::vector<OdString> const& urls)
{
    return {urls.begin(), urls.end()};
}

bool concernsServer(Failure const& failure)
{
    auto const kind = static_cast<ServerError>(failure.code);
    return kind == ServerError::noServer || kind == ServerError::noRepository || kind == ServerError::isBehind;
}

/// Learns from the server which commits there are. Returns why that cannot be known now; empty when it is known.
std::string learnWhatIsNeeded(WriteSession& session)
{
    if (std::holds_alternative<PendingCommit>(readJournal(session.database()))) {
        return "A commit is waiting to be sent.";
    }
    try {
        Connection connection(session.database());
        fetchHistory(session.root(), session.database(), connection, Compared::everything);
        return {};
    } catch (Failure const& failure) {
        if (!concernsServer(failure)) {
            throw;
        }
        return failure.what + " " + failure.next;
    }
}

/// How many of the contents that were entered here the storage does not have. Then the database may be of another
/// repository, which needs nothing of this storage.
std::size_t countMissing(WriteSession& session, LocalStorage& storage)
{
    std::set<OdString> const kept = valueOrFail(storage.contents(), "Check the disk and your rights in '.tav'.");
    std::vector<OdString> const entered = session.database().contents();
    auto const isMissing = [&](OdString const& url) { return kept.count(url) == 0; };
    return static_cast<std::size_t>(std::count_if(entered.begin(), entered.end(), isMissing));
}

/// Why nothing but leftovers can be removed; empty when it is known what commits need.
std::string whyOnlyLeftovers(WriteSession& session, LocalStorage& storage)
{
    if (std::size_t const missing = countMissing(session, storage)) {
        return counted(missing, "committed version") +
               " that should be here cannot be found. Run 'tav verify' to see what is missing; if '.tav/tav.db' is of "
               "another folder, put the right one in its place, or move it away and run 'tav init'.";
    }
    std::string const doubt = learnWhatIsNeeded(session);
    return doubt.empty() ? doubt : "the server does not say what its commits need. " + doubt;
}

struct Cleaned {
    TurnedOver turned;
    Freed removed;
};

/// Leftovers go first: on a full disk nothing can be learned.
Cleaned removeWhatNobodyNeeds(WriteSession& session, LocalStorage& storage)
{
    Freed const leftovers = valueOrFail(storage.removeLeftovers(), "Check your rights in '.tav'.");
    std::string const why = whyOnlyLeftovers(session, storage);
    if (!why.empty()) {
        printNote("Only leftovers are removed: " + why);
        return {{}, leftovers};
    }
    TurnedOver const turned = turnOverObjects(session.root(), session.database());
    Contents const needed = contentsOf(session.root(), session.database());
    Freed const unneeded = valueOrFail(
        storage.keepOnly(setOf(needed.here), setOf(needed.elsewhere)),
        "Run 'tav verify' to see whether anything is damaged.");
    return {turned, {leftovers.contents + unneeded.contents, leftovers.bytes + unneeded.bytes}};
}

/// The rest has been cleaned nevertheless: that may be what frees the space that was missing.
void failUnlessTurnedOver(TurnedOver const& turned)
{
    if (turned.error) {
        throw Failure(
            "Not all versions were stored in less space: " + turned.error->message.ansi_str(),
            "Everything else is done; correct that and run 'tav gc' again.");
    }
}

void reportTurnedOver(Freed const& freed)
{
    if (freed.contents > 0) {
        report(
            "Stored " + counted(freed.contents, "version") + " in less space; " + sizeText(freed.bytes) + " freed.\n");
    }
}

void requireConsent()
{
    auto const answer = canAsk() ? ask("Forget all that 'tav undo' could take back? [y/N]") : "y";
    if (answer != "y" && answer != "Y") {
        throw Failure("Nothing has been forgotten.", "Answer 'y' to do it.");
    }
}

/// The operation that is under way is still to be completed.
void dropLog(LocalDatabase& database)
{
    WriteTransaction transaction(database.database());
    for (Operation const& operation : database.operations().latest(std::numeric_limits<std::int32_t>::max())) {
        Phase const phase = operation.phase;
        if (phase == Phase::done || phase == Phase::undone || phase == Phase::superseded) {
            database.operations().remove(operation.id);
        }
    }
    transaction.commit();
}

void keepLogWithinItsSize(LocalDatabase& database, LocalStorage const& storage)
{
    std::uint64_t const most = parseSize(currentSettings().value("undo.size")).value();
    if (std::size_t const forgotten = limitLog(database, storage, most)) {
        report("Forgot the " + counted(forgotten, "oldest command") + " that 'tav undo' could take back.\n");
    }
}

/// Without asking the server: it may know of commits that need some of these.
void preview()
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    notePending(root, database);
    Contents const needed = contentsOf(root, database);
    std::set<OdString> unneeded = valueOrFail(LocalStorage(root).contents(), "Check your rights in '.tav'.");
    for (std::vector<OdString> const* const urls : {&needed.here, &needed.elsewhere}) {
        for (OdString const& url : *urls) {
            unneeded.erase(url);
        }
    }
    print("Would remove at most " + counted(unneeded.size(), "stored version") + ".\n");
}

} // namespace

void collectGarbage(GcOptions const& options)
{
    if (options.dryRun) {
        preview();
        return;
    }
    if (options.dropsUndo) {
        requireConsent();
    }
    WriteSession session(openRepository(""), "gc", Recovery::attempted);
    session.database().failIfDamaged();
    LocalStorage storage(session.root());
    if (options.dropsUndo) {
        dropLog(session.database());
    } else {
        keepLogWithinItsSize(session.database(), storage);
    }
    Cleaned const cleaned = removeWhatNobodyNeeds(session, storage);
    RemovedFiles const files = cleanRemovedFiles(session.root(), session.database(), storage);
    failUnlessTurnedOver(cleaned.turned);
    reportTurnedOver(cleaned.turned.freed);
    report(
        "Removed " + counted(cleaned.removed.contents, "stored version") + " that no commit needs; " +
        sizeText(cleaned.removed.bytes) + " freed.\n");
    if (files.freed.contents > 0) {
        report(
            "Removed " + counted(files.freed.contents, "file") + " that a killed 'tav rm' had left; " +
            sizeText(files.freed.bytes) + " freed.\n");
    }
    for (std::string const& file : files.kept) {
        printNote(
            "'" + file +
            "' was left by an interrupted 'tav rm' and has content that is in no commit. Keep it elsewhere or delete "
            "it.");
    }
}

} // namespace tav
