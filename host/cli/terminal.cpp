#include "host/cli/terminal.h"

#include <unistd.h>

#include <cstdio>
#include <iostream>

namespace tav {

TerminalOptions& terminalOptions()
{
    static TerminalOptions options;
    return options;
}

bool isTerminal()
{
    static bool const is = isatty(STDOUT_FILENO) == 1;
    return is;
}

bool canAsk()
{
    return !terminalOptions().asksNothing && isatty(STDIN_FILENO) == 1 && isatty(STDERR_FILENO) == 1;
}

std::optional<std::string> ask(std::string const& question)
{
    std::fputs((question + " ").c_str(), stderr);
    std::string answer;
    if (!std::getline(std::cin, answer)) {
        std::fputs("\n", stderr);
        return std::nullopt;
    }
    return answer;
}

} // namespace tav
