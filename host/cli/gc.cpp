#include "host/checkout/removed_files.h"
#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/contents.h"
#include "host/repository/history.h"
#include "host/repository/open.h"
#include "host/repository/unfinished.h"
#include "host/repository/work.h"
#include "host/storage/local_storage.h"
#include "host/text/wide.h"

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
std::string learnWhatIsNeeded(Work& work)
{
    if (std::holds_alternative<CommitUnderWay>(unfinishedOf(work.database()))) {
        return "A commit waits for the server.";
    }
    try {
        Connection connection(work.database());
        learnHistory(work.root(), work.database(), connection, Compared::everything);
        return {};
    } catch (Failure const& failure) {
        if (!concernsServer(failure)) {
            throw;
        }
        return failure.what + " " + failure.next;
    }
}

Freed removeWhatNobodyNeeds(Work& work, LocalStorage& storage)
{
    std::string const doubt = learnWhatIsNeeded(work);
    if (!doubt.empty()) {
        printNote("Only leftovers are removed, as the server does not say what its commits need. " + doubt);
        return valueOrFail(storage.removeLeftovers(work.root()), "Check your rights in '.tav'.");
    }
    Contents const needed = contentsOf(work.root(), work.database());
    return valueOrFail(
        storage.keepOnly(work.root(), setOf(needed.here), setOf(needed.elsewhere)),
        "Run 'tav verify' to see whether anything is damaged.");
}

} // namespace

void collectGarbage()
{
    Work work(openRepository(""), "gc", Work::Unfinished::mayStay);
    work.database().failIfDamaged();
    LocalStorage storage;
    Freed const freed = removeWhatNobodyNeeds(work, storage);
    RemovedFiles const files = cleanRemovedFiles(work.root(), work.database(), storage);
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
