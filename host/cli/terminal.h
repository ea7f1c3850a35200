/// The terminal that a command runs on, and what the user has said about it.
#pragma once

#include <optional>
#include <string>

namespace tav {

/// Options that every command has.
struct TerminalOptions {
    std::string colour; ///< "auto", "always" or "never"; empty: as the settings say
    bool isQuiet = false;
    bool hasPager = true;
    bool asksNothing = false;
};

/// Those of the running command.
TerminalOptions& terminalOptions();

/// Whether people see what is printed. Decided once, before a pager comes in between.
bool isTerminal();
/// Whether somebody is there to answer, and wants to be asked.
bool canAsk();

/// Asks `question` on the error stream. None when the input ends.
std::optional<std::string> ask(std::string const& question);

} // namespace tav
