#include "tests/host/run_tav.h"

#include "tests/support/temp_folder.h"

#include <array>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <ostream>
#include <poll.h>
#include <pty.h>
#include <sys/wait.h>
#include <termios.h>
#include <unistd.h>

namespace host_tests {
namespace {

void require(bool succeeded, char const* step)
{
    if (!succeeded) {
        std::perror(step);
        std::abort();
    }
}

/// Both ends of a pipe or of a terminal, the reading one first.
struct Channel {
    int reader = -1;
    int writer = -1;
};

Channel makePipe()
{
    std::array<int, 2> ends{};
    require(pipe2(ends.data(), O_CLOEXEC) == 0, "pipe2");
    return {ends[0], ends[1]};
}

Channel makeTerminal()
{
    Channel terminal;
    termios mode{};
    cfmakeraw(&mode); // Line feeds arrive as they were printed.
    require(openpty(&terminal.reader, &terminal.writer, nullptr, &mode, nullptr) == 0, "openpty");
    require(fcntl(terminal.reader, F_SETFD, FD_CLOEXEC) == 0, "fcntl");
    require(fcntl(terminal.writer, F_SETFD, FD_CLOEXEC) == 0, "fcntl");
    return terminal;
}

void moveTo(int file, int number)
{
    require(dup2(file, number) == number, "dup2");
}

void take(Setting const& setting, int in, int out, int err)
{
    moveTo(in != -1 ? in : open("/dev/null", O_RDONLY | O_CLOEXEC), STDIN_FILENO);
    moveTo(setting.outFile.empty() ? out : open(setting.outFile.c_str(), O_WRONLY | O_CLOEXEC), STDOUT_FILENO);
    moveTo(err, STDERR_FILENO);
    require(setting.folder.empty() || chdir(setting.folder.c_str()) == 0, "chdir");
    require(unsetenv("NO_COLOR") == 0, "unsetenv");
    require(setenv("HOME", home().c_str(), 1) == 0, "setenv");
    require(setenv("XDG_DATA_HOME", (home() + "/data").c_str(), 1) == 0, "setenv");
    require(setenv("XDG_CONFIG_HOME", (home() + "/config").c_str(), 1) == 0, "setenv");
    require(setenv("XDG_CACHE_HOME", (home() + "/cache").c_str(), 1) == 0, "setenv");
    require(setenv("TERM", "dumb", 1) == 0, "setenv"); // No pager comes in between, unless a test wants one.
    for (std::string const& variable : setting.environment) {
        std::size_t const end = variable.find('=');
        require(setenv(variable.substr(0, end).c_str(), variable.substr(end + 1).c_str(), 1) == 0, "setenv");
    }
}

int execute(std::string const& program, Arguments const& arguments)
{
    std::vector<char*> words = {const_cast<char*>(program.c_str())};
    for (std::string const& argument : arguments) {
        words.push_back(const_cast<char*>(argument.c_str()));
    }
    words.push_back(nullptr);
    execv(program.c_str(), words.data());
    std::perror(program.c_str());
    return 127;
}

/// Adds what has arrived; false at the end. A terminal whose writers are gone answers with an error.
bool readSome(int file, std::string& text)
{
    std::array<char, 65536> buffer;
    ssize_t const count = read(file, buffer.data(), buffer.size());
    if (count > 0) {
        text.append(buffer.data(), static_cast<std::size_t>(count));
    }
    return count > 0 || (count == -1 && errno == EINTR);
}

void readBoth(int out, int err, Outcome& outcome)
{
    std::array<pollfd, 2> files = {pollfd{out, POLLIN, 0}, pollfd{err, POLLIN, 0}};
    std::array<std::string*, 2> const texts = {&outcome.out, &outcome.err};
    while (files[0].fd != -1 || files[1].fd != -1) {
        require(poll(files.data(), files.size(), -1) != -1 || errno == EINTR, "poll");
        for (std::size_t i = 0; i < files.size(); ++i) {
            if (files[i].fd != -1 && files[i].revents != 0 && !readSome(files[i].fd, *texts[i])) {
                files[i].fd = -1;
            }
        }
    }
}

} // namespace

std::string const& home()
{
    static support::TempFolder const folder;
    return folder.path();
}

bool operator==(Outcome const& a, Outcome const& b)
{
    return a.code == b.code && a.out == b.out && a.err == b.err;
}

void PrintTo(Outcome const& outcome, std::ostream* stream)
{
    *stream << "code " << outcome.code << "\n--- out ---\n" << outcome.out << "--- err ---\n" << outcome.err << "---";
}

Outcome done(std::string const& out)
{
    return {0, out, ""};
}

Outcome failed(std::string const& err)
{
    return {1, "", err};
}

Outcome misused(std::string const& err)
{
    return {2, "", err};
}

Process::Process(Setting const& setting, Arguments const& arguments)
{
    start(setting, [&] { return execute(setting.program, arguments); });
}

Process::Process(Setting const& setting, std::function<int()> const& body)
{
    start(setting, body);
}

Process::~Process()
{
    if (!isReaped_) {
        send(SIGKILL);
        reap(0);
    }
    close(out_);
    close(err_);
    if (in_ != -1) {
        close(in_);
    }
}

void Process::start(Setting const& setting, std::function<int()> const& body)
{
    Channel const out = setting.isOnTerminal ? makeTerminal() : makePipe();
    Channel const err = setting.isOnTerminal ? makeTerminal() : makePipe();
    Channel const in = setting.input.empty() ? Channel() : makeTerminal();
    if (in.reader != -1) { // The end that a person sits at.
        auto const length = static_cast<ssize_t>(setting.input.size());
        require(write(in.reader, setting.input.data(), setting.input.size()) == length, "write");
    }
    std::fflush(nullptr);
    home(); // Made here, so that the child does not take it away.
    child_ = fork();
    require(child_ != -1, "fork");
    if (child_ == 0) {
        take(setting, in.writer, out.writer, err.writer);
        int const code = body();
        std::fflush(nullptr);
        _exit(code);
    }
    close(out.writer);
    close(err.writer);
    in_ = in.reader;
    if (in.writer != -1) {
        close(in.writer);
    }
    out_ = out.reader;
    err_ = err.reader;
}

bool Process::reap(int options)
{
    pid_t const reaped = waitpid(child_, &status_, options);
    require(reaped != -1, "waitpid");
    isReaped_ = reaped == child_;
    return isReaped_;
}

bool Process::isRunning()
{
    return !isReaped_ && !reap(WNOHANG);
}

void Process::send(int signal) const
{
    require(kill(child_, signal) == 0, "kill");
}

Outcome Process::wait()
{
    Outcome outcome{0, "", ""};
    readBoth(out_, err_, outcome);
    if (!isReaped_) {
        reap(0);
    }
    outcome.code = WIFSIGNALED(status_) ? -WTERMSIG(status_) : WEXITSTATUS(status_);
    return outcome;
}

Outcome run(Setting const& setting, Arguments const& arguments)
{
    return Process(setting, arguments).wait();
}

} // namespace host_tests
