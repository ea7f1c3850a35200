#include "tests/host/tav_test.h"
#include "tests/support/rows.h"

#include <algorithm>
#include <filesystem>

namespace host_tests {
namespace {

struct Rename {
    std::string from;
    std::string to;
};

/// The state of a new repository in which files were renamed; in ascending order of their new paths, which are staged
/// in the order `staged` or the same.
std::string stateWithRenames(std::vector<Rename> const& renames, std::vector<std::string> staged = {})
{
    std::string text = "{\n    \"head\" : {\n        \"reference\" : \"master\"\n    },\n    \"renames\" : [";
    char const* separator = "\n";
    for (Rename const& rename : renames) {
        text += separator;
        text += "        {\n            \"new\" : \"" + rename.to + "\",\n            \"previous\" : \"" + rename.from +
                "\"\n        }";
        separator = ",\n";
    }
    if (staged.empty()) {
        for (Rename const& rename : renames) {
            staged.push_back(rename.to);
        }
    }
    text += "\n    ],\n    \"staged_files\" : [";
    separator = "\n";
    for (std::string const& path : staged) {
        text += separator;
        text +=
            "        {\n            \"file_change\" : \"added\",\n            \"path\" : \"" + path + "\"\n        }";
        separator = ",\n";
    }
    return text + "\n    ]\n}";
}

class Mv : public TavTest {
protected:
    /// Runs a command that has to fail with `message` and to change nothing.
    void expectRefusal(Arguments const& names, std::string const& message) const
    {
        std::vector<std::string> const before = filesOfTheUser();
        std::string const stateBefore = state();
        Arguments arguments = {"mv"};
        arguments.insert(arguments.end(), names.begin(), names.end());
        EXPECT_EQ(tav(arguments), failed("tav: " + message + "\n"));
        EXPECT_EQ(filesOfTheUser(), before);
        EXPECT_EQ(state(), stateBefore);
    }

    /// All entries but the lock, which the first change makes.
    std::vector<std::string> filesOfTheUser() const
    {
        std::vector<std::string> names = repo.list();
        names.erase(std::remove(names.begin(), names.end(), ".tav/tav.lock"), names.end());
        return names;
    }

    std::string cannotMove(std::string const& from, std::string const& to, std::string const& why) const
    {
        return "'" + repo.pathTo(from) + "' cannot be moved to '" + repo.pathTo(to) + "': " + why +
               ". Check that the folder exists and that you may write there.";
    }

    std::string isTaken(std::string const& to) const
    {
        return "'" + repo.pathTo(to) + "' exists already. Choose another name, or move that one away first.";
    }
};

TEST_F(Mv, RenamesAFileAndStagesThat)
{
    repo.write("a.dwg", "drawing");
    EXPECT_EQ(tav({"mv", "a.dwg", "b.dwg"}), done("Renamed 'a.dwg' to 'b.dwg'.\n"));
    EXPECT_EQ(repo.read("b.dwg"), "drawing");
    EXPECT_FALSE(repo.has("a.dwg"));
    EXPECT_EQ(state(), stateWithRenames({{"a.dwg", "b.dwg"}}));
}

TEST_F(Mv, RenamesAStagedFileInItsStead)
{
    repo.add({"a.dwg", "z.dwg"});
    tav({"add", "a.dwg", "z.dwg"});
    EXPECT_EQ(tav({"mv", "a.dwg", "b.dwg"}), done("Renamed 'a.dwg' to 'b.dwg'.\n"));
    EXPECT_EQ(state(), stateWithRenames({{"a.dwg", "b.dwg"}}, {"z.dwg", "b.dwg"}));
}

TEST_F(Mv, RemembersTheFirstPathOfAFileRenamedTwice)
{
    repo.add({"a.dwg"});
    tav({"mv", "a.dwg", "b.dwg"});
    EXPECT_EQ(tav({"mv", "b.dwg", "c.dwg"}), done("Renamed 'b.dwg' to 'c.dwg'.\n"));
    EXPECT_EQ(state(), stateWithRenames({{"a.dwg", "c.dwg"}}));
}

TEST_F(Mv, ForgetsARenameThatIsTakenBack)
{
    repo.write("a.dwg", "drawing");
    tav({"mv", "a.dwg", "b.dwg"});
    tav({"mv", "b.dwg", "c.dwg"});
    EXPECT_EQ(tav({"mv", "c.dwg", "a.dwg"}), done("Renamed 'c.dwg' to 'a.dwg'.\n"));
    EXPECT_EQ(state(), kFreshState);
    EXPECT_EQ(repo.read("a.dwg"), "drawing");
}

TEST_F(Mv, SwapsTwoFilesByWayOfAThirdName)
{
    repo.write("a.dwg", "A");
    repo.write("b.dwg", "B");
    tav({"mv", "a.dwg", "c.dwg"});
    tav({"mv", "b.dwg", "a.dwg"});
    tav({"mv", "c.dwg", "b.dwg"});
    EXPECT_EQ(state(), stateWithRenames({{"b.dwg", "a.dwg"}, {"a.dwg", "b.dwg"}}));
    EXPECT_EQ(repo.read("a.dwg") + repo.read("b.dwg"), "BA");
}

TEST_F(Mv, RenamesAFileToAFormerNameOfAnother)
{
    repo.add({"a.dwg", "z.dwg"});
    tav({"mv", "a.dwg", "b.dwg"});
    EXPECT_EQ(tav({"mv", "z.dwg", "a.dwg"}), done("Renamed 'z.dwg' to 'a.dwg'.\n"));
    EXPECT_EQ(state(), stateWithRenames({{"z.dwg", "a.dwg"}, {"a.dwg", "b.dwg"}}, {"b.dwg", "a.dwg"}));
}

TEST_F(Mv, RenamesAFolderWithAllThatIsInIt)
{
    repo.add({"old/a.dwg", "old/north/b.dwg", "old/x.bak", "old/.hidden", "older/c.dwg"});
    EXPECT_EQ(tav({"mv", "old", "new"}), done("Renamed 'old' to 'new'.\n"));
    EXPECT_EQ(state(), stateWithRenames({{"old/a.dwg", "new/a.dwg"}, {"old/north/b.dwg", "new/north/b.dwg"}}));
    EXPECT_EQ(
        repo.list(), (std::vector<std::string>{
                         ".tav/", ".tav/tav.lock", ".tav/tav.state", "new/", "new/.hidden", "new/a.dwg", "new/north/",
                         "new/north/b.dwg", "new/x.bak", "older/", "older/c.dwg"}));
}

TEST_F(Mv, RemembersTheFirstPathsInAFolderRenamedTwiceAndForgetsThemWhenItIsBack)
{
    repo.add({"old/a.dwg", "old/b.dwg"});
    tav({"mv", "old/a.dwg", "old/c.dwg"});
    tav({"mv", "old", "new"});
    EXPECT_EQ(state(), stateWithRenames({{"old/b.dwg", "new/b.dwg"}, {"old/a.dwg", "new/c.dwg"}}));
    tav({"mv", "new", "old"});
    EXPECT_EQ(state(), stateWithRenames({{"old/a.dwg", "old/c.dwg"}}));
    tav({"mv", "old/c.dwg", "old/a.dwg"});
    EXPECT_EQ(state(), kFreshState);
}

struct TargetRow {
    char const* name;
    char const* folder;
    char const* from;
    char const* to;
    char const* path; ///< where the file is then
};

class MvTarget
    : public TavTest
    , public testing::WithParamInterface<TargetRow> {};

TEST_P(MvTarget, IsTakenFromTheCurrentFolder)
{
    TargetRow const& row = GetParam();
    repo.write("a.dwg", "drawing");
    repo.add({"plans/north/b.dwg"});
    EXPECT_EQ(
        tavIn(repo.pathTo(row.folder), {"mv", row.from, row.to}),
        done(std::string("Renamed 'a.dwg' to '") + row.path + "'.\n"));
    EXPECT_EQ(repo.read(row.path), "drawing");
    EXPECT_EQ(state(), stateWithRenames({{"a.dwg", row.path}}));
}

INSTANTIATE_TEST_SUITE_P(
    Folders, MvTarget,
    testing::Values(
        TargetRow{"Here", ".", "a.dwg", "b.dwg", "b.dwg"}, TargetRow{"WithoutExtension", ".", "a.dwg", "b", "b"},
        TargetRow{"OtherCase", ".", "a.dwg", "A.dwg", "A.dwg"},
        TargetRow{"IntoAFolder", ".", "a.dwg", "plans", "plans/a.dwg"},
        TargetRow{"IntoAFolderWithSlash", ".", "a.dwg", "plans/", "plans/a.dwg"},
        TargetRow{"IntoAFolderUnderANewName", ".", "a.dwg", "plans/c.dwg", "plans/c.dwg"},
        TargetRow{"IntoTheCurrentFolder", "plans", "../a.dwg", ".", "plans/a.dwg"},
        TargetRow{"IntoTheFolderAbove", "plans/north", "../../a.dwg", "..", "plans/a.dwg"},
        TargetRow{"WithDots", "plans", "north/../../a.dwg", "./north/../c.dwg", "plans/c.dwg"}),
    support::rowName);

TEST_F(Mv, MovesAFileToTheWorkingFolder)
{
    repo.add({"plans/a.dwg"});
    EXPECT_EQ(tavIn(repo.pathTo("plans"), {"mv", "a.dwg", ".."}), done("Renamed 'plans/a.dwg' to 'a.dwg'.\n"));
    EXPECT_EQ(state(), stateWithRenames({{"plans/a.dwg", "a.dwg"}}));
}

TEST_F(Mv, MovesAFolderIntoAnother)
{
    repo.add({"north/a.dwg", "plans/b.dwg"});
    EXPECT_EQ(tav({"mv", "north", "plans"}), done("Renamed 'north' to 'plans/north'.\n"));
    EXPECT_EQ(state(), stateWithRenames({{"north/a.dwg", "plans/north/a.dwg"}}));
    EXPECT_EQ(tav({"mv", "plans/north", "south/"}), done("Renamed 'plans/north' to 'south'.\n"));
    EXPECT_EQ(state(), stateWithRenames({{"north/a.dwg", "south/a.dwg"}}));
}

TEST_F(Mv, TakesAbsolutePaths)
{
    repo.add({"a.dwg"});
    EXPECT_EQ(
        tavIn("/", {"-C", repo.path(), "mv", repo.pathTo("a.dwg"), repo.pathTo("b.dwg")}),
        done("Renamed 'a.dwg' to 'b.dwg'.\n"));
}

TEST_F(Mv, RenamesALinkItself)
{
    repo.write("a.dwg", "drawing");
    repo.makeLink("link.dwg", "a.dwg");
    EXPECT_EQ(tav({"mv", "link.dwg", "other.dwg"}), done("Renamed 'link.dwg' to 'other.dwg'.\n"));
    EXPECT_TRUE(std::filesystem::is_symlink(repo.pathTo("other.dwg")));
    EXPECT_TRUE(repo.has("a.dwg"));
}

TEST_F(Mv, RenamesFilesOfOddNames)
{
    repo.add({"a (1).dwg", "\xff\n.dwg"});
    EXPECT_EQ(tav({"mv", "a (1).dwg", "[План].dwg"}), done("Renamed 'a (1).dwg' to '[План].dwg'.\n"));
    EXPECT_EQ(tavOnTerminal({"mv", "\xff\n.dwg", "\xfe.dwg"}), done("Renamed '\\xFF\\x0A.dwg' to '\\xFE.dwg'.\n"));
    EXPECT_EQ(state(), stateWithRenames({{"a (1).dwg", "[План].dwg"}, {"\\uDCFF\\n.dwg", "\\uDCFE.dwg"}}));
}

TEST_F(Mv, TakesAFileForNewThatNoCommitCanHold)
{
    repo.add({"\xf0\x9f\xbf\xbe.dwg"}); // No character: its code is set apart for ever.
    EXPECT_EQ(tav({"mv", "\xf0\x9f\xbf\xbe.dwg", "a.dwg"}), done("Renamed '\xf0\x9f\xbf\xbe.dwg' to 'a.dwg'.\n"));
    EXPECT_EQ(state(), stateWithAdded({"a.dwg"}));
}

TEST_F(Mv, NeverReplacesAFile)
{
    repo.write("a.dwg", "A");
    repo.write("b.dwg", "B");
    repo.write("plans/a.dwg", "C");
    repo.write("x.bak", "D");
    repo.makeLink("dangling.dwg", "nowhere");
    expectRefusal({"a.dwg", "b.dwg"}, isTaken("b.dwg"));
    expectRefusal({"a.dwg", "plans"}, isTaken("plans/a.dwg"));
    expectRefusal({"a.dwg", "a.dwg"}, isTaken("a.dwg"));
    expectRefusal({"plans", "b.dwg"}, isTaken("b.dwg"));
    expectRefusal({"a.dwg", "dangling.dwg"}, isTaken("dangling.dwg"));
    EXPECT_EQ(repo.read("a.dwg") + repo.read("b.dwg") + repo.read("plans/a.dwg"), "ABC");
}

TEST_F(Mv, FailsForWhatIsNotOfTheRepository)
{
    repo.add({"a.dwg", "x.bak", ".hidden", "empty/.keep"});
    repo.makeFolder("plans");
    repo.makeLink("link", "plans");
    for (std::string const name : {"nothing", "x.bak", ".hidden", "empty", "link", "."}) {
        expectRefusal(
            {name, "b.dwg"}, "'" + name + "' is not a file or folder of the repository. Run 'tav files' to see those.");
    }
}

TEST_F(Mv, FailsForPathsOutsideOfTheRepository)
{
    repo.add({"a.dwg"});
    std::string const advice = " is not located in the current repository. Name a file below '" + repo.path() + "'.";
    expectRefusal({"../x", "b.dwg"}, "'../x'" + advice);
    expectRefusal({"a.dwg", "/tmp"}, "'/tmp'" + advice);
    expectRefusal({"a.dwg", ".."}, "'..'" + advice);
}

TEST_F(Mv, FailsForEmptyNames)
{
    repo.add({"a.dwg"});
    expectRefusal({"", "b.dwg"}, "The name is empty. Type '.' for the folder that you are in.");
    expectRefusal({"a.dwg", ""}, "The name is empty. Type '.' for the folder that you are in.");
}

TEST_F(Mv, LeavesTheFilesOfTheRepositoryItselfWhereTheyAre)
{
    repo.ignore("");
    for (std::string const name : {".tav", ".tav/properties", ".tav/properties/ignore"}) {
        expectRefusal({name, "b"}, "'" + name + "' belongs to the repository itself. It cannot be moved.");
    }
}

TEST_F(Mv, LikeRmRefusesTheFolderOfTheRepositoryItself)
{
    EXPECT_EQ(tav({"rm", ".tav"}), failed("tav: '.tav' belongs to the repository itself. It cannot be removed.\n"));
}

TEST_F(Mv, FailsForNamesThatTheRepositoryWouldNotKeep)
{
    repo.add({"a.dwg", "plans/b.dwg"});
    repo.ignore("^old$\n^.*\\.bak$\n");
    repo.makeFolder("old");
    auto const refused = [](std::string const& to) {
        return "The repository would not keep '" + to +
               "': its name is hidden or ignored. Choose another name, or see 'tav "
               "ignore'.";
    };
    expectRefusal({"a.dwg", "a.bak"}, refused("a.bak"));
    expectRefusal({"a.dwg", ".a.dwg"}, refused(".a.dwg"));
    expectRefusal({"a.dwg", "old"}, refused("old/a.dwg"));
    expectRefusal({"a.dwg", "old/b.dwg"}, refused("old/b.dwg"));
    expectRefusal({"a.dwg", ".tav/properties/b.dwg"}, refused(".tav/properties/b.dwg"));
    expectRefusal({"a.dwg", ".tav"}, refused(".tav/a.dwg"));
    expectRefusal({"plans", "old"}, refused("old/plans"));
    expectRefusal({"plans", ".plans"}, refused(".plans"));
}

TEST_F(Mv, FailsForFoldersBehindLinks)
{
    support::TempFolder const elsewhere;
    repo.add({"a.dwg", "plans/north/b.dwg"});
    repo.makeLink("link", elsewhere.path());
    repo.makeLink("plans/inside", "north");
    expectRefusal(
        {"a.dwg", "link"},
        "The repository would not keep 'link/a.dwg': '" + repo.pathTo("link") + "' is a link. Choose another folder.");
    expectRefusal(
        {"plans", "link/plans"},
        "The repository would not keep 'link/plans': '" + repo.pathTo("link") + "' is a link. Choose another folder.");
    expectRefusal(
        {"a.dwg", "plans/inside/c.dwg"}, "The repository would not keep 'plans/inside/c.dwg': '" +
                                             repo.pathTo("plans/inside") + "' is a link. Choose another folder.");
    EXPECT_TRUE(elsewhere.list().empty());
}

TEST_F(Mv, FailsForFoldersThatAreNot)
{
    repo.add({"a.dwg", "b.dwg", "plans/c.dwg"});
    expectRefusal({"a.dwg", "nowhere/a.dwg"}, cannotMove("a.dwg", "nowhere/a.dwg", "No such file or directory"));
    expectRefusal({"a.dwg", "b.dwg/a.dwg"}, cannotMove("a.dwg", "b.dwg/a.dwg", "Not a directory"));
    expectRefusal({"a.dwg", "nowhere/"}, "There is no folder 'nowhere/'. Make it first.");
    expectRefusal({"a.dwg", "b.dwg/"}, "There is no folder 'b.dwg/'. Make it first.");
    expectRefusal({"plans", "plans"}, "'plans' cannot be moved into itself. Choose another place.");
    expectRefusal({"plans", "plans/deeper"}, "'plans' cannot be moved into itself. Choose another place.");
}

TEST_F(Mv, FailsForANameThatTheStateCannotHold)
{
    repo.add({"a.dwg"});
    expectRefusal(
        {"a.dwg", "\xf0\x9f\xbf\xbe.dwg"},
        "The path '\xf0\x9f\xbf\xbe.dwg' holds a character that cannot be recorded. Choose another name.");
}

TEST_F(Mv, MovesAFolderBackThatHasAFileWhichNoCommitCanKeep)
{
    repo.add({"old/a.dwg", "old/b\n.dwg"});
    expectRefusal(
        {"old", "new"}, "No commit can keep these names. Nothing has been staged; rename the files, or leave them out "
                        "with 'tav ignore':\n"
                        "  The path 'new/b\\x0A.dwg' holds a control character or a line end.");
}

TEST_F(Mv, FailsForNamesThatAreTooLong)
{
    repo.add({"a.dwg"});
    expectRefusal(
        {"a.dwg", std::string(256, 'x')},
        "The path '" + std::string(100, 'x') + "...' has a part that is longer than 255 bytes. Choose another name.");
}

TEST_F(Mv, FailsForNamesThatNoCommitTakes)
{
    repo.add({"a.dwg"});
    repo.makeFolder("plans");
    auto const refused = [](std::string const& name, std::string const& fault) {
        return "The path '" + name + "' " + fault + ". Choose another name.";
    };
    std::string const control = "holds a control character or a line end";
    expectRefusal({"a.dwg", "b\n.dwg"}, refused("b\\x0A.dwg", control));
    expectRefusal({"a.dwg", "plans/\x1b[2J.dwg"}, refused("plans/\\x1B[2J.dwg", control));
    expectRefusal(
        {"a.dwg", "plans/b\\c.dwg"},
        refused("plans/b\\c.dwg", "holds a backslash, which separates folders on other systems"));
    expectRefusal(
        {"a.dwg", "TAV~1"}, refused("TAV~1", "leads into the folder '.tav', which belongs to the repository"));
}

/// Expressions that take a matcher of the usual kind longer than anybody waits.
TEST_F(Mv, IsDoneWhateverTheRulesAre)
{
    std::string const name(30, 'a');
    std::string const longest(255, 'a');
    repo.add({"x", "y", "z"});
    repo.ignore("(a*)*b\n(a|a|aa)+$b\n(.*)*\\.bak\n(x+x+)+y\n");
    EXPECT_EQ(tav({"mv", "x", name}), done("Renamed 'x' to '" + name + "'.\n"));
    EXPECT_EQ(tav({"mv", "y", longest}), done("Renamed 'y' to '" + longest + "'.\n"));
    expectRefusal(
        {"z", name + "b"}, "The repository would not keep '" + name +
                               "b': its name is hidden or ignored. Choose another name, or see 'tav ignore'.");
}

TEST_F(Mv, AsksNoRuleAboutANameThatNoFileHas)
{
    repo.add({"a.dwg"});
    repo.ignore("(.*a){40}b\n^(a*)\\1b$\n");
    expectRefusal(
        {"a.dwg", std::string(100'000, 'a')},
        "The path '" + std::string(100, 'a') + "...' is longer than 4096 bytes. Choose another name.");
}

} // namespace
} // namespace host_tests
