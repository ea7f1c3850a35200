#include "platform/ut/File.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <filesystem>
#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

using support::FailingCall;
using support::TempFolder;
using ut::File;

std::string readFrom(File& file, std::size_t count)
{
    std::string bytes(count, '?');
    bytes.resize(file.read(bytes.data(), count));
    return bytes;
}

std::ptrdiff_t openHandles()
{
    std::filesystem::directory_iterator const handles("/proc/self/fd");
    return std::distance(begin(handles), end(handles));
}

TEST(File, NumberOfTheOpenModeIsFixed)
{
    EXPECT_EQ(static_cast<int>(File::kRead), 0);
}

TEST(File, ReadsItsBytes)
{
    TempFolder const folder;
    std::string const content("a\0b\r\n\xFF", 6);
    folder.write("plan.dwg", content);
    File file;
    ASSERT_TRUE(file.open(folder.widePathTo("plan.dwg"), File::kRead));
    EXPECT_EQ(file.length(), 6U);
    EXPECT_EQ(readFrom(file, 6), content);
}

TEST(File, ReadsOnWhereTheLastReadingEnded)
{
    TempFolder const folder;
    folder.write("plan.dwg", "abcdef");
    File file;
    ASSERT_TRUE(file.open(folder.widePathTo("plan.dwg"), File::kRead));
    EXPECT_EQ(readFrom(file, 2), "ab");
    EXPECT_EQ(readFrom(file, 0), "");
    EXPECT_EQ(file.length(), 6U);
    EXPECT_EQ(readFrom(file, 100), "cdef");
    EXPECT_EQ(readFrom(file, 100), "");
}

TEST(File, ReadsFromTheBeginningWhenOpenedAgain)
{
    TempFolder const folder;
    folder.write("first", "abc");
    folder.write("second", "xyz");
    File file;
    ASSERT_TRUE(file.open(folder.widePathTo("first"), File::kRead));
    EXPECT_EQ(readFrom(file, 1), "a");
    ASSERT_TRUE(file.open(folder.widePathTo("second"), File::kRead));
    EXPECT_EQ(readFrom(file, 3), "xyz");
}

TEST(File, OpensAnEmptyFile)
{
    TempFolder const folder;
    folder.write("empty", "");
    File file;
    ASSERT_TRUE(file.open(folder.widePathTo("empty"), File::kRead));
    EXPECT_EQ(file.length(), 0U);
    EXPECT_EQ(readFrom(file, 1), "");
}

TEST(File, KnowsLengthsBeyond32Bits)
{
    TempFolder const folder;
    folder.write("large", "");
    ASSERT_EQ(truncate(folder.pathTo("large").c_str(), 5'000'000'000), 0);
    File file;
    ASSERT_TRUE(file.open(folder.widePathTo("large"), File::kRead));
    EXPECT_EQ(file.length(), 5'000'000'000U);
}

TEST(File, OpensThroughALinkAndByAnyName)
{
    TempFolder const folder;
    folder.write("\xC3\xA4\xFF", "content");
    folder.makeLink("link", "\xC3\xA4\xFF");
    File file;
    ASSERT_TRUE(file.open(folder.widePathTo("link"), File::kRead));
    EXPECT_EQ(readFrom(file, 7), "content");
    ASSERT_TRUE(file.open(folder.widePathTo("\xC3\xA4\xFF"), File::kRead));
    EXPECT_EQ(readFrom(file, 7), "content");
}

TEST(File, RefusesWhatIsNoRegularFileWithoutWaiting)
{
    TempFolder const folder;
    folder.makeFolder("folder");
    folder.makeLink("dangling", "nowhere");
    folder.makeLink("loop", "loop");
    folder.makeLink("device", "/dev/zero");
    ASSERT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    for (char const* name : {"folder", "dangling", "loop", "device", "pipe", "missing", "missing/plan.dwg"}) {
        EXPECT_FALSE(File().open(folder.widePathTo(name), File::kRead)) << name;
    }
    EXPECT_FALSE(File().open(L"", File::kRead));
}

TEST(File, RefusesAPathThatTheSystemCannotTake)
{
    TempFolder const folder;
    folder.write("plan.dwg", "");
    EXPECT_FALSE(File().open(folder.widePathTo("plan.dwg") + L'\0', File::kRead));
    EXPECT_FALSE(File().open(folder.widePathTo(std::string(5000, '/') + "plan.dwg"), File::kRead));
}

TEST(File, RefusesAFileThatMayNotBeRead)
{
    TempFolder const folder;
    folder.write("secret", "");
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(folder.pathTo("secret").c_str(), 0200), 0);
    EXPECT_EQ(
        support::asOrdinaryUser(
            [&] { return File().open(folder.widePathTo("secret"), File::kRead) ? "opened" : "refused"; }),
        "refused");
}

TEST(File, HasNothingToReadWhenItIsNotOpen)
{
    TempFolder const folder;
    folder.write("plan.dwg", "content");
    File file;
    EXPECT_EQ(file.length(), 0U);
    EXPECT_EQ(readFrom(file, 5), "");
    ASSERT_TRUE(file.open(folder.widePathTo("plan.dwg"), File::kRead));
    file.close();
    file.close();
    EXPECT_EQ(file.length(), 0U);
    EXPECT_EQ(readFrom(file, 5), "");
}

TEST(File, IsNotOpenAfterAFailedOpening)
{
    TempFolder const folder;
    folder.write("plan.dwg", "content");
    File file;
    ASSERT_TRUE(file.open(folder.widePathTo("plan.dwg"), File::kRead));
    EXPECT_FALSE(file.open(folder.widePathTo("missing"), File::kRead));
    EXPECT_EQ(file.length(), 0U);
    EXPECT_EQ(readFrom(file, 5), "");
}

TEST(File, ClosesItsHandleWhenItGoes)
{
    TempFolder const folder;
    folder.write("plan.dwg", "content");
    std::ptrdiff_t const before = openHandles();
    for (int i = 0; i < 3; ++i) {
        File file;
        ASSERT_TRUE(file.open(folder.widePathTo("plan.dwg"), File::kRead));
        ASSERT_TRUE(file.open(folder.widePathTo("plan.dwg"), File::kRead));
        EXPECT_FALSE(file.open(folder.widePath(), File::kRead));
    }
    EXPECT_EQ(openHandles(), before);
}

TEST(File, ReadsFewerBytesWhenReadingFails)
{
    TempFolder const folder;
    folder.write("plan.dwg", "content");
    File file;
    ASSERT_TRUE(file.open(folder.widePathTo("plan.dwg"), File::kRead));
    FailingCall const failing(0, EIO);
    EXPECT_EQ(readFrom(file, 7), "");
    EXPECT_EQ(failing.name(), "0: read");
}

TEST(File, ReadsOnWhenASignalInterruptsIt)
{
    TempFolder const folder;
    folder.write("plan.dwg", "content");
    File file;
    ASSERT_TRUE(file.open(folder.widePathTo("plan.dwg"), File::kRead));
    FailingCall const failing(0, EINTR);
    EXPECT_EQ(readFrom(file, 7), "content");
    EXPECT_EQ(failing.name(), "0: read");
}

TEST(File, OpensWhenASignalInterruptsIt)
{
    TempFolder const folder;
    folder.write("plan.dwg", "content");
    FailingCall const failing(0, EINTR);
    File file;
    EXPECT_TRUE(file.open(folder.widePathTo("plan.dwg"), File::kRead));
    EXPECT_EQ(failing.name(), "0: openat");
}

} // namespace
