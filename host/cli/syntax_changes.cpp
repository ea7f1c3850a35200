#include "host/cli/syntax_groups.h"

#include "host/cli/commands.h"
#include "host/cli/commit_message.h"

#include <CLI/CLI.hpp>

#include <memory>
#include <string>

namespace tav {

namespace {

void addInit(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("init", "Make a folder of drawings a repository, or complete one");
    auto const options = std::make_shared<InitOptions>();
    command->add_option(
        "FOLDER", options->folder, "The folder of your drawings, by default this one; it is made when it is missing");
    command
        ->add_option(
            "--server", options->server, "Where the history is kept; by default 'tav/server' in your folder for data")
        ->type_name("FOLDER");
    command->add_flag("--nested", options->nested, "Make a repository of its own inside of another one");
    command->callback([options] { init(*options); });
}

void addStatus(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("status", "Show what has changed and what is staged");
    command->alias("st");
    auto const options = std::make_shared<StatusOptions>();
    command->add_flag("--ignored", options->ignored, "Show the files that the ignore rules keep out, too");
    command->add_flag("-s,--short", options->isShort, "Show two letters and the path of each file, as git does");
    addJson(*command, options->json);
    command->callback([options] { showStatus(*options); });
}

/// A command that takes names or --all; one of the two has to be there.
template <class Options>
void addNamesOrAll(CLI::App& command, char const* namesHelp, char const* allHelp, void (*run)(Options const& options))
{
    auto const options = std::make_shared<Options>();
    CLI::Option* const names = command.add_option("NAME", options->names, namesHelp);
    names->excludes(command.add_flag("--all", options->all, allHelp));
    command.callback([options, run] {
        if (options->names.empty() && !options->all) {
            throw CLI::RequiredError("NAME or --all");
        }
        run(*options);
    });
}

void addAdd(CLI::App& app)
{
    addNamesOrAll(
        *app.add_subcommand("add", "Stage changed and new files for the next commit"),
        "Paths of files or folders, or the end of a path that only one changed file matches",
        "Stage every changed and new file", addFilesToStage);
}

void addUnstage(CLI::App& app)
{
    addNamesOrAll(
        *app.add_subcommand("unstage", "Take files out of the next commit; they stay as they are"),
        "Paths of files or folders, or the end of a path that only one staged file matches", "Unstage all files",
        unstageFiles);
}

void addMv(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("mv", "Rename a file or folder, and stage that");
    auto const options = std::make_shared<MvOptions>();
    command->add_option("OLD", options->from, "Path of a file or folder of the repository")->required();
    command->add_option("NEW", options->to, "Its new path, or an existing folder to move it into")->required();
    command->add_flag("--dry-run", options->dryRun, "Only show what would be renamed");
    command->callback([options] { moveFiles(*options); });
}

void addRm(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("rm", "Remove committed files, and stage that");
    auto const options = std::make_shared<RmOptions>();
    command->add_option("NAME", options->names, "Paths of files or folders, or the end of a path")->required();
    command->add_flag("--dry-run", options->dryRun, "Only show what would be removed");
    command->callback([options] { removeFiles(*options); });
}

void addCommit(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("commit", "Keep what is staged, removed and renamed as a new commit");
    command->alias("ci");
    auto const options = std::make_shared<CommitOptions>();
    CLI::Option* const message = command->add_option("-m,--message", options->message, "What has changed, and why");
    command->add_option("-F,--file", options->messageFile, "Take the message from a file, '-' for standard input")
        ->type_name("FILE")
        ->excludes(message);
    command->add_flag("-a,--all", options->takesModified, "Take changed files without staging; new ones are not taken");
    command->add_option("--author", options->author, "Who made it; by default your name and machine");
    CLI::Option* const all = command->add_flag(
        "--all-removed", options->allRemoved, "Remove files that are gone even when a whole folder or many are");
    command
        ->add_flag(
            "--without-removed", options->withoutRemoved,
            "Keep files that are gone in the repository unless 'tav rm' has removed them")
        ->excludes(all);
    CLI::Option* const amend = command->add_flag(
        "--amend", options->amends, "Replace the last commit by one that also has what is staged now");
    command->add_flag("--no-edit", options->keepsMessage, "Keep the message of the commit that is replaced")
        ->needs(amend)
        ->excludes(message)
        ->excludes(command->get_option("--file"));
    addExamples(
        *command, "  tav commit -m 'Moves the north facade'\n"
                  "  tav commit                 write the message in an editor\n"
                  "  tav commit -am 'Moves it'  take all changed files\n"
                  "  tav commit --amend         correct the last commit or its message");
    command->callback([options] {
        if (!options->message && options->messageFile.empty() && !options->keepsMessage && !canEdit()) {
            throw CLI::ParseError(
                "There is no terminal for an editor. Give a message with -m", CLI::ExitCodes::RequiredError);
        }
        makeCommit(*options);
    });
}

void addRevert(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("revert", "Make a commit that does the opposite of another one");
    auto const options = std::make_shared<RevertOptions>();
    command->add_option("COMMIT", options->commit, "Number, hash, branch or tag, HEAD~2 or master@{yesterday}")
        ->required();
    command->add_option("-m,--message", options->message, "By default the message names the commit");
    addExamples(*command, "  tav revert 12    take back what commit 12 has changed");
    command->callback([options] { revertCommit(*options); });
}

void addStash(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("stash", "Put unfinished work aside, and bring it back");
    command->alias("shelve");
    auto const options = std::make_shared<StashOptions>();
    command->add_option(
        "NAME", options->words,
        "Files or folders to put aside, by default everything; or one of: list, show [N], pop [N], apply [N], drop "
        "[N], "
        "push [NAME ...]");
    command->add_option("-m,--message", options->message, "What the work is");
    addJson(*command, options->json);
    addExamples(
        *command, "  tav stash -m 'half a roof'    put all changes aside\n"
                  "  tav stash list                show what has been put aside\n"
                  "  tav stash pop                 bring the last one back\n"
                  "  tav stash apply 2             bring stash 2 back, and keep it\n"
                  "  tav stash drop 2              throw it away");
    command->callback([options] { stash(*options); });
}

} // namespace

void addChangeCommands(CLI::App& app)
{
    addInit(app);
    addStatus(app);
    addAdd(app);
    addUnstage(app);
    addMv(app);
    addRm(app);
    addCommit(app);
    addRevert(app);
    addStash(app);
}

} // namespace tav
