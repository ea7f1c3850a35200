// Folders that the user may not read: what is in them is neither offered nor taken for removed.
#include "tests/host/run_tav.h"
#include "tests/support/as_ordinary_user.h"
#include "tests/support/temp_folder.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <functional>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

namespace host_tests {
namespace {

constexpr mode_t kAll = 0777;
constexpr mode_t kNone = 0;
constexpr mode_t kNoList = 0311; ///< what is there can be opened by its name

class UnreadableFolder : public testing::Test {
protected:
    UnreadableFolder() { chmod(place.path().c_str(), kAll); }

    /// As an ordinary user: makes a repository with a commit, takes the rights to "plans", and gives them back after
    /// `body`.
    std::string with(mode_t rights, std::function<std::string()> const& body) const
    {
        return support::asOrdinaryUser([&] {
            umask(0);
            place.write("repository/note.txt", "note");
            place.write("repository/plans/a.dwg", "a");
            place.write("repository/plans/deep/b.dwg", "b");
            std::string text = say(tav({"init", "--server", place.pathTo("server")}));
            text += say(tav({"add", "--all"}));
            text += say(tav({"commit", "-m", "first", "--author", "ann"}));
            setRights(rights);
            text += body();
            setRights(kAll);
            return text;
        });
    }

    void setRights(mode_t rights) const { chmod(place.pathTo("repository/plans").c_str(), rights); }

    Outcome tav(Arguments const& arguments) const
    {
        Setting setting;
        setting.folder = place.pathTo("repository");
        setting.environment = {
            "HOME=" + place.path(), "XDG_CONFIG_HOME=" + place.path(), "XDG_DATA_HOME=" + place.path()};
        return run(setting, arguments);
    }

    /// Nothing for a command that succeeds.
    static std::string say(Outcome const& outcome)
    {
        return outcome.code == 0 ? "" : testing::PrintToString(outcome) + "\n";
    }

    static std::string text(Outcome const& outcome) { return testing::PrintToString(outcome); }

    support::TempFolder const place;
};

constexpr char const* kStatus = R"(On branch master

Folders that cannot be read:
  (their files are not known; the next commit keeps those that it has)
        plans/

)";

TEST_F(UnreadableFolder, IsShownAndRemovesNothing)
{
    EXPECT_EQ(with(kNone, [&] { return text(tav({"status"})); }), text(done(kStatus)));
}

TEST_F(UnreadableFolder, IsInTheDocumentOfStatus)
{
    EXPECT_NE(
        with(
            kNone,
            [&] {
                return tav({"status", "--json"}).out;
            })
            .find("    \"unreadable\" : [\n        \"plans\"\n    ]"),
        std::string::npos);
}

TEST_F(UnreadableFolder, IsNotedBesideWhatHasChanged)
{
    std::string const note = "tav: These folders cannot be read, so changes in them are not known. Check your "
                             "permissions for them:\n  plans/\n";
    for (Arguments const& arguments : {Arguments{"status", "-s"}, {"diff"}, {"diff", "--json"}, {"diff", "1"}}) {
        Outcome const expected = {0, arguments.back() == "--json" ? "[\n]\n" : "", note};
        EXPECT_EQ(with(kNone, [&] { return text(tav(arguments)); }), text(expected));
    }
    EXPECT_EQ(
        with(
            kAll,
            [&] {
                return text(tav({"status", "-s"})) + text(tav({"diff"}));
            }),
        text(done("")) + text(done("")));
}

TEST_F(UnreadableFolder, KeepsItsFilesInACommitEvenWhenTheyAreMissingThere)
{
    EXPECT_EQ(
        with(
            kNoList,
            [&] {
                unlink(place.pathTo("repository/plans/a.dwg").c_str());
                place.write("repository/new.txt", "new");
                std::string said = text(tav({"add", "--all"}));
                said += say(tav({"commit", "-m", "second", "--author", "ann", "--all-removed"}));
                return said + tav({"files", "--at", "2"}).out;
            }),
        text(Outcome{
            0, "Staged 1 file.\n",
            "tav: Nothing has been staged of these folders, which cannot be read. Check your permissions for them:\n"
            "  plans/\n"}) +
            ".tav/properties/ignore\nnew.txt\nnote.txt\nplans/a.dwg\nplans/deep/b.dwg\n");
}

TEST_F(UnreadableFolder, KeepsAStagedFileOutOfTheCommitUntilItCanBeRead)
{
    EXPECT_EQ(
        with(
            kAll,
            [&] {
                place.write("repository/plans/a.dwg", "changed");
                std::string said = say(tav({"add", "plans/a.dwg"}));
                setRights(kNone);
                said += text(tav({"commit", "-m", "second", "--author", "ann"}));
                return said + tav({"status"}).out;
            }),
        text(failed(
            "tav: 'plans/a.dwg' is staged, but its folder cannot be read. Check your permissions for it, or run 'tav "
            "unstage' for the file.\n")) +
            "On branch master\n\nStaged for the next commit:\n  (use 'tav unstage NAME' to take a file out)\n"
            "        modified: plans/a.dwg\n\nFolders that cannot be read:\n  (their files are not known; the next "
            "commit keeps those that it has)\n        plans/\n\n");
}

TEST_F(UnreadableFolder, IsNeitherAddedNorRemovedNorRenamed)
{
    EXPECT_EQ(
        with(
            kNone,
            [&] {
                std::string said = text(tav({"add", "plans"}));
                said += text(tav({"rm", "plans/a.dwg"}));
                return said + text(tav({"rm", "plans"}));
            }),
        text(failed("tav: 'plans' is a folder that cannot be read, or in one. Check your permissions for it.\n")) +
            text(failed("tav: 'plans/a.dwg' is in a folder that cannot be read. Check your permissions for it.\n")) +
            text(failed("tav: 'plans/a.dwg' is in a folder that cannot be read. Check your permissions for it.\n")));
    EXPECT_EQ(
        with(
            kAll,
            [&] {
                chmod(place.pathTo("repository/plans/deep").c_str(), kNone);
                std::string const moved = text(tav({"mv", "plans", "old"}));
                chmod(place.pathTo("repository/plans/deep").c_str(), kAll);
                return moved;
            }),
        text(failed("tav: The folder 'plans/deep' cannot be read, so its files would not be renamed. Check your "
                    "permissions for it.\n")));
}

/// Makes a folder in a folder, so often that no path leads to the last one.
void makeTooDeep(std::string const& top)
{
    std::string const name(200, 'd');
    int folder = open(top.c_str(), O_PATH | O_DIRECTORY);
    for (int i = 0; i < 25; ++i) {
        mkdirat(folder, name.c_str(), kAll);
        int const next = openat(folder, name.c_str(), O_PATH | O_DIRECTORY);
        close(folder);
        folder = next;
    }
    close(folder);
}

TEST_F(UnreadableFolder, IsOneThatIsTooDeepForAPath)
{
    place.makeFolder("repository");
    ASSERT_EQ(tav({"init", "--server", place.pathTo("server")}).code, 0);
    makeTooDeep(place.pathTo("repository"));
    std::string const out = tav({"status"}).out;
    std::size_t const title = out.find("Folders that cannot be read:\n");
    ASSERT_NE(title, std::string::npos) << out;
    EXPECT_GT(out.find("New, not staged:") - title, 4000U);
}

} // namespace
} // namespace host_tests
