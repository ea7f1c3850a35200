#include "host/checkout/export.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/commits/commit_names.h"
#include "host/errors/failure.h"
#include "host/repository/open.h"
#include "host/text/plural.h"
#include "host/text/utf8.h"

#include <string>
#include <utility>

namespace tav {

void exportCommit(std::string const& typed, std::string const& target)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    CommitRecord const commit = findCommit(database, typed);
    std::size_t const count = exportFiles(root, database, database.commits().files(commit.hash), target);
    report(
        "Wrote " + counted(count, "file") + " of commit " + std::to_string(commit.number) + " into '" +
        shown(fromUtf8(target)) + "'.\n");
}

} // namespace tav
