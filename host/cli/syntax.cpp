#include "host/cli/syntax.h"

#include "host/cli/commands.h"
#include "host/cli/commit_message.h"
#include "host/cli/terminal.h"
#include "host/terminal/progress.h"

#include <CLI/CLI.hpp>

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

// All in one place: every source that sees the templates of CLI11 takes longer to compile than the rest of the host.
namespace tav {

namespace {

void addJson(CLI::App& command, bool& json)
{
    command.add_flag("--json", json, "Print a document for programs");
}

/// The examples of a command, below its help.
void addExamples(CLI::App& command, char const* examples)
{
    command.footer(std::string("Examples:\n") + examples);
}

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

/// The parser's own check names the whole range of numbers.
std::string isCount(std::string const& text)
{
    bool const hasDigits = !text.empty() && text.size() <= 18 && text.find_first_not_of("0123456789") == text.npos;
    bool const isPositive = text.find_first_not_of('0') != text.npos;
    return hasDigits && isPositive ? std::string() : "'" + text + "' is not a number of commits";
}

void addLog(CLI::App& app, std::optional<std::size_t> behindDashes)
{
    CLI::App* const command = app.add_subcommand("log", "Show the history, newest first");
    auto const options = std::make_shared<LogOptions>();
    options->arguments.names = behindDashes;
    command->add_option(
        "NAME", options->arguments.words,
        "The commit to begin with, by default where you are, and then files or folders whose history is shown");
    command->add_option("-n,--count", options->count, "Show at most this many commits; -5 is the same as -n 5")
        ->type_name("COUNT")
        ->check(isCount);
    command->add_option("--since", options->since, "Show commits made on this date or later")->type_name("DATE");
    command->add_option("--until", options->until, "Show commits made on this date or earlier")->type_name("DATE");
    command->add_option("--author", options->author, "Show commits of authors with this in their name")
        ->type_name("TEXT");
    command->add_flag("--all", options->all, "Show the history of all branches and tags");
    command->add_flag("--oneline", options->oneline, "Show one line for each commit");
    addJson(*command, options->json);
    addExamples(
        *command, "  tav log plans/roof.dwg                 all versions of a drawing, through renames\n"
                  "  tav log -3 master                      the last three commits of a branch\n"
                  "  tav log --since '2 weeks ago' plans    what has changed in a folder");
    command->callback([options] {
        if (auto const count = takeCount(options->arguments)) {
            options->count = *count;
        }
        showLog(*options);
    });
}

void addShow(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("show", "Show a commit and what it changed, or a file of it");
    auto const options = std::make_shared<ShowOptions>();
    command->add_option(
        "COMMIT", options->commit,
        "Number, hash, branch or tag, HEAD~2 or master@{yesterday}; by default where you are. COMMIT:NAME is the "
        "content of a file");
    addJson(*command, options->json);
    addExamples(
        *command, "  tav show @~1              the commit before\n"
                  "  tav show 12:notes.txt     a file as commit 12 has it");
    command->callback([options] { showCommit(*options); });
}

void addCat(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("cat", "Print a file as a commit has it");
    auto const name = std::make_shared<std::string>();
    command->add_option("COMMIT:NAME", *name, "A commit, by default where you are, and the path of a file")->required();
    addExamples(*command, "  tav cat 12:plans/roof.dwg >old-roof.dwg");
    command->callback([name] { printFile(*name); });
}

void addOpen(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("open", "Open a read-only copy of a file as a commit has it");
    auto const options = std::make_shared<OpenOptions>();
    command
        ->add_option(
            "COMMIT:NAME", options->name,
            "A commit and the path of a file; without a commit and the colon, as the current one has it")
        ->required();
    command->add_flag("--print", options->printsPath, "Print the path of the copy, and open nothing");
    addExamples(*command, "  tav open 12:plans/roof.dwg");
    command->callback([options] { openFile(*options); });
}

void addDiff(CLI::App& app, std::optional<std::size_t> behindDashes)
{
    CLI::App* const command =
        app.add_subcommand("diff", "Show what is different from the last commit, or between commits");
    auto const options = std::make_shared<DiffOptions>();
    options->arguments.names = behindDashes;
    command->add_option(
        "NAME", options->arguments.words,
        "A commit to compare the working folder with, or two to compare; and paths of files or folders, or the end of "
        "a path, by default all");
    CLI::Option* const stat = command->add_flag("--stat", options->stat, "Show a line for each file and the total");
    command->add_flag("--text", options->text, "Show all lines of text files")->excludes(stat);
    addJson(*command, options->json);
    addExamples(
        *command, "  tav diff                      what you have changed\n"
                  "  tav diff tender master        what is different between a tag and a branch\n"
                  "  tav diff @~2 -- notes.txt     what has changed in a file since the second commit before");
    command->callback([options] { showDifferences(*options); });
}

void addPreview(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("preview", "Show the preview picture of a drawing");
    auto const options = std::make_shared<PreviewOptions>();
    command->add_option("NAME", options->name, "Path of a drawing; 'plan.dwg@3' for the one of commit 3")->required();
    CLI::Option* const file =
        command->add_option("-o,--output", options->file, "Write the picture to this PNG file")->type_name("FILE");
    command->add_flag("--json", options->json, "Print a document for programs")->needs(file);
    command->callback([options] { showPreview(*options); });
}

void addCompare(CLI::App& app)
{
    CLI::App* const command =
        app.add_subcommand("compare", "Show two versions of a drawing as pictures, and what differs");
    auto const options = std::make_shared<CompareOptions>();
    command->add_option("NAME", options->name, "Path of a drawing")->required();
    command->add_option("BEFORE", options->before, "The commit of the first version; by default where you are");
    command->add_option("AFTER", options->after, "The commit of the second version; by default the working folder");
    CLI::Option* const file =
        command->add_option("-o,--output", options->file, "Write the picture to this PNG file")->type_name("FILE");
    command->add_flag("--open", options->open, "Open the picture with the program of your desktop")->excludes(file);
    command->add_flag("--json", options->json, "Print a document for programs")->needs(file);
    addExamples(*command, "  tav compare plans/roof.dwg 12 --open    what has changed since commit 12");
    command->callback([options] { compareDrawing(*options); });
}

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
    command->add_flag("--force", options->force, "Overwrite uncommitted changes, or with --to an existing file");
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
    CLI::App* const command = app.add_subcommand("undo", "Take back the last command");
    auto const options = addTurning(*command, "Show what would be taken back");
    CLI::Option* const list =
        command->add_flag("--list", options->list, "List the commands that can be taken back, the last one first");
    list->excludes("--dry-run")->excludes("--force");
    command->add_option("-n,--count", options->count, "List so many at most")
        ->type_name("COUNT")
        ->check(CLI::PositiveNumber)
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

void addServer(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("server", "Show where the history is kept, or name its new place");
    auto const options = std::make_shared<ServerOptions>();
    command->add_option("FOLDER", options->folder, "Where the server is now, as in: tav server /mnt/office/tav");
    command->add_flag("--send", options->send, "Send the commits that the server does not have");
    command->callback([options] { server(*options); });
}

void addFiles(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("files", "List the files that the repository keeps");
    auto const options = std::make_shared<FilesOptions>();
    command->add_option("FOLDER", options->folder, "The folder of a repository; by default the one you are in");
    CLI::Option* const hash =
        command->add_flag("--hash", options->hash, "Show the SHA-256 digest of each file, in the form of sha256sum");
    command->add_flag("--long", options->isLong, "Show the last commit of each file, its date and its author")
        ->excludes(hash);
    command->add_option("--at", options->commit, "List the files of a commit; --long does so with the current one")
        ->type_name("COMMIT");
    addJson(*command, options->json);
    addExamples(
        *command, "  tav files --long            who changed each file last, and when\n"
                  "  tav files --at master~10    the files of an earlier commit");
    command->callback([options] { listFiles(*options); });
}

void addIgnore(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("ignore", "Show, add or remove rules for names to ignore");
    auto const options = std::make_shared<IgnoreOptions>();
    CLI::Option* const add = command->add_option(
        "--add", options->added,
        "A wildcard like '*.plt', or a regular expression; files and folders whose whole name matches it are ignored");
    CLI::Option* const remove = command->add_option("--remove", options->removed, "A rule, or the wildcard it is for");
    add->type_name("PATTERN");
    remove->type_name("PATTERN")->excludes(add);
    command->add_option("--why", options->name, "Say which rule makes a file or folder ignored")
        ->type_name("NAME")
        ->excludes(add)
        ->excludes(remove);
    command->add_flag("--dry-run", options->dryRun, "Only show what --add or --remove would do")->excludes("--why");
    command->add_flag("--json", options->json, "Print a document for programs")->excludes(add)->excludes(remove);
    addExamples(
        *command, "  tav ignore --add '*.plt'         ignore all plot files\n"
                  "  tav ignore --why plans/roof.bak  say why a file is not listed");
    command->callback([options] { ignore(*options); });
}

void addConfig(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("config", "Show or change settings");
    auto const options = std::make_shared<ConfigOptions>();
    CLI::Option* const key = command->add_option("KEY", options->key, "Name of a setting; without it, all are listed");
    CLI::Option* const value = command->add_option("VALUE", options->value, "Its new value")->needs(key);
    command->add_flag("--list", "List the settings in effect, and where they come from")->excludes(key);
    command->add_flag("--unset", options->unset, "Remove a setting")->needs(key)->excludes(value);
    CLI::Option* const user = command->add_flag("--user", options->user, "For all your repositories, the default");
    command->add_flag("--repository", options->repository, "For this repository only")->excludes(user);
    command->add_flag("--json", options->json, "Print a document for programs")->excludes(value);
    addExamples(
        *command, "  tav config user.name 'Ann Miller'\n"
                  "  tav config --repository log.date absolute\n"
                  "  tav config --list");
    command->callback([options] { config(*options); });
}

void addProjects(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("projects", "List the repositories that you have made");
    auto const options = std::make_shared<ProjectsOptions>();
    CLI::Option* const forget = command->add_option(
        "--forget", options->forgotten, "Take one off the list, by its name or path; its folder and history stay");
    forget->type_name("PROJECT");
    command->add_flag("--json", options->json, "Print a document for programs")->excludes(forget);
    addExamples(*command, "  tav projects --forget /home/ann/old-bridge");
    command->callback([options] { projects(*options); });
}

void addOnlyJson(CLI::App& command, void (*run)(bool json))
{
    auto const json = std::make_shared<bool>(false);
    addJson(command, *json);
    command.callback([json, run] { run(*json); });
}

void addGc(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("gc", "Remove what no commit needs from the storage");
    auto const dryRun = std::make_shared<bool>(false);
    command->add_flag("--dry-run", *dryRun, "Only show how much would be removed, as far as it is known here");
    command->callback([dryRun] { collectGarbage(*dryRun); });
}

void addExport(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("export", "Write the files of a commit into a folder of their own");
    auto const arguments = std::make_shared<std::pair<std::string, std::string>>();
    command->add_option("COMMIT", arguments->first, "Number, hash, branch or tag")->required();
    command->add_option("TARGET", arguments->second, "A folder that is empty or does not exist yet")->required();
    command->callback([arguments] { exportCommit(arguments->first, arguments->second); });
}

/// The options of every command. They are understood before the command and behind it; the help of tav shows them.
void addTerminalOptions(CLI::App& app, char const* group)
{
    TerminalOptions& options = terminalOptions();
    app.add_option("--color", options.colour, "When to use colours: auto, always or never")
        ->type_name("WHEN")
        ->check(CLI::IsMember({"auto", "always", "never"}))
        ->group(group);
    app.add_flag(
           "--no-pager", [&options](std::int64_t) { options.hasPager = false; }, "Do not use a pager")
        ->group(group);
    app.add_flag(
           "-q,--quiet",
           [&options](std::int64_t) {
               options.isQuiet = true;
               hideProgress();
           },
           "Do not report what was done")
        ->group(group);
    app.add_flag("--yes", options.asksNothing, "Do not ask questions; take the default answer")->group(group);
}

} // namespace

void addCommands(CLI::App& app, std::optional<std::size_t> behindDashes)
{
    addInit(app);
    addStatus(app);
    addAdd(app);
    addUnstage(app);
    addMv(app);
    addRm(app);
    addCommit(app);
    addLog(app, behindDashes);
    addShow(app);
    addCat(app);
    addOpen(app);
    addDiff(app, behindDashes);
    addPreview(app);
    addCompare(app);
    addRestore(app);
    addCheckout(app);
    addSwitch(app);
    addUndo(app);
    addRedo(app);
    addBranch(app);
    addTag(app);
    app.add_subcommand("fetch", "Get the commits, branches and tags that the server has")->callback(fetch);
    addServer(app);
    addFiles(app);
    addIgnore(app);
    addConfig(app);
    addProjects(app);
    addOnlyJson(*app.add_subcommand("verify", "Read every stored version and check it against its digest"), verifyAll);
    addGc(app);
    addExport(app);
    addTerminalOptions(app, "Options");
    for (CLI::App* const command : app.get_subcommands({})) {
        addTerminalOptions(*command, "");
    }
}

} // namespace tav
