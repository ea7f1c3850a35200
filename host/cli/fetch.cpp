#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/client/history.h"
#include "host/repository/open.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"

#include <string>

namespace tav {

void fetch()
{
    WriteSession session(openRepository(""), "fetch");
    Connection connection(session.database());
    Fetched const fetched = fetchHistory(session.root(), session.database(), connection, Compared::everything);
    if (fetched.commits == 0 && fetched.references == 0) {
        report("Nothing is new on the server.\n");
        return;
    }
    report("Fetched " + counted(fetched.commits, "commit") + ".\n");
    if (fetched.references > 0) {
        report("Branches and tags that are new or have moved: " + std::to_string(fetched.references) + ".\n");
    }
}

} // namespace tav
