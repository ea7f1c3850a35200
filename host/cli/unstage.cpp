#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/staging.h"
#include "host/repository/work.h"
#include "host/repository/working_state.h"

#include <memory>
#include <string>
#include <vector>

namespace tav {

namespace {

struct Options {
    std::vector<std::string> names;
    bool all = false;
};

void unstageFiles(Options const& options)
{
    Work const work(openRepository(""), "unstage", Work::Unfinished::mayStay);
    common::RootPath const& root = work.root();
    std::size_t count = 0;
    changeState(root, [&](common::Cache& cache) {
        NameFinder const finder(cache.read().stagedFiles, root);
        std::vector<common::StagedFile> chosen = options.all ? finder.all() : std::vector<common::StagedFile>();
        for (std::string const& name : options.names) {
            std::vector<common::StagedFile> const found = finder.find(name);
            if (found.empty()) {
                throw Failure("No staged file matches '" + name + "'.", "Run 'tav status' to see what is staged.");
            }
            chosen.insert(chosen.end(), found.begin(), found.end());
        }
        count = unstage(chosen, cache.write());
    });
    print("Took " + std::to_string(count) + (count == 1 ? " file" : " files") + " out of the next commit.\n");
}

} // namespace

void addUnstage(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("unstage", "Take files out of the next commit; they stay as they are");
    auto const options = std::make_shared<Options>();
    CLI::Option* const names = command->add_option(
        "NAME", options->names, "Paths of files or folders, or the end of a path that only one staged file matches");
    CLI::Option* const all = command->add_flag("--all", options->all, "Take every staged file out");
    names->excludes(all);
    command->callback([options] {
        if (options->names.empty() && !options->all) {
            throw CLI::RequiredError("NAME or --all");
        }
        unstageFiles(*options);
    });
}

} // namespace tav
