// Writers that are killed and disks that fill up: the state file is the old one or the new one, whole.
#include "tests/state/generations.h"

#include "tests/support/failing_call.h"
#include "tests/support/sanitized.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <fstream>
#include <functional>
#include <gmock/gmock.h>
#include <iostream>
#include <random>
#include <sched.h>
#include <string>
#include <sys/mount.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace {

using namespace states;
using support::FailingCall;
using testing::ElementsAre;

/// Runs `body`, which returns the exit code, in a child process.
pid_t startChild(std::function<int()> const& body)
{
    std::fflush(nullptr);
    pid_t const child = fork();
    if (child == 0) {
        int code = 100;
        try {
            code = body();
        } catch (std::exception const& error) {
            std::fprintf(stderr, "child: %s\n", error.what());
        }
        std::fflush(nullptr);
        _exit(code);
    }
    return child;
}

/// How the child ended, as `waitpid` says it.
int endOf(pid_t child)
{
    int status = -1;
    EXPECT_EQ(waitpid(child, &status, 0), child);
    return status;
}

class Crash : public testing::Test {
protected:
    Crash() : repository_(documentOf(0)) {}

    /// The state loads and is one of the whole documents, not an older one than `before`; which one.
    std::uint64_t expectWhole(std::uint64_t before) const
    {
        std::uint64_t const now = generationOf(repository_);
        EXPECT_GE(now, before);
        EXPECT_EQ(repository_.stateFile(), documentOf(now));
        return now;
    }

    /// The next saving works, and no file is left that was none of ours before.
    void expectTidyAfterOneMoreSaving(std::uint64_t before) const
    {
        EXPECT_TRUE(rewrite(repository_));
        EXPECT_EQ(expectWhole(before), before + 1);
        EXPECT_THAT(repository_.list(), ElementsAre(".tav/", ".tav/tav.state"));
    }

    /// Of one rewriting here and now.
    std::chrono::microseconds duration() const
    {
        constexpr int kTimes = 10;
        auto const begin = std::chrono::steady_clock::now();
        for (int i = 0; i < kTimes; ++i) {
            EXPECT_TRUE(rewrite(repository_));
        }
        return std::chrono::duration_cast<std::chrono::microseconds>(std::chrono::steady_clock::now() - begin) / kTimes;
    }

    Repository const repository_;
};

TEST_F(Crash, LeavesAWholeStateWheneverTheWriterIsKilled)
{
    constexpr int kKills = support::kIsSanitized ? 50 : 500;
    auto const longest = std::clamp<std::chrono::microseconds>(
        2 * duration(), std::chrono::milliseconds(2), std::chrono::milliseconds(100));
    std::mt19937 random(20'240'305);
    std::uniform_int_distribution<std::chrono::microseconds::rep> delay(0, longest.count());
    std::uint64_t number = expectWhole(0);
    int killed = 0;
    for (int round = 0; round < kKills; ++round) {
        pid_t const writer = startChild([&] {
            while (rewrite(repository_)) {
            }
            return 1;
        });
        std::this_thread::sleep_for(std::chrono::microseconds(delay(random)));
        ASSERT_EQ(kill(writer, SIGKILL), 0);
        int const end = endOf(writer);
        killed += WIFSIGNALED(end) ? 1 : 0;
        ASSERT_NO_THROW(number = expectWhole(number)) << "round " << round;
        ASSERT_FALSE(HasFailure()) << "round " << round;
    }
    EXPECT_EQ(killed, kKills) << "a writer gave up by itself";
    EXPECT_GT(number, 10U) << "hardly a writer got through";
    expectTidyAfterOneMoreSaving(number);
}

TEST_F(Crash, LeavesAWholeStateInWhicheverCallTheWriterDies)
{
    std::uint64_t number = 0;
    int kills = 0;
    int end = -1;
    for (int n = 0; !WIFEXITED(end); ++n) {
        end = endOf(startChild([&] {
            FailingCall const failing(n, FailingCall::kKillProcess);
            return rewrite(repository_) ? 0 : 1;
        }));
        SCOPED_TRACE(n);
        kills += WIFSIGNALED(end) ? 1 : 0;
        number = expectWhole(number);
        expectTidyAfterOneMoreSaving(number);
        ++number;
    }
    EXPECT_EQ(WEXITSTATUS(end), 0);
    EXPECT_GT(kills, 10);
}

TEST_F(Crash, LosesNoStateInWhicheverCallTheMakerDies)
{
    int kills = 0;
    int end = -1;
    for (int n = 0; !WIFEXITED(end); ++n) {
        unlink(repository_.statePath().c_str());
        end = endOf(startChild([&] {
            FailingCall const failing(n, FailingCall::kKillProcess);
            Cache::create(repository_.root(), repository_.io());
            return 0;
        }));
        SCOPED_TRACE(n);
        kills += WIFSIGNALED(end) ? 1 : 0;
        Cache::create(repository_.root(), repository_.io());
        EXPECT_EQ(repository_.loaded(), "HEAD master\n");
        repository_.open()->write();
        EXPECT_THAT(repository_.list(), ElementsAre(".tav/", ".tav/tav.state"));
    }
    EXPECT_EQ(WEXITSTATUS(end), 0);
    EXPECT_GT(kills, 5);
}

/// A number of bytes that ends a saving somewhere, for each of `rounds` rounds: spread over the whole document.
std::size_t roomIn(int round, int rounds)
{
    return documentOf(0).size() * static_cast<std::size_t>(round) / static_cast<std::size_t>(rounds);
}

/// What must hold after a saving on a disk with too little room; says what does not.
std::string complaintAfterFailure(Repository const& repository, std::size_t callsBefore)
{
    std::vector<std::string> const& calls = repository.calls();
    if (calls.size() != callsBefore + 1 || calls.back() != unwritable(repository)) {
        return "not exactly one report of an error";
    }
    if (repository.stateFile() != documentOf(0) || generationOf(repository) != 0) {
        return "not the old state";
    }
    std::vector<std::string> names = repository.list();
    names.erase(std::remove(names.begin(), names.end(), ".tav/filler"), names.end());
    return names == std::vector<std::string>{".tav/", ".tav/tav.state"} ? "" : "a stray file";
}

constexpr int kFillings = 50;

/// Each round leaves other room on the disk, by `limitRoom`. Tells the parent by exit code.
int saveOnFullDisks(Repository const& repository, std::function<bool(std::size_t)> const& limitRoom)
{
    for (int round = 0; round < kFillings; ++round) {
        if (!limitRoom(roomIn(round, kFillings))) {
            std::fprintf(stderr, "round %d: cannot fill the disk: %s\n", round, std::strerror(errno));
            return 1;
        }
        std::size_t const calls = repository.calls().size();
        rewrite(repository);
        std::string const complaint = complaintAfterFailure(repository, calls);
        if (!complaint.empty()) {
            std::fprintf(stderr, "round %d: %s\n", round, complaint.c_str());
            return 1;
        }
    }
    return 0;
}

bool writeWhole(char const* path, std::string const& text)
{
    int const file = open(path, O_WRONLY | O_CLOEXEC);
    bool const done = file != -1 && write(file, text.data(), text.size()) == static_cast<ssize_t>(text.size());
    close(file);
    return done;
}

/// Gives this process mounts of its own: the administrator's right, or that of everybody in a user namespace.
bool enterNamespace()
{
    uid_t const user = geteuid();
    gid_t const group = getegid();
    if (unshare(CLONE_NEWNS) != 0) {
        if (unshare(CLONE_NEWUSER | CLONE_NEWNS) != 0) {
            return false;
        }
        writeWhole("/proc/self/setgroups", "deny");
        if (!writeWhole("/proc/self/uid_map", "0 " + std::to_string(user) + " 1") ||
            !writeWhole("/proc/self/gid_map", "0 " + std::to_string(group) + " 1")) {
            return false;
        }
    }
    return mount("none", "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0;
}

constexpr std::size_t kDisk = 160 * 1024;

/// Puts a small file system, gone with this process, in the place of ".tav".
bool mountSmallDisk(Repository const& repository)
{
    std::string const options = "size=" + std::to_string(kDisk) + ",mode=0700";
    return enterNamespace() &&
           mount("tmpfs", repository.pathTo(".tav").c_str(), "tmpfs", MS_NOSUID | MS_NODEV, options.c_str()) == 0;
}

/// Fills the disk under ".tav" up, leaving `room` bytes.
bool fillDisk(Repository const& repository, std::size_t room)
{
    int const file = open(repository.pathTo(".tav/filler").c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
    std::array<char, 4096> const block{};
    std::size_t size = 0;
    for (ssize_t written = 0; (written = write(file, block.data(), block.size())) > 0;) {
        size += static_cast<std::size_t>(written);
    }
    bool const filled = errno == ENOSPC && size > room;
    bool const done = filled && ftruncate(file, static_cast<off_t>(size - room)) == 0;
    close(file);
    return done;
}

constexpr int kNoNamespace = 77;

int saveOnSmallDisk(Repository const& repository)
{
    if (!mountSmallDisk(repository)) {
        return kNoNamespace;
    }
    repository.writeState(documentOf(0));
    int const result = saveOnFullDisks(repository, [&](std::size_t room) { return fillDisk(repository, room); });
    if (result != 0) {
        return result;
    }
    unlink(repository.pathTo(".tav/filler").c_str());
    return rewrite(repository) && generationOf(repository) == 1 && repository.list().size() == 2 ? 0 : 2;
}

/// Files may not grow beyond `room`, as if the disk ended there.
bool limitFiles(std::size_t room)
{
    std::signal(SIGXFSZ, SIG_IGN);
    rlimit limit{};
    getrlimit(RLIMIT_FSIZE, &limit);
    limit.rlim_cur = room;
    return setrlimit(RLIMIT_FSIZE, &limit) == 0;
}

int saveUnderLimits(Repository const& repository)
{
    int const result = saveOnFullDisks(repository, limitFiles);
    rlimit limit{};
    getrlimit(RLIMIT_FSIZE, &limit);
    limit.rlim_cur = limit.rlim_max;
    setrlimit(RLIMIT_FSIZE, &limit);
    return result != 0 ? result : rewrite(repository) && generationOf(repository) == 1 ? 0 : 2;
}

TEST_F(Crash, LeavesTheOldStateWholeOn50FullDisks)
{
    int end = endOf(startChild([&] { return saveOnSmallDisk(repository_); }));
    bool const hasNamespaces = !WIFEXITED(end) || WEXITSTATUS(end) != kNoNamespace;
    if (!hasNamespaces) {
        end = endOf(startChild([&] { return saveUnderLimits(repository_); }));
    }
    std::cout << "disk: " << (hasNamespaces ? "small file system" : "limited size of files") << "\n";
    EXPECT_EQ(end, 0);
}

TEST_F(Crash, LeavesTheOldStateWholeUnder50LimitsOfFiles)
{
    EXPECT_EQ(endOf(startChild([&] { return saveUnderLimits(repository_); })), 0);
    EXPECT_EQ(expectWhole(0), 1U);
    EXPECT_THAT(repository_.list(), ElementsAre(".tav/", ".tav/tav.state"));
}

TEST_F(Crash, IsNeverSeenByAReaderWhoPollsDuring1000Rewritings)
{
    constexpr std::uint64_t kTimes = 1000;
    pid_t const writer = startChild([&] {
        for (std::uint64_t i = 0; i < kTimes; ++i) {
            if (!rewrite(repository_)) {
                return 1;
            }
        }
        return 0;
    });
    std::uint64_t number = 0;
    int status = 0;
    pid_t ended = 0;
    while ((ended = waitpid(writer, &status, WNOHANG)) == 0) {
        ASSERT_NO_THROW(number = std::max(number, generationOf(repository_)));
    }
    EXPECT_EQ(ended, writer);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(expectWhole(number), kTimes);
    EXPECT_THAT(repository_.list(), ElementsAre(".tav/", ".tav/tav.state"));
}

} // namespace
