#include "kept_calls.h"

#include "platform/os/os_batch.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <string>
#include <sys/stat.h>
#include <system_error>
#include <unistd.h>

namespace {

using support::FailingCall;
using support::TempFolder;
using testing::ElementsAre;

constexpr std::uint64_t kTime = 1'500'000'000'123'456'000;

std::error_code fails(int error)
{
    return {error, std::generic_category()};
}

struct stat statusOf(TempFolder const& folder, std::string const& name)
{
    struct stat status {};
    EXPECT_EQ(lstat(folder.pathTo(name).c_str(), &status), 0) << name;
    return status;
}

mode_t permissionsOf(TempFolder const& folder, std::string const& name)
{
    return statusOf(folder, name).st_mode & 07777;
}

/// A folder "tree" that is changed, beside files that wait for their places.
class BatchTest : public testing::Test {
protected:
    BatchTest()
    {
        folder.makeFolder("tree");
        folder.write("new", "new");
    }

    os::Batch batch() const { return os::Batch(folder.pathTo("tree")); }

    std::error_code place(std::string const& path) const { return batch().place(folder.pathTo("new"), path); }

    os::FileMark markOf(std::string const& path) const
    {
        os::FileMark mark;
        EXPECT_EQ(batch().mark(path, mark), std::error_code()) << path;
        return mark;
    }

    TempFolder const folder;
};

TEST_F(BatchTest, PlacesAFileAndMakesItsFolders)
{
    EXPECT_EQ(place("a/b/file"), std::error_code());
    EXPECT_EQ(folder.read("tree/a/b/file"), "new");
    EXPECT_FALSE(folder.has("new"));
}

TEST_F(BatchTest, PlacesManyFilesInOneBatch)
{
    os::Batch changes = batch();
    for (std::string const name : {"a/1", "a/b/2", "a/3", "4"}) {
        folder.write("next", name);
        EXPECT_EQ(changes.place(folder.pathTo("next"), name), std::error_code());
        EXPECT_EQ(folder.read("tree/" + name), name);
    }
    EXPECT_EQ(changes.flush(), std::error_code());
}

TEST_F(BatchTest, KeepsThePermissionsOfAFileThatItReplaces)
{
    folder.write("tree/file", "old");
    ASSERT_EQ(chmod(folder.pathTo("tree/file").c_str(), 0640), 0);
    EXPECT_EQ(place("file"), std::error_code());
    EXPECT_EQ(folder.read("tree/file"), "new");
    EXPECT_EQ(permissionsOf(folder, "tree/file"), 0640u);
}

TEST_F(BatchTest, ReplacesALinkItself)
{
    folder.write("target", "kept");
    folder.makeLink("tree/link", folder.pathTo("target"));
    EXPECT_EQ(place("link"), std::error_code());
    EXPECT_TRUE(S_ISREG(statusOf(folder, "tree/link").st_mode));
    EXPECT_EQ(folder.read("target"), "kept");
}

TEST_F(BatchTest, ReplacesAFolderThatHoldsOnlyFolders)
{
    folder.makeFolder("tree/name/a/b");
    folder.makeFolder("tree/name/c");
    EXPECT_EQ(place("name"), std::error_code());
    EXPECT_EQ(folder.read("tree/name"), "new");
}

TEST_F(BatchTest, LeavesAFolderWithAFileOrALinkInIt)
{
    folder.write("tree/files/a/.hidden", "mine");
    folder.makeFolder("outside");
    folder.makeFolder("tree/links");
    folder.makeLink("tree/links/link", folder.pathTo("outside"));
    EXPECT_EQ(place("files"), fails(ENOTEMPTY));
    EXPECT_EQ(place("links"), fails(ENOTEMPTY));
    EXPECT_EQ(folder.read("tree/files/a/.hidden"), "mine");
    EXPECT_THAT(
        folder.list(), ElementsAre(
                           "new", "outside/", "tree/", "tree/files/", "tree/files/a/", "tree/files/a/.hidden",
                           "tree/links/", "tree/links/link"));
}

TEST_F(BatchTest, GoesThroughNoLinkInAnyParent)
{
    folder.write("outside/inner/file", "kept");
    folder.makeLink("tree/link", folder.pathTo("outside"));
    folder.makeFolder("tree/a");
    folder.makeLink("tree/a/link", folder.pathTo("outside"));
    os::Batch changes = batch();
    for (std::string const path : {"link/inner/file", "a/link/inner/file", "link/file"}) {
        EXPECT_EQ(changes.place(folder.pathTo("new"), path), fails(ENOTDIR)) << path;
        EXPECT_EQ(changes.remove(path), fails(ENOTDIR)) << path;
        changes.removeEmptyFoldersOf(path);
        EXPECT_FALSE(markOf(path).isThere) << path;
    }
    EXPECT_EQ(folder.read("outside/inner/file"), "kept");
    EXPECT_FALSE(folder.has("outside/file"));
    EXPECT_EQ(folder.read("new"), "new");
}

TEST_F(BatchTest, SeesALinkThatTakesThePlaceOfAFolder)
{
    folder.write("tree/a/file", "old");
    folder.write("outside/file", "kept");
    os::Batch changes = batch();
    ASSERT_EQ(changes.remove("a/file"), std::error_code());
    ASSERT_EQ(rmdir(folder.pathTo("tree/a").c_str()), 0);
    folder.makeLink("tree/a", folder.pathTo("outside"));
    EXPECT_NE(changes.place(folder.pathTo("new"), "a/file"), std::error_code());
    EXPECT_EQ(folder.read("outside/file"), "kept");
}

TEST_F(BatchTest, RemovesFilesAndLinksAndIsContentWithoutThem)
{
    folder.write("tree/a/file", "old");
    folder.write("target", "kept");
    folder.makeLink("tree/a/link", folder.pathTo("target"));
    os::Batch changes = batch();
    EXPECT_EQ(changes.remove("a/file"), std::error_code());
    EXPECT_EQ(changes.remove("a/link"), std::error_code());
    EXPECT_EQ(changes.remove("a/file"), std::error_code());
    EXPECT_EQ(changes.remove("nowhere/file"), std::error_code());
    EXPECT_EQ(changes.remove("a"), fails(EISDIR));
    EXPECT_THAT(folder.list(), ElementsAre("new", "target", "tree/", "tree/a/"));
}

TEST_F(BatchTest, RemovesTheFoldersThatAreEmptyOnly)
{
    folder.write("tree/a/kept", "old");
    folder.makeFolder("tree/a/b/c");
    os::Batch changes = batch();
    changes.removeEmptyFoldersOf("a/b/c/gone");
    EXPECT_THAT(folder.list(), ElementsAre("new", "tree/", "tree/a/", "tree/a/kept"));
    changes.removeEmptyFoldersOf("gone");
    EXPECT_TRUE(folder.has("tree"));
}

TEST_F(BatchTest, FailsInAFolderThatIsMissing)
{
    os::Batch changes(folder.pathTo("nowhere"));
    EXPECT_NE(changes.place(folder.pathTo("new"), "file"), std::error_code());
    EXPECT_NE(changes.flush(), std::error_code());
    EXPECT_EQ(folder.read("new"), "new");
}

TEST_F(BatchTest, MarksTellTheStatesOfAFileApart)
{
    folder.write("tree/file", "1");
    os::FileMark const before = markOf("file");
    EXPECT_TRUE(before.isThere);
    EXPECT_TRUE(isSame(before, markOf("file")));
    folder.write("tree/file", "12");
    EXPECT_FALSE(isSame(before, markOf("file")));
    ASSERT_EQ(os::setModificationTime(folder.pathTo("tree/file"), kTime), std::error_code());
    os::FileMark const dated = markOf("file");
    EXPECT_EQ(dated.modified, static_cast<std::int64_t>(kTime));
    ASSERT_EQ(unlink(folder.pathTo("tree/file").c_str()), 0);
    EXPECT_FALSE(isSame(dated, markOf("file")));
    EXPECT_TRUE(isSame(markOf("nowhere/file"), markOf("file")));
}

TEST_F(BatchTest, MarksSeeAFileOfTheSameLengthAndTimeInThePlaceOfAnother)
{
    for (std::string const name : {"tree/file", "tree/other"}) {
        folder.write(name, "1");
        ASSERT_EQ(os::setModificationTime(folder.pathTo(name), kTime), std::error_code());
    }
    os::FileMark const before = markOf("file");
    ASSERT_EQ(rename(folder.pathTo("tree/other").c_str(), folder.pathTo("tree/file").c_str()), 0);
    EXPECT_FALSE(isSame(before, markOf("file")));
}

TEST_F(BatchTest, MarksTakeNoNoticeOfOtherNamesOfAFile)
{
    folder.write("tree/file", "1");
    ASSERT_EQ(link(folder.pathTo("tree/file").c_str(), folder.pathTo("tree/other").c_str()), 0);
    os::FileMark const before = markOf("file");
    ASSERT_EQ(os::setModificationTime(folder.pathTo("tree/other"), kTime), std::error_code());
    os::FileMark const dated = markOf("file");
    EXPECT_FALSE(isSame(before, dated));
    ASSERT_EQ(unlink(folder.pathTo("tree/other").c_str()), 0);
    EXPECT_TRUE(isSame(dated, markOf("file")));
}

TEST_F(BatchTest, MarksTakeAFolderForNoFile)
{
    folder.makeFolder("tree/name");
    EXPECT_FALSE(markOf("name").isThere);
}

TEST_F(BatchTest, LeavesTheOldFileOrTheNewOneWhenACallFails)
{
    for (int const error : {ENOSPC, EIO, EACCES}) {
        bool hasFailed = true;
        for (int n = 0; hasFailed; ++n) {
            folder.write("new", "new");
            folder.write("tree/a/file", "old");
            FailingCall const failing(n, error);
            std::error_code const outcome = place("a/file");
            hasFailed = failing.hasFailed();
            std::string const left = folder.read("tree/a/file");
            EXPECT_EQ(left, outcome ? "old" : "new") << failing.name();
            EXPECT_EQ(folder.has("new"), bool(outcome)) << failing.name();
        }
    }
}

TEST_F(BatchTest, ReportsAFlushThatFails)
{
    os::Batch changes = batch();
    FailingCall const failing(0, EIO);
    EXPECT_EQ(changes.flush(), fails(EIO));
}

TEST_F(BatchTest, LeavesAFileWhoseRemovalFails)
{
    bool hasFailed = true;
    for (int n = 0; hasFailed; ++n) {
        folder.write("tree/a/file", "old");
        FailingCall const failing(n, EIO);
        std::error_code const outcome = batch().remove("a/file");
        hasFailed = failing.hasFailed();
        EXPECT_EQ(folder.has("tree/a/file"), bool(outcome)) << failing.name();
    }
}

/// The folder "tree" lies on another file system than the files that wait.
class BatchAcrossFileSystems : public BatchTest {
protected:
    BatchAcrossFileSystems()
    {
        os::calls().renameat = [](int fromFolder, char const* from, int toFolder, char const* to) {
            if (fromFolder != toFolder) {
                errno = EXDEV;
                return -1;
            }
            return KeptCalls::real.renameat(fromFolder, from, toFolder, to);
        };
        EXPECT_EQ(chmod(folder.pathTo("new").c_str(), 0640), 0);
        EXPECT_EQ(os::setModificationTime(folder.pathTo("new"), kTime), std::error_code());
    }

    KeptCalls const kept_;
};

TEST_F(BatchAcrossFileSystems, CopiesAFileWithItsTimeAndPermissions)
{
    folder.write("new", std::string(200'000, 'x'));
    ASSERT_EQ(os::setModificationTime(folder.pathTo("new"), kTime), std::error_code());
    EXPECT_EQ(place("a/file"), std::error_code());
    EXPECT_EQ(folder.read("tree/a/file"), std::string(200'000, 'x'));
    EXPECT_EQ(permissionsOf(folder, "tree/a/file"), 0640u);
    EXPECT_EQ(markOf("a/file").modified, static_cast<std::int64_t>(kTime));
    EXPECT_THAT(folder.list(), ElementsAre("tree/", "tree/a/", "tree/a/file"));
}

TEST_F(BatchAcrossFileSystems, KeepsThePermissionsOfAFileThatItReplaces)
{
    folder.write("tree/file", "old");
    ASSERT_EQ(chmod(folder.pathTo("tree/file").c_str(), 0604), 0);
    EXPECT_EQ(place("file"), std::error_code());
    EXPECT_EQ(folder.read("tree/file"), "new");
    EXPECT_EQ(permissionsOf(folder, "tree/file"), 0604u);
}

TEST_F(BatchAcrossFileSystems, ReplacesWhatAKilledProcessHasLeft)
{
    folder.write("tree/.placing.tmp", "half of it");
    EXPECT_EQ(place("file"), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre("tree/", "tree/file"));
}

TEST_F(BatchAcrossFileSystems, ReplacesAFolderThatHoldsOnlyFolders)
{
    folder.makeFolder("tree/name/a");
    EXPECT_EQ(place("name"), std::error_code());
    EXPECT_EQ(folder.read("tree/name"), "new");
}

TEST_F(BatchAcrossFileSystems, LeavesTheOldFileOrTheNewOneWhenACallFails)
{
    bool hasFailed = true;
    int n = 0;
    for (; hasFailed; ++n) {
        folder.write("new", "new");
        folder.write("tree/file", "old");
        FailingCall const failing(n, ENOSPC);
        std::error_code const outcome = place("file");
        hasFailed = failing.hasFailed();
        EXPECT_EQ(folder.read("tree/file"), outcome ? "old" : "new") << failing.name();
        EXPECT_TRUE(!outcome || folder.has("new")) << failing.name();
    }
    EXPECT_GT(n, 8);
}

TEST(ModificationTime, IsSetToTheNanosecondOrSaysWhyNot)
{
    TempFolder const folder;
    folder.write("file", "1");
    EXPECT_EQ(os::setModificationTime(folder.pathTo("file"), kTime), std::error_code());
    EXPECT_EQ(statusOf(folder, "file").st_mtim.tv_sec, 1'500'000'000);
    EXPECT_EQ(statusOf(folder, "file").st_mtim.tv_nsec, 123'456'000);
    EXPECT_EQ(os::setModificationTime(folder.pathTo("nowhere"), kTime), fails(ENOENT));
    FailingCall const failing(1, EROFS);
    EXPECT_EQ(os::setModificationTime(folder.pathTo("file"), kTime), fails(EROFS));
}

} // namespace
