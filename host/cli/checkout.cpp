#include "host/cli/commands.h"
#include "host/cli/output.h"
#include "host/failure.h"
#include "host/repository/commit_names.h"
#include "host/repository/moving.h"
#include "host/repository/open.h"
#include "host/repository/work.h"
#include "host/repository/working_state.h"
#include "host/text/wide.h"

#include <memory>
#include <string>

namespace tav {

namespace {

struct Options {
    std::string target;
    bool force = false;
};

Unsaved unsavedOf(Options const& options)
{
    return options.force ? Unsaved::mayGo : Unsaved::isKept;
}

std::string described(Moved const& moved)
{
    return counted(moved.written, "file") + " written, " + std::to_string(moved.removed) + " removed.\n";
}

void checkOut(Options const& options)
{
    Work work(openRepository(""), "checkout");
    CommitRecord const commit = findCommit(work.database(), options.target);
    OdString const branch = readState(work.root())->read().head;
    Moved const moved = moveTo(work.root(), work.database(), {commit.hash, branch}, unsavedOf(options), work.start());
    print("The working folder is at commit " + std::to_string(commit.number) + " now: " + described(moved));
}

void switchBranch(Options const& options)
{
    Work work(openRepository(""), "switch");
    auto const branch = work.database().commits().reference(wide(options.target));
    if (branch && branch->type == common::EType::tag) {
        throw Failure("'" + options.target + "' is a tag.", "Use 'tav checkout " + options.target + "' to go there.");
    }
    if (!branch) {
        throw Failure(
            "There is no branch '" + options.target + "'.",
            "Run 'tav branch' to see those that there are, or 'tav branch NAME' to make one.");
    }
    Moved const moved =
        moveTo(work.root(), work.database(), {branch->commitHash, branch->name}, unsavedOf(options), work.start());
    print("On branch " + shown(branch->name) + " now: " + described(moved));
}

std::shared_ptr<Options> addOptions(CLI::App& command, char const* name, char const* description)
{
    auto const options = std::make_shared<Options>();
    command.add_option(name, options->target, description)->required();
    command.add_flag("--force", options->force, "Overwrite files with changes that are in no commit");
    return options;
}

} // namespace

void addCheckout(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("checkout", "Make the working folder what it was at a commit");
    auto const options = addOptions(*command, "COMMIT", "Number, hash, branch or tag");
    command->callback([options] { checkOut(*options); });
}

void addSwitch(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("switch", "Go on with the work on another branch");
    auto const options = addOptions(*command, "BRANCH", "Name of the branch");
    command->callback([options] { switchBranch(*options); });
}

} // namespace tav
