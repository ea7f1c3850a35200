#include "kept_calls.h"

#include "platform/os/os_files.h"
#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace {

using support::asOrdinaryUser;
using support::FailingCall;
using support::TempFolder;
using testing::ElementsAre;
using testing::IsEmpty;

std::error_code fails(int error)
{
    return {error, std::generic_category()};
}

TEST(MakeFolder, SaysWhyItFailed)
{
    TempFolder const folder;
    folder.write("file", "");
    EXPECT_EQ(os::makeFolder(folder.pathTo("file"), 0777), fails(EEXIST));
    EXPECT_EQ(os::makeFolder(folder.pathTo("file/sub"), 0777), fails(ENOTDIR));
    EXPECT_EQ(os::makeFolder(folder.pathTo("missing/sub"), 0777), fails(ENOENT));
    EXPECT_EQ(os::makeFolder(folder.pathTo(std::string("sub\0x", 5)), 0777), fails(EILSEQ));
    EXPECT_THAT(folder.list(), ElementsAre("file"));
}

TEST(MakeFolder, LeavesNoFolderBehindWhicheverCallFails)
{
    TempFolder const folder;
    bool more = true;
    for (int n = 0; more; ++n) {
        FailingCall const failing(n, EIO);
        std::error_code const result = os::makeFolder(folder.pathTo("sub"), 0777);
        EXPECT_EQ(rmdir(folder.pathTo("sub").c_str()) == 0, !result) << failing.name();
        more = failing.hasFailed();
    }
}

TEST(MakeFolder, GoesOnWhicheverCallIsInterrupted)
{
    TempFolder const folder;
    bool more = true;
    for (int n = 0; more; ++n) {
        FailingCall const failing(n, EINTR);
        EXPECT_EQ(os::makeFolder(folder.pathTo(std::to_string(n)), 0777), std::error_code()) << failing.name();
        more = failing.hasFailed();
    }
}

TEST(MakeFolder, FlushesTheParent)
{
    TempFolder const folder;
    KeptCalls const kept;
    static ino_t flushed;
    flushed = 0;
    os::calls().fsync = [](int file) {
        struct stat status {};
        fstat(file, &status);
        flushed = status.st_ino;
        return KeptCalls::real.fsync(file);
    };
    struct stat parent {};
    ASSERT_EQ(stat(folder.path().c_str(), &parent), 0);
    EXPECT_EQ(os::makeFolder(folder.pathTo("sub///"), 0777), std::error_code());
    EXPECT_EQ(flushed, parent.st_ino);
}

TEST(MakeFolder, WorksWhereTheParentMayNotBeRead)
{
    TempFolder const folder;
    ASSERT_EQ(chmod(folder.path().c_str(), 0333), 0);
    EXPECT_EQ(asOrdinaryUser([&] { return os::makeFolder(folder.pathTo("sub"), 0777).message(); }), "Success");
    EXPECT_TRUE(folder.has("sub"));
}

TEST(MakeFolders, SaysWhyItFailed)
{
    TempFolder const folder;
    folder.write("file", "");
    folder.makeLink("dangling", "nowhere");
    EXPECT_EQ(os::makeFolders(folder.pathTo("file"), 0777), fails(ENOTDIR));
    EXPECT_EQ(os::makeFolders(folder.pathTo("file/a/b"), 0777), fails(ENOTDIR));
    EXPECT_EQ(os::makeFolders(folder.pathTo("dangling/a"), 0777), fails(EEXIST));
    EXPECT_EQ(os::makeFolders(folder.pathTo(std::string("a/b\0c", 5)), 0777), fails(EILSEQ));
    EXPECT_EQ(os::makeFolders("", 0777), fails(ENOENT));
    EXPECT_THAT(folder.list(), ElementsAre("dangling", "file"));
}

TEST(MakeFolders, MakesAllOfThemOrSaysThatItDidNotWhicheverCallFails)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        TempFolder const folder;
        FailingCall const failing(n, ENOSPC);
        std::error_code const result = os::makeFolders(folder.pathTo("a/b/c"), 0777);
        EXPECT_EQ(folder.has("a/b/c"), !result) << failing.name();
        more = failing.hasFailed();
    }
}

// Another process makes the folder between the look and the making.
TEST(MakeFolders, SucceedsWhenAnotherProcessIsFaster)
{
    TempFolder const folder;
    KeptCalls const kept;
    os::calls().mkdir = [](char const* path, mode_t mode) {
        KeptCalls::real.mkdir(path, mode);
        errno = EEXIST;
        return -1;
    };
    EXPECT_EQ(os::makeFolders(folder.pathTo("a/b"), 0777), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre("a/", "a/b/"));
}

TEST(RemoveFile, RemovesTheFileOrTheLink)
{
    TempFolder const folder;
    folder.write("plan.dwg", "content");
    folder.makeLink("link", "plan.dwg");
    EXPECT_EQ(os::removeFile(folder.pathTo("link")), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
    EXPECT_EQ(os::removeFile(folder.pathTo("plan.dwg")), std::error_code());
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(RemoveFile, SaysWhyItFailed)
{
    TempFolder const folder;
    folder.write("plan", "content");
    folder.makeFolder("sub");
    EXPECT_EQ(os::removeFile(folder.pathTo("missing")), fails(ENOENT));
    EXPECT_EQ(os::removeFile(folder.pathTo("missing/plan")), fails(ENOENT));
    EXPECT_EQ(os::removeFile(folder.pathTo("sub")), fails(EISDIR));
    EXPECT_EQ(os::removeFile(folder.pathTo("sub/")), fails(EISDIR));
    EXPECT_EQ(os::removeFile(folder.pathTo(std::string("plan\0x", 6))), fails(EILSEQ));
    EXPECT_THAT(folder.list(), ElementsAre("plan", "sub/"));
}

TEST(RemoveFile, GoesOnWhicheverCallIsInterrupted)
{
    TempFolder const folder;
    bool more = true;
    for (int n = 0; more; ++n) {
        folder.write("plan.dwg", "content");
        FailingCall const failing(n, EINTR);
        EXPECT_EQ(os::removeFile(folder.pathTo("plan.dwg")), std::error_code()) << failing.name();
        more = failing.hasFailed();
    }
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(FlushFolder, FlushesFoldersOnly)
{
    TempFolder const folder;
    folder.write("file", "");
    EXPECT_EQ(os::flushFolder(folder.path()), std::error_code());
    EXPECT_EQ(os::flushFolder(folder.pathTo("file")), fails(ENOTDIR));
    EXPECT_EQ(os::flushFolder(folder.pathTo("missing")), fails(ENOENT));
    EXPECT_EQ(os::flushFolder(folder.path() + '\0'), fails(EILSEQ));
    FailingCall const failing(1, EIO);
    EXPECT_EQ(os::flushFolder(folder.path()), fails(EIO));
    EXPECT_EQ(failing.name(), "1: fsync");
}

TEST(ReadFile, ReadsTheWholeContent)
{
    TempFolder const folder;
    for (std::size_t const size : {0U, 1U, 4096U, 1'000'000U}) {
        folder.write("plan.dwg", std::string(size, 'x'));
        std::string content = "before";
        EXPECT_EQ(os::readFile(folder.pathTo("plan.dwg"), content), std::error_code());
        EXPECT_EQ(content, std::string(size, 'x'));
    }
}

TEST(ReadFile, ReadsAFileThatGrowsMeanwhile)
{
    TempFolder const folder;
    folder.write("plan.dwg", "old");
    static std::string file;
    static bool grown;
    file = folder.pathTo("plan.dwg");
    grown = false;
    KeptCalls const kept;
    os::calls().read = [](int handle, void* buffer, std::size_t count) {
        if (!std::exchange(grown, true)) {
            EXPECT_EQ(truncate(file.c_str(), 100'000), 0);
        }
        return KeptCalls::real.read(handle, buffer, count);
    };
    std::string content;
    EXPECT_EQ(os::readFile(file, content), std::error_code());
    EXPECT_EQ(content, "old" + std::string(99'997, '\0'));
}

TEST(ReadFile, ReadsAFileWhoseLengthTheSystemDoesNotTell)
{
    std::string content;
    EXPECT_EQ(os::readFile("/proc/self/status", content), std::error_code());
    EXPECT_THAT(content, testing::StartsWith("Name:"));
}

TEST(ReadFile, LeavesTheTextAloneWhenItFails)
{
    TempFolder const folder;
    folder.write("plan.dwg", "content");
    for (int n : {0, 1}) {
        std::string content = "before";
        FailingCall const failing(n, EIO);
        EXPECT_EQ(os::readFile(folder.pathTo("plan.dwg"), content), fails(EIO)) << failing.name();
        EXPECT_EQ(content, "before");
    }
}

TEST(ReadBytes, ReadsOnAfterPartialReads)
{
    TempFolder const folder;
    folder.write("plan.dwg", "a whole content");
    KeptCalls const kept;
    os::calls().read = [](int file, void* buffer, std::size_t count) {
        return KeptCalls::real.read(file, buffer, std::min<std::size_t>(count, 2));
    };
    std::string content;
    EXPECT_EQ(os::readFile(folder.pathTo("plan.dwg"), content), std::error_code());
    EXPECT_EQ(content, "a whole content");
}

TEST(ReadBytes, CountsWhatWasReadBeforeAnError)
{
    TempFolder const folder;
    folder.write("plan.dwg", "a whole content");
    os::Handle file;
    ASSERT_EQ(os::openForReading(folder.pathTo("plan.dwg"), file), std::error_code());
    KeptCalls const kept;
    static int calls;
    calls = 0;
    os::calls().read = [](int handle, void* buffer, std::size_t count) {
        errno = EIO;
        return calls++ == 2 ? -1 : KeptCalls::real.read(handle, buffer, std::min<std::size_t>(count, 2));
    };
    std::string buffer(100, '?');
    std::size_t done = 0;
    EXPECT_EQ(os::readBytes(file, buffer.data(), buffer.size(), done), fails(EIO));
    EXPECT_EQ(buffer.substr(0, done), "a wh");
}

TEST(OpenForReading, SaysWhyItFailed)
{
    TempFolder const folder;
    folder.makeFolder("sub");
    ASSERT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    os::Handle file;
    EXPECT_EQ(os::openForReading(folder.pathTo("missing"), file), fails(ENOENT));
    EXPECT_EQ(os::openForReading(folder.pathTo("sub"), file), fails(EISDIR));
    EXPECT_EQ(os::openForReading(folder.pathTo("pipe"), file), fails(EINVAL));
    EXPECT_EQ(os::openForReading(folder.path() + '\0', file), fails(EILSEQ));
    EXPECT_FALSE(file.isOpen());
}

} // namespace
