#include "host/checkout/removed_files.h"
#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/contents.h"
#include "host/repository/history.h"
#include "host/repository/open.h"
#include "host/repository/work.h"
#include "host/storage/local_storage.h"
#include "host/text/wide.h"

#include <set>
#include <string>
#include <vector>

namespace tav {

namespace {

std::set<OdString> setOf(std::vector<OdString> const& urls)
{
    return {urls.begin(), urls.end()};
}

} // namespace

void collectGarbage()
{
    Work work(openRepository(""), "gc");
    work.database().failIfDamaged();
    Connection connection(work.database());
    learnHistory(work.root(), work.database(), connection, Compared::everything); // The server says what is needed.
    Contents const needed = contentsOf(work.root(), work.database());
    LocalStorage storage;
    Freed const freed = valueOrFail(
        storage.keepOnly(work.root(), setOf(needed.here), setOf(needed.elsewhere)),
        "Run 'tav verify' to see whether anything is damaged.");
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
