// The list of projects, and how it follows working folders.
#include "tests/host/run_tav.h"
#include "tests/support/rows.h"
#include "tests/support/temp_folder.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

/// A user with an own list of projects.
class Projects : public testing::Test {
protected:
    Outcome tavIn(std::string const& folder, Arguments const& arguments) const
    {
        Setting setting;
        setting.folder = folder;
        setting.environment = {"XDG_CONFIG_HOME=" + place.pathTo("config"), "XDG_DATA_HOME=" + place.pathTo("data")};
        return run(setting, arguments);
    }

    std::string make(std::string const& name) const
    {
        std::string const folder = place.pathTo(name);
        EXPECT_EQ(tavIn("/", {"init", folder}).code, 0);
        return folder;
    }

    std::string list() const { return tavIn("/", {"projects"}).out; }

    support::TempFolder const place;
};

class ProjectNames
    : public Projects
    , public testing::WithParamInterface<char const*> {};

TEST_P(ProjectNames, CanBeForgottenAndLoseNothing)
{
    std::string const folder = make(GetParam());
    std::string const name = GetParam();
    EXPECT_EQ(list(), name + "  " + folder + "\n");
    EXPECT_EQ(
        tavIn("/", {"projects", "--forget=" + name}),
        done("Took '" + name + "' in '" + folder + "' off the list. Its folder and its history stay.\n"));
    EXPECT_EQ(list(), "No project is known yet; 'tav init' adds one.\n");
    EXPECT_EQ(tavIn(folder, {"status"}).code, 0);
}

INSTANTIATE_TEST_SUITE_P(
    Scripts, ProjectNames, testing::Values("bridge", "Мост", "橋", "cafe\xCC\x81", "it's \"new\"", "-f"));

TEST_F(Projects, AreForgottenByTheirPath)
{
    std::string const folder = make("a/bridge");
    make("b/bridge");
    EXPECT_EQ(
        tavIn(place.pathTo("a"), {"projects", "--forget", "bridge/"}),
        done("Took 'bridge' in '" + folder + "' off the list. Its folder and its history stay.\n"));
    EXPECT_EQ(list(), "bridge  " + place.pathTo("b/bridge") + "\n");
}

TEST_F(Projects, AreNotForgottenWhileItIsNotClearWhichOneIsMeant)
{
    std::string const a = make("a/bridge");
    std::string const b = make("b/bridge");
    std::string const before = list();
    EXPECT_EQ(
        tavIn("/", {"projects", "--forget", "bridge"}),
        failed("tav: Several projects are called 'bridge'. Give the path of one:\n  " + a + "\n  " + b + "\n"));
    EXPECT_EQ(
        tavIn("/", {"projects", "--forget", "tunnel"}),
        failed("tav: No project is called 'tunnel'. Run 'tav projects' to see those that there are.\n"));
    EXPECT_EQ(list(), before);
}

TEST_F(Projects, AreFoundAgainWhereTheyWereMovedTo)
{
    std::string const folder = make("bridge");
    make("tunnel");
    fs::rename(folder, place.pathTo("Новый мост"));
    EXPECT_EQ(list(), "bridge  " + folder + "\ntunnel  " + place.pathTo("tunnel") + "\n");
    fs::create_directory(place.pathTo("Новый мост/plans"));
    tavIn(place.pathTo("Новый мост/plans"), {"status"});
    EXPECT_EQ(list(), "tunnel  " + place.pathTo("tunnel") + "\nbridge  " + place.pathTo("Новый мост") + "\n");
}

TEST_F(Projects, AreNotTakenForMovedWhenTheyAreCopied)
{
    std::string const folder = make("bridge");
    fs::copy(folder, place.pathTo("copy"), fs::copy_options::recursive);
    tavIn(place.pathTo("copy"), {"status"});
    EXPECT_EQ(list(), "bridge  " + folder + "\n");
}

TEST_F(Projects, AreFollowedWhenAnotherOneHasTakenTheirPlace)
{
    std::string const folder = make("bridge");
    fs::rename(folder, place.pathTo("old"));
    Setting other;
    other.environment = {"XDG_CONFIG_HOME=" + place.pathTo("others"), "XDG_DATA_HOME=" + place.pathTo("others")};
    EXPECT_EQ(run(other, {"init", folder}).code, 0);
    tavIn(place.pathTo("old"), {"status"});
    EXPECT_EQ(list(), "bridge  " + place.pathTo("old") + "\n");
}

TEST_F(Projects, HaveNoListMadeByCommandsThatOnlyRead)
{
    std::string const folder = make("bridge");
    fs::remove_all(place.pathTo("config"));
    EXPECT_EQ(tavIn(folder, {"status"}).code, 0);
    EXPECT_FALSE(place.has("config"));
}

} // namespace
} // namespace host_tests
