#include "kept_calls.h"

#include "platform/os/os_move.h"
#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <gmock/gmock.h>
#include <string>
#include <sys/stat.h>
#include <system_error>

namespace {

using support::FailingCall;
using support::TempFolder;
using testing::ElementsAre;

std::error_code fails(int error)
{
    return {error, std::generic_category()};
}

std::error_code move(TempFolder const& folder, std::string const& from, std::string const& to)
{
    bool hasMoved = false;
    std::error_code const error = os::moveEntry(folder.path(), from, to, hasMoved);
    EXPECT_EQ(hasMoved, folder.has(to) && !folder.has(from));
    return error;
}

void withoutOneStep(int error)
{
    static int reason = 0;
    reason = error;
    os::calls().renameat2 = [](int, char const*, int, char const*, unsigned) {
        errno = reason;
        return -1;
    };
}

TEST(MoveEntry, MovesFilesAndFolders)
{
    TempFolder const folder;
    folder.write("a/file", "1");
    folder.makeFolder("b");
    EXPECT_EQ(move(folder, "a/file", "b/moved"), std::error_code());
    EXPECT_EQ(folder.read("b/moved"), "1");
    EXPECT_EQ(move(folder, "b", "a/b"), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre("a/", "a/b/", "a/b/moved"));
}

TEST(MoveEntry, ReplacesNothingWithOrWithoutTheHelpOfTheFileSystem)
{
    TempFolder const folder;
    folder.write("file", "1");
    folder.write("taken", "2");
    folder.makeFolder("folder");
    folder.makeLink("dangling", "nowhere");
    KeptCalls const kept;
    for (int const error : {0, EINVAL, ENOSYS}) {
        if (error != 0) {
            withoutOneStep(error);
        }
        for (std::string const name : {"taken", "folder", "dangling"}) {
            EXPECT_EQ(move(folder, "file", name), fails(EEXIST)) << name;
        }
    }
    EXPECT_EQ(folder.read("file"), "1");
    EXPECT_EQ(folder.read("taken"), "2");
    EXPECT_EQ(move(folder, "file", "free"), std::error_code());
    EXPECT_EQ(folder.read("free"), "1");
}

TEST(MoveEntry, SaysWhyNothingWasMoved)
{
    TempFolder const folder;
    folder.write("file", "1");
    EXPECT_EQ(move(folder, "nowhere", "free"), fails(ENOENT));
    EXPECT_EQ(move(folder, "file", "nowhere/free"), fails(ENOENT));
    EXPECT_EQ(move(folder, "file", std::string("a\0b", 3)), fails(EINVAL));
    EXPECT_THAT(folder.list(), ElementsAre("file"));
}

TEST(MoveEntry, LeadsThroughNoLink)
{
    TempFolder const folder;
    folder.write("real/file", "1");
    folder.makeFolder("real/inner");
    folder.makeLink("link", "real");
    EXPECT_EQ(move(folder, "link/file", "free"), fails(ENOTDIR));
    EXPECT_EQ(move(folder, "real/file", "link/free"), fails(ENOTDIR));
    EXPECT_EQ(move(folder, "real/file", "link/inner/free"), fails(ENOTDIR));
    bool hasMoved = false;
    EXPECT_EQ(os::moveEntry(folder.pathTo("link"), "file", "moved", hasMoved), std::error_code());
    EXPECT_EQ(move(folder, "link", "renamed"), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre("real/", "real/inner/", "real/moved", "renamed"));
}

TEST(MoveEntry, NeedsNoFileSystemThatFlushesFolders)
{
    TempFolder const folder;
    folder.write("file", "1");
    KeptCalls const kept;
    os::calls().fsync = [](int) {
        errno = EINVAL;
        return -1;
    };
    EXPECT_EQ(move(folder, "file", "moved"), std::error_code());
}

TEST(MoveEntry, PassesThroughFoldersThatMayNotBeListed)
{
    TempFolder const folder;
    folder.write("hidden/inner/file", "1");
    for (char const* const name : {"", "hidden/inner"}) {
        chmod(folder.pathTo(name).c_str(), 0777);
    }
    chmod(folder.pathTo("hidden").c_str(), 0311);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return move(folder, "hidden/inner/file", "hidden/inner/moved").message(); }),
        "Success");
    chmod(folder.pathTo("hidden").c_str(), 0777);
}

TEST(MoveEntry, HasOneOfBothNamesWhenACallFails)
{
    TempFolder const folder;
    folder.makeFolder("a");
    bool hasFailed = true;
    int n = 0;
    for (; hasFailed; ++n) {
        folder.write("file", "1");
        FailingCall const failing(n, EIO);
        std::error_code const outcome = move(folder, "file", "a/moved");
        hasFailed = failing.hasFailed();
        EXPECT_NE(folder.has("file"), folder.has("a/moved")) << failing.name();
        EXPECT_TRUE(outcome || folder.has("a/moved")) << failing.name();
        if (folder.has("a/moved")) {
            EXPECT_EQ(folder.read("a/moved"), "1");
            EXPECT_EQ(std::remove(folder.pathTo("a/moved").c_str()), 0);
        }
    }
    EXPECT_GT(n, 4);
}

} // namespace
