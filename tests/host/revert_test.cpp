// Making the opposite of a commit.
#include "tests/host/history_test.h"

#include <gmock/gmock.h>

#include <filesystem>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

using testing::ElementsAre;
using testing::HasSubstr;

class Revert : public HistoryTest {
protected:
    /// The second commit changes, adds, removes and renames a file.
    Revert()
    {
        repo.write("план.dwg", "one");
        repo.write("notes.txt", "a");
        repo.write("gone/old.dwg", "old");
        EXPECT_EQ(commitAll("first").code, 0);
        EXPECT_EQ(tav({"mv", "план.dwg", "図面.dwg"}).code, 0);
        repo.write("notes.txt", "b");
        repo.write("屋根.dwg", "roof");
        fs::remove_all(repo.pathTo("gone"));
        EXPECT_EQ(commitAll("second\nwith more").code, 0);
        repo.write("later.txt", "later");
        EXPECT_EQ(commitAll("third").code, 0);
    }

    std::string working(Arguments const& arguments) const
    {
        Outcome const outcome = tav(arguments);
        EXPECT_EQ(outcome.code, 0) << testing::PrintToString(outcome);
        return outcome.out;
    }

    std::vector<std::string> numbers() const { return values({"log"}, "number"); }
};

TEST_F(Revert, MakesACommitThatDoesTheOpposite)
{
    EXPECT_THAT(
        working({"revert", "2"}), testing::MatchesRegex("Made commit 4 \\([0-9a-f]+\\), which reverts commit 2\\.\n"));
    EXPECT_EQ(repo.read("план.dwg"), "one");
    EXPECT_EQ(repo.read("notes.txt"), "a");
    EXPECT_EQ(repo.read("gone/old.dwg"), "old");
    EXPECT_EQ(repo.read("later.txt"), "later");
    EXPECT_FALSE(repo.has("屋根.dwg"));
    EXPECT_FALSE(repo.has("図面.dwg"));
    EXPECT_EQ(status(), kClean);
    EXPECT_THAT(numbers(), ElementsAre("4", "3", "2", "1"));
    std::string const shown = working({"show"});
    EXPECT_THAT(shown, HasSubstr("    Revert commit 2: \"second\"\n"));
    EXPECT_THAT(shown, HasSubstr("renamed:  図面.dwg -> план.dwg"));
}

TEST_F(Revert, OfARevertBringsTheChangesBack)
{
    working({"revert", "2"});
    working({"revert", "4", "-m", "doch"});
    EXPECT_EQ(repo.read("図面.dwg"), "one");
    EXPECT_EQ(repo.read("屋根.dwg"), "roof");
    EXPECT_FALSE(repo.has("план.dwg"));
    EXPECT_THAT(values({"show"}, "message"), ElementsAre("doch"));
    EXPECT_THAT(working({"diff", "3"}), "");
}

TEST_F(Revert, LeavesOtherChangesAsTheyAre)
{
    repo.write("later.txt", "changed");
    repo.write("new.txt", "new");
    working({"add", "new.txt"});
    std::string const before = status();
    working({"revert", "2"});
    EXPECT_EQ(status(), before);
    EXPECT_EQ(values({"show"}, "path").size(), 4U);
}

TEST_F(Revert, LeavesFilesAloneThatAreGone)
{
    fs::remove(repo.pathTo("later.txt"));
    working({"revert", "2"});
    EXPECT_THAT(status(), HasSubstr("later.txt"));
    EXPECT_THAT(working({"files", "--at", "@"}), HasSubstr("later.txt"));
}

TEST_F(Revert, ListsFilesThatHaveBeenChangedSince)
{
    repo.write("notes.txt", "c");
    repo.write("屋根.dwg", "better roof");
    EXPECT_EQ(commitAll("fourth").code, 0);
    EXPECT_EQ(
        tav({"revert", "2"}),
        failed("tav: These files are not as commit 2 left them. Nothing has changed; bring back single files with 'tav "
               "restore NAME --from COMMIT', and commit that:\n  notes.txt\n  屋根.dwg\n"));
    EXPECT_EQ(status(), kClean);
}

TEST_F(Revert, ListsFilesWithUncommittedChanges)
{
    repo.write("notes.txt", "unsaved");
    repo.write("план.dwg", "another");
    fs::remove(repo.pathTo("図面.dwg"));
    std::string const before = status();
    EXPECT_EQ(
        tav({"revert", "2"}),
        failed("tav: These files have changes that are in no commit. Nothing has changed; commit them, or put them "
               "aside with 'tav stash', and run the command again:\n  notes.txt\n  план.dwg\n"));
    EXPECT_EQ(status(), before);
    EXPECT_EQ(repo.read("notes.txt"), "unsaved");
    EXPECT_EQ(repo.read("план.dwg"), "another");
}

TEST_F(Revert, DoesNotDropWhatIsStaged)
{
    working({"mv", "屋根.dwg", "roof.dwg"});
    std::string const before = state();
    Outcome const refused = tav({"revert", "2"});
    EXPECT_EQ(refused.code, 1);
    EXPECT_THAT(refused.err, HasSubstr("  roof.dwg\n"));
    EXPECT_EQ(state(), before);
}

TEST_F(Revert, GoesOnWhereTheFilesAreChangedAlready)
{
    working({"revert", "2"});
    working({"undo"}); // The commit alone: as after a crash between files and commit.
    EXPECT_THAT(numbers(), ElementsAre("3", "2", "1"));
    working({"revert", "2"});
    EXPECT_THAT(numbers().size(), 4U);
    EXPECT_EQ(status(), kClean);
}

TEST_F(Revert, IsTakenBackInTwoSteps)
{
    EXPECT_EQ(status(), kClean);
    working({"revert", "2"});
    EXPECT_EQ(working({"undo"}), "Took back 'commit -m Revert commit 2: \"second\"'.\n");
    EXPECT_EQ(working({"undo"}), "Took back 'revert 2': 3 files written, 2 removed.\n");
    EXPECT_EQ(status(), kClean);
    EXPECT_EQ(repo.read("図面.dwg"), "one");
    working({"redo"});
    working({"redo"});
    EXPECT_EQ(status(), kClean);
    EXPECT_EQ(repo.read("план.dwg"), "one");
}

TEST_F(Revert, OfTheFirstCommitRemovesItsFiles)
{
    working({"revert", "3"});
    working({"revert", "2"});
    working({"revert", "1"});
    EXPECT_FALSE(repo.has("план.dwg"));
    EXPECT_EQ(working({"files", "--at", "@"}), "");
}

TEST_F(Revert, IsOnlyMadeAtTheEndOfABranch)
{
    working({"checkout", "2"});
    EXPECT_EQ(tav({"revert", "2"}).code, 1);
    EXPECT_TRUE(repo.has("屋根.dwg"));
}

TEST_F(Revert, NeedsACommit)
{
    EXPECT_EQ(tav({"revert"}).code, 2);
    EXPECT_EQ(tav({"revert", "99"}).code, 1);
}

} // namespace
} // namespace host_tests
