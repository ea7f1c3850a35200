#include "host/cli/commands.h"
#include "host/cli/content_output.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"

#include <string>

namespace tav {

void printFile(std::string const& typed)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    if (auto const file = findFileOfCommit(typed, database, root)) {
        printContent(*file, root);
        return;
    }
    requireCommitOf(typed, database);
    throw Failure(
        "'" + typed + "' does not name a file in a commit.",
        "Type a commit, a colon and a name, as in 'tav cat 12:roof.dwg'.");
}

} // namespace tav
