#include "platform/os/os_way.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <gmock/gmock.h>
#include <string>
#include <system_error>
#include <vector>

namespace {

using os::Obstacle;
using support::TempFolder;

class FindObstacle : public testing::Test {
protected:
    FindObstacle()
    {
        folder.write("plans/ground/north.dwg", "");
        folder.makeLink("plans/link", "ground");
        folder.makeLink("plans/dangling", "nowhere");
    }

    /// The part that is in the way, and why; empty when nothing is.
    std::string found(std::string const& path) const
    {
        Obstacle const obstacle = os::findObstacle(folder.path(), path);
        std::string const part = path.substr(0, obstacle.length);
        switch (obstacle.kind) {
        case Obstacle::Kind::none: return "";
        case Obstacle::Kind::link: return part + " is a link";
        case Obstacle::Kind::notFolder: return part + " is not a folder";
        case Obstacle::Kind::unknown: break;
        }
        return part + ": " + obstacle.error.message();
    }

    TempFolder const folder;
};

TEST_F(FindObstacle, FindsNoneBeforeFilesAndFolders)
{
    EXPECT_EQ(found("plans/ground/north.dwg"), "");
    EXPECT_EQ(found("plans/ground"), "");
}

TEST_F(FindObstacle, FindsNoneWhereNothingExistsYet)
{
    EXPECT_EQ(found("new.dwg"), "");
    EXPECT_EQ(found("plans/new/deep/south.dwg"), "");
}

TEST_F(FindObstacle, NamesTheFirstLink)
{
    EXPECT_EQ(found("plans/link"), "plans/link is a link");
    EXPECT_EQ(found("plans/link/north.dwg"), "plans/link is a link");
    EXPECT_EQ(found("plans/dangling/north.dwg"), "plans/dangling is a link");
}

TEST_F(FindObstacle, NamesTheFileInThePlaceOfAFolder)
{
    EXPECT_EQ(found("plans/ground/north.dwg/south.dwg"), "plans/ground/north.dwg is not a folder");
}

TEST_F(FindObstacle, TakesALinkAsTheFolderToBeginIn)
{
    TempFolder const elsewhere;
    elsewhere.makeLink("top", folder.path());
    EXPECT_EQ(os::findObstacle(elsewhere.pathTo("top"), "plans/ground").kind, Obstacle::Kind::none);
}

TEST_F(FindObstacle, SaysWhyTheFolderToBeginInCannotBeExamined)
{
    Obstacle const obstacle = os::findObstacle(folder.pathTo("missing"), "plan.dwg");
    EXPECT_EQ(obstacle.kind, Obstacle::Kind::unknown);
    EXPECT_EQ(obstacle.length, 0U);
    EXPECT_EQ(obstacle.error, std::errc::no_such_file_or_directory);
}

TEST_F(FindObstacle, FindsNoneOnlyWhenEveryFolderCanBeOpened)
{
    std::vector<std::string> found;
    bool more = true;
    for (int n = 0; more; ++n) {
        support::FailingCall const failing(n, EACCES);
        found.push_back(this->found("plans/ground/north.dwg"));
        more = failing.hasFailed();
    }
    EXPECT_THAT(
        found, testing::UnorderedElementsAre(
                   ": Permission denied", "plans: Permission denied", "plans/ground: Permission denied", // Opening
                   "", "", "",                                                                           // Closing
                   ""));                                                                                 // All works
}

} // namespace
