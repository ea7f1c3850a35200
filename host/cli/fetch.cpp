#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/repository/history.h"
#include "host/repository/open.h"
#include "host/repository/work.h"
#include "host/text/wide.h"

#include <string>

namespace tav {

void fetchHistory()
{
    Work work(openRepository(""), "fetch");
    Connection connection(work.database());
    Learned const learned = learnHistory(work.root(), work.database(), connection, Compared::everything);
    if (learned.commits == 0 && learned.references == 0) {
        print("Nothing is new on the server.\n");
        return;
    }
    print("Learned " + counted(learned.commits, "commit") + ".\n");
    if (learned.references > 0) {
        print("Branches and tags that are new or have moved: " + std::to_string(learned.references) + ".\n");
    }
}

} // namespace tav
