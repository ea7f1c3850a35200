#include "tests/host/tav_test.h"

#include <gmock/gmock.h>

namespace host_tests {
namespace {

using testing::ElementsAre;

constexpr char const* kDefaultRules = "^.*\\.bak$\n^.*\\.dwl$\n^.*\\.dwl2$";

class Init : public testing::Test {
protected:
    Outcome tav(Arguments const& arguments, bool isOnTerminal = false) const
    {
        Setting setting;
        setting.folder = place.path();
        setting.isOnTerminal = isOnTerminal;
        return run(setting, arguments);
    }

    support::TempFolder const place;
};

TEST_F(Init, MakesTheCurrentFolderARepository)
{
    place.write("plan.dwg", "plan");
    EXPECT_EQ(tav({"init"}), done("Made a repository in '.'.\n"));
    EXPECT_THAT(
        place.list(), ElementsAre(
                          ".tav/", ".tav/identity", ".tav/properties/", ".tav/properties/ignore", ".tav/tav.db",
                          ".tav/tav.lock", ".tav/tav.state", "plan.dwg"));
    EXPECT_EQ(place.read(".tav/properties/ignore"), kDefaultRules);
    EXPECT_EQ(place.read(".tav/tav.state"), kFreshState);
    EXPECT_EQ(place.read("plan.dwg"), "plan");
}

TEST_F(Init, MakesTheFolderAndItsParents)
{
    EXPECT_EQ(tav({"init", "Häuser/\xff/north/"}), done("Made a repository in 'Häuser/\xff/north/'.\n"));
    EXPECT_EQ(place.read("Häuser/\xff/north/.tav/tav.state"), kFreshState);
}

TEST_F(Init, TakesAnAbsolutePath)
{
    EXPECT_EQ(tav({"init", place.pathTo("north")}), done("Made a repository in '" + place.pathTo("north") + "'.\n"));
    EXPECT_EQ(place.read("north/.tav/tav.state"), kFreshState);
}

TEST_F(Init, MakesWhatIsMissing)
{
    place.makeFolder(".tav");
    EXPECT_EQ(tav({"init"}), done("The repository in '.' was there already; it is complete.\n"));
    EXPECT_EQ(place.read(".tav/properties/ignore"), kDefaultRules);
    EXPECT_EQ(place.read(".tav/tav.state"), kFreshState);
}

TEST_F(Init, LeavesWhatIsThereAsItIs)
{
    place.write(".tav/properties/ignore", "^mine$\n");
    place.write(".tav/tav.state", "{ \"head\": { \"reference\": \"north wing\" } }\n");
    EXPECT_EQ(tav({"init"}), done("The repository in '.' was there already; it is complete.\n"));
    EXPECT_EQ(place.read(".tav/properties/ignore"), "^mine$\n");
    EXPECT_EQ(place.read(".tav/tav.state"), "{ \"head\": { \"reference\": \"north wing\" } }\n");
}

TEST_F(Init, LeavesABrokenStateToItsOwner)
{
    place.write(".tav/tav.state", "broken");
    EXPECT_EQ(
        tav({"init"}),
        failed("tav: Unable to parse json, please check if syntax is valid. '.tav/tav.state' is damaged: move it away "
               "and run 'tav init'; only staging and the current branch are lost.\n"));
    EXPECT_EQ(place.read(".tav/tav.state"), "broken");
}

TEST_F(Init, MakesARepositoryInsideOfAnotherWhenAskedTo)
{
    place.makeFolder(".tav");
    place.makeFolder("annex");
    EXPECT_EQ(tav({"init", "--nested", "annex"}), done("Made a repository in 'annex'.\n"));
    EXPECT_EQ(tav({"init", "annex"}), done("The repository in 'annex' was there already; it is complete.\n"));
    EXPECT_EQ(place.read("annex/.tav/tav.state"), kFreshState);
    EXPECT_FALSE(place.has(".tav/tav.state"));
}

TEST_F(Init, RefusesAFolderInsideOfARepository)
{
    place.makeFolder(".tav");
    place.makeFolder("annex");
    std::vector<std::string> const before = place.list();
    for (std::string const folder : {"annex", "new/wing", "annex/../annex"}) {
        EXPECT_EQ(
            tav({"init", folder}),
            failed(
                "tav: '" + folder + "' is inside of the repository in '" + place.path() +
                "', which keeps its files. Add --nested to make a repository of its own all the same.\n"));
    }
    EXPECT_EQ(place.list(), before);
}

TEST_F(Init, TakesAServerWhateverElseIsInItsFolder)
{
    support::TempFolder const server;
    server.write("5f0c2a9d1b3e4c6f8a7b9d0e1f2a3b4c/plan.dwg", "somebody's");
    EXPECT_EQ(tav({"init", "--server", server.path()}), done("Made a repository in '.'.\n"));
    EXPECT_EQ(server.read("5f0c2a9d1b3e4c6f8a7b9d0e1f2a3b4c/plan.dwg"), "somebody's");
    EXPECT_TRUE(server.has("server.db"));
}

TEST_F(Init, EscapesTheFolderOnATerminal)
{
    EXPECT_EQ(tav({"init", "a\n\x1b[31m\xff"}, true), done("Made a repository in 'a\\x0A\\x1B[31m\\xFF'.\n"));
    EXPECT_TRUE(place.has("a\n\x1b[31m\xff/.tav/tav.state"));
}

TEST_F(Init, FailsWhereAFileIsInTheWay)
{
    place.write("plan.dwg", "plan");
    EXPECT_EQ(
        tav({"init", "plan.dwg"}),
        failed(
            "tav: Not able to create the version control folder: plan.dwg. Check that the folder is one and that you "
            "may write there.\n"));
    EXPECT_EQ(place.read("plan.dwg"), "plan");
}

TEST_F(Init, FailsWhereTheNameOfItsFolderIsTaken)
{
    place.write(".tav", "a file");
    EXPECT_EQ(
        tav({"init"}), failed("tav: Not able to create a tav directory in . Check that the folder is one and that you "
                              "may write there.\n"));
    EXPECT_EQ(place.read(".tav"), "a file");
}

TEST_F(Init, FailsWhereTheNameOfThePropertiesIsTaken)
{
    place.write(".tav/properties", "a file");
    EXPECT_EQ(
        tav({"init"}),
        failed(
            "tav: The folder './.tav/properties' cannot be made. Check the free space and your rights in '.tav'.\n"));
}

TEST_F(Init, MakesNothingForAServerThatIsNamedByAURL)
{
    for (std::string const url : {"https://drawings.example.org", "FILE:///srv/tav", "x-y+z.1://"}) {
        EXPECT_EQ(
            tav({"init", "north", "--server", url}),
            failed("tav: '" + url + "' is a URL, and servers are reached through folders only. Name a folder.\n"));
    }
    EXPECT_TRUE(place.list().empty());
    EXPECT_EQ(tav({"init", "north", "--server", "1://server"}).code, 0) << "no URL has such a beginning";
}

TEST_F(Init, FailsForAnEmptyName)
{
    EXPECT_EQ(
        tav({"init", ""}), misused("tav: FOLDER: The path is empty. Run 'tav init --help' to see how it is used.\n"));
    EXPECT_TRUE(place.list().empty());
}

} // namespace
} // namespace host_tests
