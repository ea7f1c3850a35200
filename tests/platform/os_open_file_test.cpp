#include "kept_calls.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <limits>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace {

using support::FailingCall;
using support::TempFolder;
using testing::ElementsAre;
using testing::IsEmpty;

std::error_code fails(int error)
{
    return {error, std::generic_category()};
}

std::string readAt(os::OpenFile const& file, std::uint64_t offset, std::size_t count)
{
    std::string bytes(count, '\0');
    std::size_t done = 0;
    EXPECT_EQ(file.readAt(offset, bytes.data(), count, done), std::error_code());
    bytes.resize(done);
    return bytes;
}

TEST(OpenFile, ReadsAndWritesAtAnyPlace)
{
    TempFolder const folder;
    os::OpenFile file;
    EXPECT_FALSE(file.isOpen());
    ASSERT_EQ(file.create(folder.pathTo("file"), 0600), std::error_code());
    EXPECT_TRUE(file.isOpen());
    EXPECT_EQ(file.writeAt(3, "defg"), std::error_code());
    EXPECT_EQ(file.writeAt(0, "abc"), std::error_code());
    EXPECT_EQ(readAt(file, 2, 3), "cde");
    EXPECT_EQ(readAt(file, 5, 100), "fg");
    EXPECT_EQ(readAt(file, 7, 1), "");
    EXPECT_EQ(file.truncate(4), std::error_code());
    std::uint64_t length = 0;
    EXPECT_EQ(file.length(length), std::error_code());
    EXPECT_EQ(length, 4u);
    EXPECT_EQ(file.flush(), std::error_code());
    EXPECT_EQ(folder.read("file"), "abcd");
}

TEST(OpenFile, KnowsNoPlacesBeyondThoseOfTheSystem)
{
    TempFolder const folder;
    os::OpenFile file;
    ASSERT_EQ(file.create(folder.pathTo("file"), 0600), std::error_code());
    std::uint64_t const beyond = std::numeric_limits<std::uint64_t>::max() - 10;
    EXPECT_EQ(readAt(file, beyond, 5), "");
    EXPECT_EQ(file.writeAt(beyond, "x"), fails(EFBIG));
    EXPECT_EQ(file.truncate(beyond), fails(EFBIG));
}

TEST(OpenFile, SaysWhyNothingWasOpened)
{
    TempFolder const folder;
    folder.write("file", "old");
    folder.makeFolder("folder");
    folder.makeLink("dangling", "nowhere");
    ASSERT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    os::OpenFile file;
    for (auto const open : {&os::OpenFile::openForReading, &os::OpenFile::openForChanging}) {
        EXPECT_EQ((file.*open)(folder.pathTo("missing")), fails(ENOENT));
        EXPECT_EQ((file.*open)(folder.pathTo("folder")), fails(EISDIR));
        EXPECT_EQ((file.*open)(folder.pathTo("pipe")), fails(EINVAL));
        EXPECT_EQ((file.*open)(folder.pathTo(std::string("file\0x", 6))), fails(EILSEQ));
    }
    EXPECT_EQ(file.create(folder.pathTo("file"), 0600), fails(EEXIST));
    EXPECT_EQ(file.create(folder.pathTo("dangling"), 0600), fails(EEXIST));
    EXPECT_EQ(file.openFolder(folder.pathTo("file")), fails(ENOTDIR));
    EXPECT_FALSE(file.isOpen());
    EXPECT_EQ(folder.read("file"), "old");
}

TEST(OpenFile, ChangesNoFileThatHasAnotherName)
{
    TempFolder const folder;
    folder.write("file", "content");
    folder.makeLink("link", "file");
    os::OpenFile file;
    EXPECT_EQ(file.openForChanging(folder.pathTo("link")), fails(ELOOP));
    ASSERT_EQ(link(folder.pathTo("file").c_str(), folder.pathTo("other").c_str()), 0);
    EXPECT_EQ(file.openForChanging(folder.pathTo("file")), fails(EMLINK));
    EXPECT_FALSE(file.isOpen());
    EXPECT_EQ(file.openForReading(folder.pathTo("link")), std::error_code());
    ASSERT_EQ(unlink(folder.pathTo("other").c_str()), 0);
    EXPECT_EQ(file.openForChanging(folder.pathTo("file")), std::error_code());
}

TEST(OpenFile, StaysOpenWhenAnotherCannotBeOpened)
{
    TempFolder const folder;
    folder.write("file", "old");
    os::OpenFile file;
    ASSERT_EQ(file.openForReading(folder.pathTo("file")), std::error_code());
    EXPECT_EQ(file.openForReading(folder.pathTo("missing")), fails(ENOENT));
    EXPECT_EQ(readAt(file, 0, 3), "old");
    os::OpenFile const moved = std::move(file);
    EXPECT_EQ(readAt(moved, 0, 3), "old");
}

TEST(OpenFile, WithoutANameLeavesNothingBehind)
{
    TempFolder const folder;
    os::OpenFile file;
    ASSERT_EQ(file.createUnnamed(folder.path()), std::error_code());
    EXPECT_EQ(file.writeAt(0, "content"), std::error_code());
    EXPECT_EQ(readAt(file, 0, 7), "content");
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(OpenFile, NeedsNoFileSystemWithFilesWithoutNames)
{
    TempFolder const folder;
    KeptCalls const kept;
    os::calls().openat = [](int parent, char const* path, int flags, mode_t mode) {
        if ((flags & O_TMPFILE) == O_TMPFILE) {
            errno = EOPNOTSUPP;
            return -1;
        }
        return KeptCalls::real.openat(parent, path, flags, mode);
    };
    os::OpenFile file;
    ASSERT_EQ(file.createUnnamed(folder.path()), std::error_code());
    EXPECT_EQ(file.writeAt(0, "content"), std::error_code());
    EXPECT_EQ(readAt(file, 0, 7), "content");
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(OpenFile, GoesOnWhicheverCallIsInterrupted)
{
    TempFolder const folder;
    bool more = true;
    for (int n = 0; more; ++n) {
        std::string const path = folder.pathTo(std::to_string(n));
        FailingCall const failing(n, EINTR);
        os::OpenFile file;
        EXPECT_EQ(file.create(path, 0600), std::error_code()) << failing.name();
        EXPECT_EQ(file.writeAt(0, "content"), std::error_code()) << failing.name();
        EXPECT_EQ(readAt(file, 0, 7), "content") << failing.name();
        EXPECT_EQ(file.truncate(3), std::error_code()) << failing.name();
        EXPECT_EQ(file.flush(), std::error_code()) << failing.name();
        EXPECT_EQ(file.flushFileSystem(), std::error_code()) << failing.name();
        EXPECT_EQ(os::renameUnflushed(path, path + "new"), std::error_code()) << failing.name();
        EXPECT_EQ(os::removeUnflushed(path + "new"), std::error_code()) << failing.name();
        more = failing.hasFailed();
    }
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(OpenFile, WritesOnWhenTheSystemTakesAPart)
{
    TempFolder const folder;
    KeptCalls const kept;
    os::calls().pwrite = [](int file, void const* bytes, std::size_t, off_t offset) {
        return KeptCalls::real.pwrite(file, bytes, 1, offset);
    };
    os::OpenFile file;
    ASSERT_EQ(file.create(folder.pathTo("file"), 0600), std::error_code());
    EXPECT_EQ(file.writeAt(1, "content"), std::error_code());
    EXPECT_EQ(folder.read("file"), std::string("\0content", 8));
}

TEST(OpenFile, TellsWhenTheFileSystemKnowsNoFlushOfAll)
{
    TempFolder const folder;
    os::OpenFile opened;
    ASSERT_EQ(opened.openFolder(folder.path()), std::error_code());
    for (auto const& [error, expected] :
         {std::pair(EINVAL, ENOSYS), {EOPNOTSUPP, ENOSYS}, {ENOSYS, ENOSYS}, {EIO, EIO}}) {
        FailingCall const failing(0, error);
        EXPECT_EQ(opened.flushFileSystem(), fails(expected));
        EXPECT_EQ(failing.name(), "0: syncfs");
    }
}

TEST(RenameUnflushed, ReplacesAFile)
{
    TempFolder const folder;
    folder.write("from", "new");
    folder.write("to", "old");
    EXPECT_EQ(os::renameUnflushed(folder.pathTo("from"), folder.pathTo("to")), std::error_code());
    EXPECT_EQ(folder.read("to"), "new");
    EXPECT_EQ(os::renameUnflushed(folder.pathTo("from"), folder.pathTo("to")), fails(ENOENT));
    EXPECT_EQ(os::renameUnflushed(folder.pathTo(std::string("to\0x", 4)), folder.pathTo("x")), fails(EILSEQ));
    EXPECT_THAT(folder.list(), ElementsAre("to"));
}

TEST(RemoveUnflushed, RemovesFilesOnly)
{
    TempFolder const folder;
    folder.write("file", "");
    folder.makeFolder("folder");
    EXPECT_EQ(os::removeUnflushed(folder.pathTo("folder")), fails(EISDIR));
    EXPECT_EQ(os::removeUnflushed(folder.pathTo("missing")), fails(ENOENT));
    EXPECT_EQ(os::removeUnflushed(folder.pathTo(std::string("file\0x", 6))), fails(EILSEQ));
    EXPECT_EQ(os::removeUnflushed(folder.pathTo("file")), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre("folder/"));
}

TEST(ReplaceFileBy, KeepsPermissionsAndLinksOfTheOldFile)
{
    TempFolder const folder;
    folder.write("source", "new");
    folder.write("target", "old");
    folder.makeLink("link", "target");
    ASSERT_EQ(chmod(folder.pathTo("target").c_str(), 0640), 0);
    EXPECT_EQ(os::replaceFileBy(folder.pathTo("link"), folder.pathTo("source")), std::error_code());
    EXPECT_EQ(folder.read("target"), "new");
    struct stat status {};
    ASSERT_EQ(stat(folder.pathTo("target").c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0640U);
    EXPECT_THAT(folder.list(), ElementsAre("link", "target"));
}

TEST(ReplaceFileBy, MovesTheFileWhereNoneIs)
{
    TempFolder const folder;
    folder.write("source", "new");
    EXPECT_EQ(os::replaceFileBy(folder.pathTo("target"), folder.pathTo("source")), std::error_code());
    EXPECT_EQ(folder.read("target"), "new");
    EXPECT_THAT(folder.list(), ElementsAre("target"));
}

TEST(ReplaceFileBy, RefusesWhatIsNoFile)
{
    TempFolder const folder;
    folder.write("source", "new");
    folder.makeFolder("folder");
    EXPECT_EQ(os::replaceFileBy(folder.pathTo("folder"), folder.pathTo("source")), fails(EISDIR));
    EXPECT_EQ(os::replaceFileBy(folder.pathTo("target"), folder.pathTo("missing")), fails(ENOENT));
    EXPECT_EQ(os::replaceFileBy(folder.pathTo("missing/target"), folder.pathTo("source")), fails(ENOENT));
    EXPECT_THAT(folder.list(), ElementsAre("folder/", "source"));
}

TEST(ReplaceFileBy, LeavesOldOrNewContentWholeWhicheverCallFails)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        TempFolder const folder;
        folder.write("source", "new");
        folder.write("target", "old");
        FailingCall const failing(n, EIO);
        std::error_code const error = os::replaceFileBy(folder.pathTo("target"), folder.pathTo("source"));
        bool const isReplaced = folder.read("target") == "new";
        EXPECT_TRUE(isReplaced || (error && folder.read("target") == "old")) << failing.name();
        EXPECT_NE(folder.has("source"), isReplaced) << failing.name();
        more = failing.hasFailed();
    }
}

} // namespace
