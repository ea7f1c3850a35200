#include "tests/support/as_ordinary_user.h"

#include <array>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <grp.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace support {
namespace {

constexpr uid_t kNobody = 65534;

void require(bool succeeded, char const* step)
{
    if (!succeeded) {
        std::perror(step);
        std::abort();
    }
}

void giveUpRights()
{
    if (geteuid() != 0) {
        return;
    }
    require(setgroups(0, nullptr) == 0, "setgroups");
    require(setgid(kNobody) == 0, "setgid");
    require(setuid(kNobody) == 0, "setuid");
    // Changing the user shuts a process out of its own /proc/self/fd; one that was started as this user is not.
    require(prctl(PR_SET_DUMPABLE, 1) == 0, "prctl");
}

std::string saying(std::function<std::string()> const& body)
{
    try {
        return body();
    } catch (std::exception const& exception) {
        return std::string("exception: ") + exception.what();
    }
}

[[noreturn]] void runChild(std::function<std::string()> const& body, int answer)
{
    std::string const text = saying(body);
    std::size_t done = 0;
    while (done < text.size()) {
        ssize_t const written = write(answer, text.data() + done, text.size() - done);
        require(written > 0, "write");
        done += static_cast<std::size_t>(written);
    }
    _exit(0);
}

std::string readAll(int file)
{
    std::string text;
    std::array<char, 4096> buffer;
    ssize_t count = 0;
    while ((count = read(file, buffer.data(), buffer.size())) > 0) {
        text.append(buffer.data(), static_cast<std::size_t>(count));
    }
    return text;
}

} // namespace

std::string asOrdinaryUser(std::function<std::string()> const& body)
{
    return inOwnProcess([&] {
        giveUpRights();
        return body();
    });
}

std::string inOwnProcess(std::function<std::string()> const& body)
{
    std::array<int, 2> ends{};
    require(pipe(ends.data()) == 0, "pipe");
    pid_t const child = fork();
    require(child != -1, "fork");
    if (child == 0) {
        close(ends[0]);
        runChild(body, ends[1]);
    }
    close(ends[1]);
    std::string const answer = readAll(ends[0]);
    close(ends[0]);
    int status = 0;
    require(waitpid(child, &status, 0) == child, "waitpid");
    if (WIFSIGNALED(status)) {
        return "the child was ended by signal " + std::to_string(WTERMSIG(status));
    }
    return WEXITSTATUS(status) == 0 ? answer : "the child ended with exit code " + std::to_string(WEXITSTATUS(status));
}

} // namespace support
