#include "host/cli/syntax_groups.h"

#include "host/cli/commands.h"

#include <CLI/CLI.hpp>

#include <cstddef>
#include <memory>
#include <optional>
#include <string>

namespace tav {

namespace {

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
        ->check(whyNoCount);
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

} // namespace

void addHistoryCommands(CLI::App& app, std::optional<std::size_t> behindDashes)
{
    addLog(app, behindDashes);
    addShow(app);
    addCat(app);
    addOpen(app);
    addDiff(app, behindDashes);
    addPreview(app);
    addCompare(app);
}

} // namespace tav
