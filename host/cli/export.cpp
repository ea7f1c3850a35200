#include "host/repository/export.h"
#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/commit_names.h"
#include "host/repository/open.h"
#include "host/text/wide.h"

#include <memory>
#include <string>
#include <utility>

namespace tav {

namespace {

void exportCommit(std::string const& typed, std::string const& target)
{
    common::RootPath const root = openRepository("");
    LocalDatabase const database = LocalDatabase::open(root);
    CommitRecord const commit = findCommit(database, typed);
    std::size_t const count = exportFiles(root, database.commits().files(commit.hash), target);
    print(
        "Wrote " + counted(count, "file") + " of commit " + std::to_string(commit.number) + " into '" +
        shown(wide(target)) + "'.\n");
}

} // namespace

void addExport(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("export", "Write the files of a commit into a folder of their own");
    auto const arguments = std::make_shared<std::pair<std::string, std::string>>();
    command->add_option("COMMIT", arguments->first, "Number, hash, branch or tag")->required();
    command->add_option("TARGET", arguments->second, "A folder that is empty or does not exist yet")->required();
    command->callback([arguments] { exportCommit(arguments->first, arguments->second); });
}

} // namespace tav
