#include "platform/os/os_lock.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <chrono>
#include <gmock/gmock.h>
#include <string>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>
#include <utility>

namespace {

using std::chrono::milliseconds;
using support::FailingCall;
using support::TempFolder;

std::error_code fails(int error)
{
    return {error, std::generic_category()};
}

std::error_code acquire(os::FileLock& lock, TempFolder const& folder, std::string const& note)
{
    return lock.acquire(folder.pathTo("lock"), note, milliseconds(0));
}

TEST(FileLock, IsHeldOnceAndTellsByWhom)
{
    TempFolder const folder;
    EXPECT_EQ(os::FileLock::holder(folder.pathTo("lock")), "");
    os::FileLock first;
    os::FileLock second;
    EXPECT_EQ(acquire(first, folder, "the first, whose note is long"), std::error_code());
    EXPECT_EQ(acquire(second, folder, "the second"), fails(EWOULDBLOCK));
    EXPECT_EQ(os::FileLock::holder(folder.pathTo("lock")), "the first, whose note is long");
    {
        os::FileLock const gone = std::move(first);
    }
    EXPECT_EQ(acquire(second, folder, "the second"), std::error_code());
    EXPECT_EQ(os::FileLock::holder(folder.pathTo("lock")), "the second");
}

TEST(FileLock, MovesWithItsOwner)
{
    TempFolder const folder;
    os::FileLock lock;
    {
        os::FileLock first;
        ASSERT_EQ(acquire(first, folder, "the first"), std::error_code());
        lock = std::move(first);
    }
    os::FileLock second;
    EXPECT_EQ(acquire(second, folder, "the second"), fails(EWOULDBLOCK));
}

TEST(FileLock, LeavesItsFile)
{
    TempFolder const folder;
    {
        os::FileLock lock;
        ASSERT_EQ(acquire(lock, folder, "somebody"), std::error_code());
    }
    EXPECT_EQ(folder.read("lock"), "somebody\n");
}

TEST(FileLock, FollowsNoLinkAndWaitsForNoPipe)
{
    TempFolder const folder;
    folder.write("target", "kept");
    folder.makeLink("lock", "target");
    os::FileLock lock;
    EXPECT_EQ(acquire(lock, folder, "somebody"), fails(ELOOP));
    EXPECT_EQ(folder.read("target"), "kept");
    ASSERT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    EXPECT_EQ(lock.acquire(folder.pathTo("pipe"), "somebody", milliseconds(0)), fails(ENOTSUP));
}

TEST(FileLock, WritesNothingIntoAFileWithOtherNames)
{
    TempFolder const folder;
    folder.write("target", "kept");
    ASSERT_EQ(link(folder.pathTo("target").c_str(), folder.pathTo("lock").c_str()), 0);
    os::FileLock lock;
    EXPECT_EQ(acquire(lock, folder, "somebody"), fails(EMLINK));
    EXPECT_EQ(folder.read("target"), "kept");
}

TEST(FileLock, IsHeldOnAFullDiskToo)
{
    TempFolder const folder;
    os::FileLock lock;
    {
        FailingCall const failing(2, ENOSPC);
        EXPECT_EQ(acquire(lock, folder, "somebody"), std::error_code());
        EXPECT_EQ(failing.name(), "2: write");
    }
    os::FileLock second;
    EXPECT_EQ(acquire(second, folder, "the second"), fails(EWOULDBLOCK));
}

TEST(FileLock, SaysWhyItIsNotHeld)
{
    TempFolder const folder;
    os::FileLock lock;
    EXPECT_EQ(lock.acquire(folder.pathTo("nowhere/lock"), "somebody", milliseconds(0)), fails(ENOENT));
    for (int n : {0, 1}) {
        FailingCall const failing(n, ENOLCK);
        EXPECT_EQ(acquire(lock, folder, "somebody"), fails(ENOLCK)) << failing.name();
    }
    os::FileLock second;
    EXPECT_EQ(acquire(second, folder, "the second"), std::error_code());
}

} // namespace
