#include "host/cli/command_line.h"

#include "host/cli/moved_project.h"
#include "host/cli/output.h"
#include "host/cli/syntax.h"
#include "host/errors/failure.h"

#include "platform/sdk/OdError.h"

#include <CLI/CLI.hpp>
#include <unistd.h>

#include <algorithm>
#include <clocale>
#include <csignal>
#include <exception>
#include <memory>
#include <optional>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

namespace tav {

namespace {

void prepareProcess()
{
    // Documents hold characters as they are when the locale knows them to be printable, and characters beyond 16 bits
    // survive only so. Under the plain C locale no character beyond ASCII is printable.
    if (!std::setlocale(LC_CTYPE, "C.UTF-8")) {
        std::setlocale(LC_CTYPE, "");
    }
    // A write beyond the size that files may have then fails like one to a full disk, instead of ending the process.
    std::signal(SIGXFSZ, SIG_IGN);
}

std::string chosenCommand(CLI::App const& app)
{
    auto const chosen = app.get_subcommands();
    return chosen.empty() ? "tav" : "tav " + chosen.front()->get_name();
}

// CLI11 takes an argument like "[old]" or "[a,b]" apart as a list of names, and forgets "--" where a command has a name
// already. A mark in front keeps an argument whole, and a name, until its option takes it over.
constexpr char kMark = '\x01';

std::string marked(std::string const& argument)
{
    bool const isEndangered = !argument.empty() && (argument.front() == '[' || argument.front() == kMark);
    return isEndangered ? kMark + argument : argument;
}

std::string unmarked(std::string const& argument)
{
    return !argument.empty() && argument.front() == kMark ? argument.substr(1) : argument;
}

void takeMarksOff(CLI::App& command)
{
    for (CLI::Option* const option : command.get_options()) {
        if (option->get_items_expected_max() > 0) {
            option->transform(unmarked);
        }
    }
}

/// Where a path is expected, an empty text would mean the current folder, or nothing at all.
void requirePaths(CLI::App& command)
{
    for (CLI::Option* const option : command.get_options()) {
        std::string const type = option->get_positional() ? option->get_name() : option->get_type_name();
        if (type == "FILE" || type == "FOLDER" || type == "PATH" || type == "TARGET") {
            option->check([](std::string const& path) { return path.empty() ? "The path is empty" : std::string(); });
        }
    }
}

/// In reverse order, which the parser wants.
std::vector<std::string> markedArguments(std::vector<std::string> const& words)
{
    std::vector<std::string> arguments;
    bool isBehindDashes = false;
    for (std::size_t i = 1; i < words.size(); ++i) {
        std::string const& argument = words[i];
        if (argument == "--" && !isBehindDashes) {
            isBehindDashes = true;
        } else {
            arguments.push_back(isBehindDashes ? kMark + argument : marked(argument));
        }
    }
    std::reverse(arguments.begin(), arguments.end());
    return arguments;
}

std::string complaint(CLI::App const& app, CLI::ParseError const& error)
{
    std::vector<std::string> const surplus = app.remaining();
    bool const isUnknownCommand = app.get_subcommands().empty() && !surplus.empty();
    std::string what = isUnknownCommand ? "There is no command '" + surplus.front() + "'" : error.what();
    what.erase(std::remove(what.begin(), what.end(), kMark), what.end());
    return what;
}

bool isWithoutCommand(CLI::App const& app, CLI::ParseError const& error)
{
    bool const isMissing = error.get_exit_code() == static_cast<int>(CLI::ExitCodes::RequiredError);
    return isMissing && app.get_subcommands().empty() && app.remaining().empty();
}

bool endsWith(std::string const& text, std::string const& end)
{
    return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
}

/// The argument that begins with a dash, and is not an option. The parser leaves only the letters of it that it does
/// not know.
std::optional<std::string> unknownOption(CLI::App const& app, std::vector<std::string> const& words)
{
    for (std::string const& rest : app.remaining(true)) {
        auto const word = std::find_if(words.begin(), words.end(), [&](std::string const& each) {
            return each.size() > 1 && each.front() == '-' && rest.rfind('-', 0) == 0 && endsWith(each, rest.substr(1));
        });
        if (word != words.end()) {
            return *word;
        }
    }
    return std::nullopt;
}

std::string adviceAfter(CLI::App const& app, std::vector<std::string> const& words)
{
    std::string const help = "Run '" + chosenCommand(app) + " --help' to see how it is used.";
    auto const option = app.get_subcommands().empty() ? std::nullopt : unknownOption(app, words);
    return option ? help + " Write './" + *option + "', or '--' before it, for a name that begins with '-'." : help;
}

/// Runs the command, or prints the help that was asked for.
void parse(CLI::App& app, std::vector<std::string> const& words)
{
    try {
        app.parse(markedArguments(words));
        followMovedProject();
    } catch (CLI::Success const& wish) {
        if (app.get_subcommands().empty() && !app.remaining().empty()) {
            throw CLI::ExtrasError(app.remaining());
        }
        std::ostringstream help;
        app.exit(wish, help, help);
        print(help.str());
    }
}

void enterFolder(std::string const& folder)
{
    if (chdir(folder.c_str()) == -1) {
        throw Failure("The folder '" + folder + "' cannot be entered.", "Check its name and your permissions for it.");
    }
}

std::optional<std::size_t> wordsBehindDashes(std::vector<std::string> const& words)
{
    auto const dashes = std::find(words.begin(), words.end(), "--");
    return dashes == words.end() ? std::nullopt : std::optional(static_cast<std::size_t>(words.end() - dashes) - 1);
}

/// Help that shows what the user types, and nothing of how it is read.
class HelpFormatter final : public CLI::Formatter {
public:
    HelpFormatter()
    {
        label("Positionals", "Arguments");
        label("SUBCOMMAND", "COMMAND");
    }

    /// Without the second blank line that a hidden group of options leaves.
    std::string make_help(CLI::App const* app, std::string name, CLI::AppFormatMode mode) const override
    {
        return CLI::detail::find_and_replace(CLI::Formatter::make_help(app, std::move(name), mode), "\n\n\n", "\n\n");
    }

    std::string make_option_opts(CLI::Option const* option) const override
    {
        if (option->get_positional()) {
            return option->get_expected_max() == CLI::detail::expected_max_vector_size ? "..." : "";
        }
        std::string const type = option->get_type_name(); // Behind a colon it has the names of the checks.
        return option->get_type_size() == 0 ? "" : " " + type.substr(0, type.find(':'));
    }
};

void prepareSyntax(CLI::App& app, std::optional<std::size_t> behindDashes)
{
    app.formatter(std::make_shared<HelpFormatter>()); // The commands inherit it when they are added.
    app.require_subcommand(1);
    app.set_help_flag("-h,--help", "Show this help and do nothing else");
    app.set_version_flag("--version", TAV_VERSION, "Show the version and do nothing else");
    app.add_option_function<std::string>("-C", enterFolder, "Work as if started in FOLDER")
        ->type_name("FOLDER")
        ->trigger_on_parse();
    addCommands(app, behindDashes);
    takeMarksOff(app);
    for (CLI::App* const command : app.get_subcommands({})) {
        command->group("Commands");
        takeMarksOff(*command);
        requirePaths(*command);
    }
}

/// "tav help log" is the same as "tav log --help".
std::vector<std::string> withHelpBehind(std::vector<std::string> words)
{
    if (words.size() > 1 && words[1] == "help") {
        words.erase(words.begin() + 1);
        words.emplace_back("--help");
    }
    return words;
}

int runCommand(CLI::App& app, std::vector<std::string> const& words)
{
    try {
        prepareSyntax(app, wordsBehindDashes(words));
        parse(app, words);
        if (!flushOutput()) {
            throw Failure("The output could not be written.", "Check the disk or the program that reads it.");
        }
        return kDone;
    } catch (CLI::ParseError const& error) {
        if (isWithoutCommand(app, error)) {
            printErrorText(app.help());
        } else {
            printError(complaint(app, error), adviceAfter(app, words));
        }
        return kMisused;
    } catch (Failure const& failure) {
        printError(failure.what, failure.next);
        for (std::string const& detail : failure.details) {
            printErrorDetail(detail);
        }
    } catch (OdError const& error) {
        printError(error.what(), "Check the file that the message speaks of.");
    } catch (std::bad_alloc const&) {
        printError("Out of memory.", "Close other programs and try again.");
    } catch (std::exception const& error) {
        printError(std::string("Internal error: ") + error.what(), "Please report it with the command that you ran.");
    }
    flushOutput();
    return kFailed;
}

} // namespace

int run(int argc, char** argv)
{
    prepareProcess();
    CLI::App app("Keeps the versions of a folder of drawings.", "tav");
    return runCommand(app, withHelpBehind(std::vector<std::string>(argv, argv + argc)));
}

} // namespace tav
