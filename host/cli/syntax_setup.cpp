#include "host/cli/syntax_groups.h"

#include "host/cli/commands.h"

#include <CLI/CLI.hpp>

#include <memory>
#include <string>
#include <utility>

namespace tav {

namespace {

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
    auto const options = std::make_shared<GcOptions>();
    CLI::Option* const dryRun = command->add_flag(
        "--dry-run", options->dryRun, "Only show how much would be removed, as far as it is known here");
    command->add_flag("--drop-undo", options->dropsUndo, "Forget what 'tav undo' could take back, and free that too")
        ->excludes(dryRun);
    command->callback([options] { collectGarbage(*options); });
}

void addExport(CLI::App& app)
{
    CLI::App* const command = app.add_subcommand("export", "Write the files of a commit into a folder of their own");
    auto const arguments = std::make_shared<std::pair<std::string, std::string>>();
    command->add_option("COMMIT", arguments->first, "Number, hash, branch or tag")->required();
    command->add_option("TARGET", arguments->second, "A folder that is empty or does not exist yet")->required();
    command->callback([arguments] { exportCommit(arguments->first, arguments->second); });
}

} // namespace

void addSetupCommands(CLI::App& app)
{
    app.add_subcommand("fetch", "Get the commits, branches and tags that the server has")->callback(fetch);
    addServer(app);
    addFiles(app);
    addIgnore(app);
    addConfig(app);
    addProjects(app);
    addOnlyJson(*app.add_subcommand("verify", "Read every stored version and check it against its digest"), verifyAll);
    addGc(app);
    addExport(app);
}

} // namespace tav
