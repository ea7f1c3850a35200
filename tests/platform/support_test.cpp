#include "platform/os/os_calls.h"
#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/small_stack.h"
#include "tests/support/temp_folder.h"

#include <array>
#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <pthread.h>
#include <stdexcept>
#include <sys/stat.h>
#include <unistd.h>

namespace {

using support::asOrdinaryUser;
using support::FailingCall;
using support::TempFolder;
using testing::ElementsAre;

TEST(TempFolder, IsGoneAfterwardsWithAllThatIsInIt)
{
    std::string path;
    {
        TempFolder const folder;
        path = folder.path();
        folder.write("a/b/file", "content");
        folder.makeLink("link", "/");
        ASSERT_EQ(chmod(folder.pathTo("a/b").c_str(), 0), 0);
        ASSERT_EQ(chmod(folder.pathTo("a").c_str(), 0), 0);
        EXPECT_EQ(access(path.c_str(), F_OK), 0);
    }
    EXPECT_EQ(access(path.c_str(), F_OK), -1);
    EXPECT_EQ(access("/etc", F_OK), 0);
}

TEST(TempFolder, ListsEverythingBelowIt)
{
    TempFolder const folder;
    folder.write("b/.hidden", "");
    folder.write("a", "");
    folder.makeLink("link", "b");
    EXPECT_THAT(folder.list(), ElementsAre("a", "b/", "b/.hidden", "link"));
    EXPECT_TRUE(folder.has("link"));
    EXPECT_FALSE(folder.has("c"));
    EXPECT_EQ(folder.widePathTo("a").ansi_str(), folder.path() + "/a");
}

TEST(AsOrdinaryUser, HasNoRightsOfTheAdministrator)
{
    EXPECT_NE(asOrdinaryUser([] { return std::to_string(geteuid()); }), "0");
    EXPECT_EQ(asOrdinaryUser([] { return access("/", W_OK) == 0 ? "may write" : "may not write"; }), "may not write");
}

TEST(AsOrdinaryUser, SaysHowTheChildEnded)
{
    EXPECT_EQ(asOrdinaryUser([] { return std::string(1'000'000, 'x'); }).size(), 1'000'000U);
    EXPECT_EQ(asOrdinaryUser([]() -> std::string { throw std::runtime_error("lost"); }), "exception: lost");
    EXPECT_EQ(
        asOrdinaryUser([] {
            std::raise(SIGKILL);
            return "";
        }),
        "the child was ended by signal 9");
    EXPECT_EQ(asOrdinaryUser([]() -> std::string { _exit(3); }), "the child ended with exit code 3");
}

TEST(FailingCall, FailsTheNthCallAndNoOther)
{
    int const folder = open("/", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    {
        FailingCall const failing(1, ENOSPC);
        EXPECT_NE(os::calls().fsync(folder), -2);
        EXPECT_FALSE(failing.hasFailed());
        EXPECT_EQ(failing.name(), "no call");
        errno = 0;
        EXPECT_EQ(os::calls().openat(AT_FDCWD, "/", O_RDONLY, 0), -1);
        EXPECT_EQ(errno, ENOSPC);
        EXPECT_TRUE(failing.hasFailed());
        EXPECT_EQ(failing.name(), "1: openat");
        int const second = os::calls().openat(AT_FDCWD, "/", O_RDONLY, 0);
        EXPECT_NE(second, -1);
        close(second);
    }
    FailingCall const failing(0, EIO);
    EXPECT_EQ(os::calls().close(folder), -1);
    EXPECT_EQ(failing.name(), "0: close");
    EXPECT_EQ(fcntl(folder, F_GETFD), -1) << "a close that fails closes all the same";
}

TEST(FailingCall, CountsCalls)
{
    EXPECT_EQ(support::countCalls([] {}), 0);
    EXPECT_EQ(
        support::countCalls([] {
            int const folder = os::calls().openat(AT_FDCWD, "/", O_RDONLY | O_CLOEXEC, 0);
            os::calls().close(folder);
        }),
        2);
}

TEST(OnSmallStack, RunsTheBodyOnASmallStack)
{
    std::size_t size = 0;
    support::onSmallStack([&] {
        pthread_attr_t attributes;
        ASSERT_EQ(pthread_getattr_np(pthread_self(), &attributes), 0);
        pthread_attr_getstacksize(&attributes, &size);
        pthread_attr_destroy(&attributes);
    });
    EXPECT_THAT(size, testing::AnyOf(256U * 1024, 1024U * 1024));
}

} // namespace
