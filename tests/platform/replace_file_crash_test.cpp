#include "kept_calls.h"

#include "platform/os/os_files.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <chrono>
#include <csignal>
#include <fcntl.h>
#include <filesystem>
#include <functional>
#include <gmock/gmock.h>
#include <random>
#include <sys/resource.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace {

using support::FailingCall;
using support::TempFolder;
using testing::AnyOf;
using testing::ElementsAre;
using testing::Eq;

// Runs the body in a child process; how the child ended, as `waitpid` says it. The body returns the exit code.
int inChild(std::function<int()> const& body)
{
    pid_t const child = fork();
    if (child == 0) {
        _exit(body());
    }
    int status = -1;
    EXPECT_EQ(waitpid(child, &status, 0), child);
    return status;
}

std::ptrdiff_t openHandles()
{
    std::filesystem::directory_iterator const handles("/proc/self/fd");
    return std::distance(begin(handles), end(handles));
}

int openWithoutUnnamedFiles(int parent, char const* path, int flags, mode_t mode)
{
    errno = EOPNOTSUPP;
    return (flags & O_TMPFILE) == O_TMPFILE ? -1 : KeptCalls::real.openat(parent, path, flags, mode);
}

// Both ways of writing: through a file that has no name at first, and through a named one.
class ReplaceFileCrash : public testing::TestWithParam<bool> {
protected:
    void SetUp() override
    {
        if (GetParam()) {
            os::calls().openat = openWithoutUnnamedFiles;
        }
    }

    static std::string const& oldContent()
    {
        static std::string const content(100'000, 'o');
        return content;
    }

    static std::string const& newContent()
    {
        static std::string const content(200'000, 'n');
        return content;
    }

    std::error_code replace() const { return os::replaceFile(folder_.pathTo("plan.dwg"), newContent()); }

    KeptCalls const kept_;
    TempFolder const folder_;
};

INSTANTIATE_TEST_SUITE_P(Ways, ReplaceFileCrash, testing::Bool(), [](auto const& way) {
    return way.param ? "Named" : "Unnamed";
});

TEST_P(ReplaceFileCrash, LeavesOldOrNewContentWholeWhicheverCallFailsAndHowever)
{
    for (int const error :
         {EACCES, EAGAIN, EDQUOT, EEXIST, EFBIG, EINVAL, EIO, EMFILE, ENOENT, ENOSPC, EOPNOTSUPP, EPERM, EROFS}) {
        bool more = true;
        for (int n = 0; more; ++n) {
            folder_.write("plan.dwg", oldContent());
            std::ptrdiff_t const handles = openHandles();
            FailingCall const failing(n, error);
            std::error_code const result = replace();
            SCOPED_TRACE(failing.name() + " with error " + std::to_string(error));
            std::string const content = folder_.read("plan.dwg");
            EXPECT_TRUE(content == newContent() || (result && content == oldContent()));
            EXPECT_THAT(folder_.list(), ElementsAre("plan.dwg"));
            EXPECT_EQ(openHandles(), handles);
            more = failing.hasFailed();
        }
    }
}

TEST_P(ReplaceFileCrash, MakesTheFileOrNothingWhicheverCallFails)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        FailingCall const failing(n, ENOSPC);
        std::error_code const result = replace();
        SCOPED_TRACE(failing.name());
        if (folder_.has("plan.dwg")) {
            EXPECT_EQ(folder_.read("plan.dwg"), newContent());
            ASSERT_EQ(unlink(folder_.pathTo("plan.dwg").c_str()), 0);
        } else {
            EXPECT_TRUE(result);
        }
        EXPECT_THAT(folder_.list(), testing::IsEmpty());
        more = failing.hasFailed();
    }
}

TEST_P(ReplaceFileCrash, GoesOnWhicheverCallIsInterrupted)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        folder_.write("plan.dwg", oldContent());
        folder_.write(".plan.dwg.1-0.tmp", "half");
        FailingCall const failing(n, EINTR);
        EXPECT_EQ(replace(), std::error_code()) << failing.name();
        EXPECT_EQ(folder_.read("plan.dwg"), newContent()) << failing.name();
        more = failing.hasFailed();
    }
}

TEST_P(ReplaceFileCrash, LeavesOldOrNewContentWholeInWhicheverCallTheProcessDies)
{
    int status = 0;
    int kills = 0;
    for (int n = 0; !WIFEXITED(status) || n == 0; ++n) {
        folder_.write("plan.dwg", oldContent());
        status = inChild([&] {
            FailingCall const failing(n, FailingCall::kKillProcess);
            return replace() ? 1 : 0;
        });
        SCOPED_TRACE(n);
        kills += WIFSIGNALED(status) ? 1 : 0;
        EXPECT_THAT(folder_.read("plan.dwg"), AnyOf(oldContent(), newContent()));
        EXPECT_EQ(replace(), std::error_code());
        EXPECT_EQ(folder_.read("plan.dwg"), newContent());
        EXPECT_THAT(folder_.list(), ElementsAre("plan.dwg"));
    }
    EXPECT_EQ(status, 0);
    EXPECT_GT(kills, 10);
}

TEST_P(ReplaceFileCrash, LeavesOldOrNewContentWholeWheneverTheProcessIsKilled)
{
    std::mt19937 random(20'240'305);
    std::uniform_int_distribution<int> microseconds(0, 5000);
    folder_.write("plan.dwg", oldContent());
    for (int round = 0; round < 50; ++round) {
        pid_t const writer = fork();
        if (writer == 0) {
            for (int i = 0;; ++i) {
                static_cast<void>(
                    os::replaceFile(folder_.pathTo("plan.dwg"), i % 2 == 0 ? newContent() : oldContent()));
            }
        }
        std::this_thread::sleep_for(std::chrono::microseconds(microseconds(random)));
        kill(writer, SIGKILL);
        waitpid(writer, nullptr, 0);
        ASSERT_THAT(folder_.read("plan.dwg"), AnyOf(oldContent(), newContent())) << "round " << round;
        ASSERT_EQ(replace(), std::error_code()) << "round " << round;
        ASSERT_THAT(folder_.list(), ElementsAre("plan.dwg")) << "round " << round;
    }
}

TEST_P(ReplaceFileCrash, LeavesTheOldContentWholeWhenTheDiskFillsUp)
{
    for (std::size_t const room : {0U, 1U, 4096U, 150'000U}) {
        folder_.write("plan.dwg", oldContent());
        int const status = inChild([&] {
            std::signal(SIGXFSZ, SIG_IGN);
            rlimit const limit{room, room};
            if (setrlimit(RLIMIT_FSIZE, &limit) != 0) {
                return 2;
            }
            return replace() == std::error_code(EFBIG, std::generic_category()) ? 0 : 1;
        });
        EXPECT_EQ(status, 0) << room;
        EXPECT_EQ(folder_.read("plan.dwg"), oldContent()) << room;
        EXPECT_THAT(folder_.list(), ElementsAre("plan.dwg")) << room;
    }
}

TEST_P(ReplaceFileCrash, LetsTwoProcessesReplaceOneFileAtTheSameTime)
{
    std::string const path = folder_.pathTo("plan.dwg");
    folder_.write("plan.dwg", oldContent());
    auto const startWriter = [&](std::string const& content) {
        pid_t const writer = fork();
        if (writer == 0) {
            for (int round = 0; round < 200; ++round) {
                if (os::replaceFile(path, content)) {
                    _exit(1);
                }
            }
            _exit(0);
        }
        return writer;
    };
    std::vector<pid_t> writers{startWriter(oldContent()), startWriter(newContent())};
    while (!writers.empty()) {
        std::string content;
        ASSERT_EQ(os::readFile(path, content), std::error_code());
        EXPECT_TRUE(content == oldContent() || content == newContent());
        int status = 0;
        if (waitpid(writers.back(), &status, WNOHANG) == writers.back()) {
            EXPECT_EQ(status, 0);
            writers.pop_back();
        }
    }
    EXPECT_THAT(folder_.list(), ElementsAre("plan.dwg"));
}

} // namespace
