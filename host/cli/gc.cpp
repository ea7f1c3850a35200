#include "host/checkout/removed_files.h"
#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/client/contents.h"
#include "host/client/history.h"
#include "host/errors/failure.h"
#include "host/repository/journal.h"
#include "host/repository/open.h"
#include "host/session/write_session.h"
#include "host/storage/local_storage.h"
#include "host/text/plural.h"

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
        return "A commit waits for the server.";
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

Freed removeWhatNobodyNeeds(WriteSession& session, LocalStorage& storage)
{
    std::string const doubt = learnWhatIsNeeded(session);
    if (!doubt.empty()) {
        printNote("Only leftovers are removed, as the server does not say what its commits need. " + doubt);
        return valueOrFail(storage.removeLeftovers(), "Check your rights in '.tav'.");
    }
    Contents const needed = contentsOf(session.root(), session.database());
    return valueOrFail(
        storage.keepOnly(setOf(needed.here), setOf(needed.elsewhere)),
        "Run 'tav verify' to see whether anything is damaged.");
}

} // namespace

void collectGarbage()
{
    WriteSession session(openRepository(""), "gc", Recovery::attempted);
    session.database().failIfDamaged();
    LocalStorage storage(session.root());
    Freed const freed = removeWhatNobodyNeeds(session, storage);
    RemovedFiles const files = cleanRemovedFiles(session.root(), session.database(), storage);
    print(
        "Removed " + counted(freed.contents, "stored version") + " that no commit needs; " + sizeText(freed.bytes) +
        " freed.\n");
    if (files.freed.contents > 0) {
        print(
            "Removed " + counted(files.freed.contents, "file") + " that a killed 'tav rm' had left; " +
            sizeText(files.freed.bytes) + " freed.\n");
    }
    for (std::string const& file : files.kept) {
        printNote(
            "'" + file +
            "' is left of a killed 'tav rm' and holds what no commit has. Keep it elsewhere or delete it.");
    }
}

} // namespace tav
