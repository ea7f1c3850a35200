#include "host/cli/syntax_groups.h"

#include "host/cli/commands.h"

#include <CLI/CLI.hpp>

#include <memory>
#include <string>

namespace tav {

namespace {

void addRestore(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("restore", "Bring files back as a commit has them");
    auto const options = std::make_shared<RestoreOptions>();
    command->add_option("NAME", options->names, "Paths of files or folders, or the end of a path")->required();
    command
        ->add_option(
            "--from", options->commit,
            "Number, hash, branch or tag, HEAD~2 or master@{yesterday}; by default where you are")
        ->type_name("COMMIT");
    command->add_option("--to", options->target, "Write one file to this path, and leave the file itself as it is")
        ->type_name("PATH");
    command->add_flag(
        "--force", options->force, "Overwrite uncommitted changes, or with --to an existing file of the repository");
    command->add_flag("--dry-run", options->dryRun, "Only show what would be written");
    addExamples(
        *command, "  tav restore plans/roof.dwg                         discard what you have changed\n"
                  "  tav restore --from 12 --to old-roof.dwg roof.dwg    compare with an earlier version");
    command->callback([options] { restoreFiles(*options); });
}

std::shared_ptr<CheckoutOptions> addCheckoutOptions(CLI::App& command, char const* name, char const* description)
{
    auto const options = std::make_shared<CheckoutOptions>();
    command.add_option(name, options->target, description)->required();
    command.add_flag("--force", options->force, "Overwrite files with uncommitted changes");
    command.add_flag("--dry-run", options->dryRun, "Only show which files would be written and removed");
    return options;
}

void addCheckout(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("checkout", "Make the working folder what it was at a commit");
    command->alias("co");
    auto const options = addCheckoutOptions(*command, "COMMIT", "Number, hash, branch or tag");
    command->callback([options] { checkOut(*options); });
}

void addSwitch(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("switch", "Continue on another branch");
    auto const options = addCheckoutOptions(*command, "BRANCH", "Name of the branch");
    CLI::Option* const create = command->add_flag("-c,--create", options->isNew, "Create the branch");
    command->add_option("COMMIT", options->commit, "Where a new branch begins; by default where you are")
        ->needs(create);
    addExamples(
        *command, "  tav switch master\n"
                  "  tav switch -c variant tender    create a branch at a tag, and go there");
    command->callback([options] { switchBranch(*options); });
}

std::shared_ptr<UndoOptions> addTurning(CLI::App& command, char const* dryRunHelp)
{
    auto const options = std::make_shared<UndoOptions>();
    command.add_flag("--dry-run", options->dryRun, dryRunHelp);
    command.add_flag("--force", options->force, "Overwrite files that have been changed since; that can be taken back");
    addJson(command, options->json);
    return options;
}

void addUndo(CLI::App& app)
{
    CLI::App* const command =
        app.add_subcommand("undo", "Take back the last command that changed files, what is staged, or commits");
    auto const options = addTurning(*command, "Show what would be taken back");
    CLI::Option* const list =
        command->add_flag("--list", options->list, "List the commands that can be taken back, the last one first");
    list->excludes("--dry-run")->excludes("--force");
    command->add_option("-n,--count", options->count, "List so many at most")
        ->type_name("COUNT")
        ->check(whyNoCount)
        ->needs(list);
    addExamples(
        *command, "  tav undo            take back the last command\n"
                  "  tav undo --list     show what can be taken back");
    command->callback([options] { undo(*options); });
}

void addRedo(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("redo", "Do again what 'tav undo' has taken back");
    auto const options = addTurning(*command, "Show what would be done again");
    addExamples(*command, "  tav redo            do again what the last 'tav undo' has taken back");
    command->callback([options] { redo(*options); });
}

/// Options of branches and tags alike. Returns the one for the name.
CLI::Option* addReferenceOptions(CLI::App& command, ReferenceOptions& options)
{
    CLI::Option* const name = command.add_option("NAME", options.name, "Name of a new one; without it, list them");
    command.add_option("COMMIT", options.commit, "Where it begins; by default where you are")->needs(name);
    command.add_flag("--json", options.json, "Print a document for programs")->excludes(name);
    CLI::Option* const remove = command.add_flag("-d,--delete", options.isDeleted, "Delete the one called NAME");
    remove->needs(name);
    command.add_flag("--force", options.force, "Delete it even if nothing else leads to its commits")->needs(remove);
    command.add_flag("--dry-run", options.dryRun, "Only show what would be deleted")->needs(remove);
    return remove;
}

void addBranch(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("branch", "List the branches, or create, rename or delete one");
    auto const options = std::make_shared<ReferenceOptions>();
    CLI::Option* const remove = addReferenceOptions(*command, *options);
    command->add_flag("-m,--move", options->isRenamed, "Rename the current branch to NAME, or NAME to COMMIT")
        ->needs(command->get_option("NAME"))
        ->excludes(remove);
    addExamples(
        *command, "  tav branch variant        create a branch here\n"
                  "  tav branch -m draft plan  give the branch draft the name plan\n"
                  "  tav branch -d variant     delete a branch");
    command->callback([options] { branch(*options); });
}

void addTag(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("tag", "List the tags, or create or delete one");
    auto const options = std::make_shared<ReferenceOptions>();
    addReferenceOptions(*command, *options);
    addExamples(
        *command, "  tav tag tender 12    name commit 12\n"
                  "  tav tag -d tender    delete a tag");
    command->callback([options] { tag(*options); });
}

} // namespace

void addReferenceCommands(CLI::App& app)
{
    addRestore(app);
    addCheckout(app);
    addSwitch(app);
    addUndo(app);
    addRedo(app);
    addBranch(app);
    addTag(app);
}

} // namespace tav
