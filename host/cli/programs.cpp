#include "host/cli/programs.h"

#include "host/errors/failure.h"

#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <system_error>

namespace tav {

namespace {

/// What the new program gets of this one. The attributes are taken over as they are: none of these calls can fail
/// here but for lack of memory, and then starting fails too.
class Surroundings {
public:
    explicit Surroundings(int input)
    {
        posix_spawn_file_actions_init(&files_);
        posix_spawn_file_actions_adddup2(&files_, input, STDIN_FILENO);
        posix_spawnattr_init(&attributes_);
        sigset_t handled;
        sigemptyset(&handled);
        for (int const signal : {SIGINT, SIGQUIT, SIGPIPE, SIGXFSZ}) {
            sigaddset(&handled, signal);
        }
        posix_spawnattr_setsigdefault(&attributes_, &handled);
        posix_spawnattr_setflags(&attributes_, POSIX_SPAWN_SETSIGDEF);
    }
    Surroundings(Surroundings const&) = delete;
    Surroundings& operator=(Surroundings const&) = delete;
    ~Surroundings()
    {
        posix_spawn_file_actions_destroy(&files_);
        posix_spawnattr_destroy(&attributes_);
    }

    posix_spawn_file_actions_t const* files() const { return &files_; }
    posix_spawnattr_t const* attributes() const { return &attributes_; }

private:
    posix_spawn_file_actions_t files_{};
    posix_spawnattr_t attributes_{};
};

class KeysIgnored {
public:
    KeysIgnored() : interrupt_(std::signal(SIGINT, SIG_IGN)), quit_(std::signal(SIGQUIT, SIG_IGN)) {}
    KeysIgnored(KeysIgnored const&) = delete;
    KeysIgnored& operator=(KeysIgnored const&) = delete;
    ~KeysIgnored()
    {
        std::signal(SIGINT, interrupt_);
        std::signal(SIGQUIT, quit_);
    }

private:
    using Handler = void (*)(int);

    Handler interrupt_;
    Handler quit_;
};

} // namespace

pid_t startProgram(std::vector<std::string> const& words, int input)
{
    std::vector<char*> arguments;
    for (std::string const& word : words) {
        arguments.push_back(const_cast<char*>(word.c_str()));
    }
    arguments.push_back(nullptr);
    Surroundings const surroundings(input);
    pid_t program = -1;
    int const error = posix_spawnp(
        &program, arguments[0], surroundings.files(), surroundings.attributes(), arguments.data(), environ);
    if (error != 0) {
        throw Failure(
            "'" + words[0] + "' cannot be started: " + std::generic_category().message(error) + ".",
            "Install it, or name another program with 'tav config'.");
    }
    return program;
}

int waitFor(pid_t program)
{
    int status = 0;
    while (waitpid(program, &status, 0) == -1 && errno == EINTR) {
    }
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

int runProgram(std::vector<std::string> const& words)
{
    KeysIgnored const whileItRuns;
    return waitFor(startProgram(words, STDIN_FILENO));
}

} // namespace tav
