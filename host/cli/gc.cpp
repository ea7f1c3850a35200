#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/open.h"
#include "host/repository/server_of.h"
#include "host/repository/work.h"
#include "host/storage/local_storage.h"
#include "host/text/wide.h"

#include <set>
#include <string>

namespace tav {

void collectGarbage()
{
    Work work(openRepository(""), "gc");
    requireWholeHistory(work.database());
    std::vector<OdString> const urls = work.database().commits().urls();
    LocalStorage storage;
    Freed const freed = valueOrFail(
        storage.keepOnly(work.root(), std::set<OdString>(urls.begin(), urls.end())),
        "Run 'tav verify' to see whether anything is damaged.");
    print(
        "Removed " + counted(freed.contents, "stored version") + " that no commit needs; " + sizeText(freed.bytes) +
        " freed.\n");
}

} // namespace tav
