#include "host/cli/pager.h"

#include "host/cli/current_settings.h"
#include "host/cli/output.h"
#include "host/cli/programs.h"

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <csignal>
#include <cstdlib>
#include <string>

namespace tav {

namespace {

volatile sig_atomic_t runningPager = -1; // The handler has no other way to know it.

/// The user has left the pager, or has pressed Ctrl-C while it may still be reading keys.
extern "C" void endWithPager(int /*signal*/)
{
    close(STDOUT_FILENO);
    waitpid(runningPager, nullptr, 0);
    _exit(0);
}

/// The command to run; empty for none. The usual one may not be installed.
std::string pagerCommand()
{
    char const* const terminal = std::getenv("TERM");
    if (!terminalOptions().hasPager || !isTerminal() || !terminal || terminal == std::string("dumb")) {
        return {};
    }
    SettingEntry const pager = currentSettings().effective("pager");
    bool const isOff = pager.value.empty() || pager.value == "cat";
    return isOff                              ? ""
           : pager.origin == Origin::standard ? "command -v less >/dev/null && exec less || exec cat"
                                              : pager.value;
}

} // namespace

Pager::Pager()
{
    std::string const command = pagerCommand();
    if (!command.empty()) {
        start(command.c_str());
    }
}

void Pager::start(char const* command)
{
    std::array<int, 2> ends{};
    if (pipe2(ends.data(), O_CLOEXEC) == -1) {
        return; // It is shown all the same.
    }
    isTerminal(); // Before standard output is none any more.
    flushOutput();
    setenv("LESS", "FRX", 0);
    terminal_ = fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, 3);
    runningPager = startProgram({"sh", "-c", command}, ends[0]);
    std::signal(SIGPIPE, endWithPager);
    std::signal(SIGINT, endWithPager);
    dup2(ends[1], STDOUT_FILENO);
    close(ends[0]);
    close(ends[1]);
}

Pager::~Pager()
{
    if (terminal_ == -1) {
        return;
    }
    flushOutput();
    dup2(terminal_, STDOUT_FILENO); // The pager reads the end.
    close(terminal_);
    waitFor(runningPager);
    std::signal(SIGPIPE, SIG_DFL);
    std::signal(SIGINT, SIG_DFL);
}

} // namespace tav
