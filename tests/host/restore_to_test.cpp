// Earlier versions beside the files that they are of.
#include "tests/host/history_test.h"
#include "tests/support/temp_folder.h"

#include <gmock/gmock.h>

#include <filesystem>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

using testing::HasSubstr;

/// Two commits of "план.dwg": "one" and "two".
class RestoreTo : public HistoryTest {
protected:
    RestoreTo()
    {
        repo.write("план.dwg", "one");
        commitAll("first");
        repo.write("план.dwg", "two");
        commitAll("second");
    }

    Outcome restoreTo(std::string const& target, Arguments const& more = {}) const
    {
        Arguments arguments = {"restore", "--from", "1", "--to=" + target, "план.dwg"};
        arguments.insert(arguments.end(), more.begin(), more.end());
        return tav(arguments);
    }

    static std::string wrote(std::string const& target)
    {
        return "Wrote 'план.dwg' of commit 1 to '" + target + "'.\n";
    }

    support::TempFolder const elsewhere;
};

TEST_F(RestoreTo, WritesAnotherFileOfTheFolderAndLeavesTheOwnOne)
{
    EXPECT_EQ(restoreTo("-old/图 \"1\".dwg"), done(wrote(repo.pathTo("-old/图 \"1\".dwg"))));
    EXPECT_EQ(repo.read("-old/图 \"1\".dwg"), "one");
    EXPECT_EQ(repo.read("план.dwg"), "two");
    EXPECT_THAT(status(), HasSubstr("New, not staged:"));
    EXPECT_EQ(tav({"undo"}).code, 0);
    EXPECT_FALSE(repo.has("-old/图 \"1\".dwg"));
}

TEST_F(RestoreTo, WritesOutsideOfTheRepository)
{
    EXPECT_EQ(restoreTo(elsewhere.pathTo("old plan.dwg")), done(wrote(elsewhere.pathTo("old plan.dwg"))));
    EXPECT_EQ(elsewhere.read("old plan.dwg"), "one");
    EXPECT_EQ(restoreTo(elsewhere.path()), done(wrote(elsewhere.pathTo("план.dwg"))));
    EXPECT_EQ(elsewhere.read("план.dwg"), "one");
    EXPECT_EQ(status(), kClean);
}

TEST_F(RestoreTo, OverwritesNothingUnlessForced)
{
    repo.write("own.dwg", "own");
    elsewhere.write("own.dwg", "own");
    for (std::string const& target : {repo.pathTo("own.dwg"), elsewhere.pathTo("own.dwg")}) {
        EXPECT_EQ(
            restoreTo(target),
            failed("tav: '" + target + "' is there already. Name another path, or overwrite it with --force.\n"));
    }
    EXPECT_EQ(repo.read("own.dwg"), "own");
    EXPECT_EQ(elsewhere.read("own.dwg"), "own");
    for (std::string const& target : {repo.pathTo("own.dwg"), elsewhere.pathTo("own.dwg")}) {
        EXPECT_EQ(restoreTo(target, {"--force"}), done(wrote(target)));
    }
    EXPECT_EQ(repo.read("own.dwg"), "one");
    EXPECT_EQ(elsewhere.read("own.dwg"), "one");
    EXPECT_EQ(elsewhere.list(), std::vector<std::string>{"own.dwg"});
}

TEST_F(RestoreTo, KeepsWhatItOverwritesInTheFolder)
{
    repo.write("own.dwg", "own");
    restoreTo("own.dwg", {"--force"});
    EXPECT_EQ(tav({"undo"}).code, 0);
    EXPECT_EQ(repo.read("own.dwg"), "own");
}

TEST_F(RestoreTo, KnowsTheFolderBehindALink)
{
    repo.write("own.dwg", "own");
    fs::create_directory_symlink(repo.path(), elsewhere.pathTo("link"));
    EXPECT_EQ(restoreTo(elsewhere.pathTo("link/own.dwg"), {"--force"}), done(wrote(repo.pathTo("own.dwg"))));
    EXPECT_EQ(tav({"undo"}).code, 0);
    EXPECT_EQ(repo.read("own.dwg"), "own");
}

TEST_F(RestoreTo, WritesNothingIntoTheOwnFolderOfTheRepository)
{
    EXPECT_EQ(restoreTo(".tav/tav.lock", {"--force"}).code, 1);
    EXPECT_EQ(restoreTo(".tav/new").code, 1);
    EXPECT_FALSE(repo.has(".tav/new"));
}

TEST_F(RestoreTo, TakesOneFileAndAFolderThatExists)
{
    EXPECT_EQ(
        tav({"restore", "--to", "x", "."}),
        failed("tav: --to takes one file, and these are 2. Use 'tav export' for the files of a commit.\n"));
    EXPECT_EQ(restoreTo("none/"), failed("tav: There is no folder 'none/'. Make it first.\n"));
    EXPECT_EQ(restoreTo(elsewhere.pathTo("none/a.dwg")).code, 1);
    EXPECT_FALSE(elsewhere.has("none"));
}

} // namespace
} // namespace host_tests
