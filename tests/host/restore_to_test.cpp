// Earlier versions beside the files that they are of.
#include "tests/host/history_test.h"
#include "tests/host/run_here.h"
#include "tests/support/temp_folder.h"

#include "platform/os/os_calls.h"

#include <gmock/gmock.h>

#include <cerrno>
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

    static Outcome belongs(std::string const& folder)
    {
        return failed(
            "tav: '" + folder +
            "' belongs to a repository or a server. Nothing has been written; name another path.\n");
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

TEST_F(RestoreTo, MakesNoFolderOutsideOfTheRepository)
{
    EXPECT_EQ(
        restoreTo(elsewhere.pathTo("no/such/a.dwg")),
        failed("tav: There is no folder '" + elsewhere.pathTo("no/such") + "'. Make it first.\n"));
    EXPECT_EQ(elsewhere.list(), std::vector<std::string>());
}

TEST_F(RestoreTo, OverwritesNothingUnlessForced)
{
    repo.write("own.dwg", "own");
    std::string const target = repo.pathTo("own.dwg");
    EXPECT_EQ(
        restoreTo(target),
        failed("tav: '" + target + "' is there already. Name another path, or overwrite it with --force.\n"));
    EXPECT_EQ(repo.read("own.dwg"), "own");
    EXPECT_EQ(restoreTo(target, {"--force"}), done(wrote(target)));
    EXPECT_EQ(repo.read("own.dwg"), "one");
}

TEST_F(RestoreTo, OverwritesNothingOutsideOfTheRepository)
{
    elsewhere.write("own.dwg", "own");
    fs::create_symlink("nowhere.dwg", elsewhere.pathTo("link.dwg"));
    for (char const* const name : {"own.dwg", "link.dwg"}) {
        std::string const target = elsewhere.pathTo(name);
        Outcome const refused = failed(
            "tav: '" + target +
            "' is there already. Outside of the repository nothing is overwritten; name "
            "another path, or move or remove it first.\n");
        EXPECT_EQ(restoreTo(target), refused);
        EXPECT_EQ(restoreTo(target, {"--force"}), refused);
    }
    EXPECT_EQ(elsewhere.read("own.dwg"), "own");
    EXPECT_THAT(elsewhere.list(), testing::UnorderedElementsAre("own.dwg", "link.dwg"));
}

TEST_F(RestoreTo, KeepsWhatItOverwritesInTheFolder)
{
    repo.write("own.dwg", "own");
    restoreTo("own.dwg", {"--force"});
    EXPECT_EQ(tav({"undo"}).code, 0);
    EXPECT_EQ(repo.read("own.dwg"), "own");
}

TEST_F(RestoreTo, ThatWritesNothingIsNoCommandToTakeBack)
{
    std::string const before = tav({"undo", "--list"}).out;
    Process process(setting(), [] {
        static os::Calls const real = os::calls();
        os::calls().renameat = [](int fromFolder, char const* from, int toFolder, char const* to) {
            errno = EACCES;
            return to == std::string("old.dwg") ? -1 : real.renameat(fromFolder, from, toFolder, to);
        };
        return runHere({"restore", "--from", "1", "--to", "old.dwg", "план.dwg"});
    });
    EXPECT_EQ(
        process.wait(), failed("tav: 'old.dwg' cannot be written: Permission denied. Everything written so far is "
                               "complete; correct that and run the command again.\n"));
    EXPECT_FALSE(repo.has("old.dwg"));
    EXPECT_EQ(tav({"undo", "--list"}).out, before);
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

TEST_F(RestoreTo, WritesNothingIntoAnotherRepositoryOrAServer)
{
    for (support::TempFolder const* const place : {&elsewhere, static_cast<support::TempFolder const*>(&repo)}) {
        place->write("other/.tav/storage/old", "old");
        place->write("server/server.db", "history");
        place->write("server/contents/old", "old");
        EXPECT_EQ(
            restoreTo(place->pathTo("other/.tav/storage/old"), {"--force"}), belongs(place->pathTo("other/.tav")));
        EXPECT_EQ(restoreTo(place->pathTo("other/.tav")), belongs(place->pathTo("other/.tav")));
        EXPECT_EQ(restoreTo(place->pathTo("server/contents/old"), {"--force"}), belongs(place->pathTo("server")));
        EXPECT_EQ(restoreTo(place->pathTo("server/server.db"), {"--force"}), belongs(place->pathTo("server")));
        EXPECT_EQ(place->read("other/.tav/storage/old"), "old");
        EXPECT_EQ(place->read("server/server.db"), "history");
    }
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
