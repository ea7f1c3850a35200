#include "host/cli/syntax.h"

#include "host/cli/syntax_groups.h"
#include "host/cli/terminal.h"
#include "host/terminal/progress.h"

#include <CLI/CLI.hpp>

#include <cstdint>

namespace tav {

namespace {

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
    addChangeCommands(app);
    addHistoryCommands(app, behindDashes);
    addReferenceCommands(app);
    addSetupCommands(app);
    addTerminalOptions(app, "Options");
    for (CLI::App* const command : app.get_subcommands({})) {
        addTerminalOptions(*command, "");
    }
}

} // namespace tav
