// Replacing the last commit.
#include "tests/host/history_test.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

using testing::ElementsAre;
using testing::HasSubstr;

class Amend : public HistoryTest {
protected:
    Amend()
    {
        repo.write("план.dwg", "one");
        EXPECT_EQ(commitAll("first").code, 0);
        repo.write("屋根.dwg", "roof");
        EXPECT_EQ(commitAll("second").code, 0);
    }

    std::string working(Arguments const& arguments) const
    {
        Outcome const outcome = tav(arguments);
        EXPECT_EQ(outcome.code, 0) << testing::PrintToString(outcome);
        return outcome.out;
    }

    /// A commit on a terminal, with a shell command as the editor.
    Outcome amendWith(std::string const& editor) const
    {
        Setting terminal = setting();
        terminal.isOnTerminal = true;
        terminal.input = "\n";
        terminal.environment = {"TAV_EDITOR=" + editor};
        return run(terminal, {"commit", "--amend"});
    }

    /// Another folder of the same repository gets what the server has now.
    void fetchElsewhere(std::string const& oldDatabase) const
    {
        std::string const other = repo.path() + "-other";
        fs::copy(repo.path(), other, fs::copy_options::recursive);
        std::ofstream(other + "/.tav/tav.db", std::ios::binary) << oldDatabase;
        EXPECT_EQ(tavIn(other, {"fetch"}).code, 0);
        fs::remove_all(other);
    }

    std::vector<std::string> numbers() const { return values({"log"}, "number"); }
    std::vector<std::string> paths(Arguments const& show) const { return values(show, "path"); }
};

TEST_F(Amend, MakesACommitWithTheNextNumberInPlaceOfTheLastOne)
{
    repo.write("屋根.dwg", "better roof");
    std::string const out = working({"commit", "--amend", "-am", "second corrected"});
    EXPECT_THAT(out, testing::MatchesRegex("Made commit 3 \\([0-9a-f]+\\), which replaces commit 2\\.\n"));
    EXPECT_THAT(numbers(), ElementsAre("3", "1"));
    EXPECT_THAT(values({"log", "-1"}, "message"), ElementsAre("second corrected"));
    EXPECT_THAT(values({"log", "-1"}, "author"), ElementsAre("ann@studio"));
    EXPECT_THAT(paths({"show", "3"}), ElementsAre("屋根.dwg"));
    EXPECT_THAT(values({"show", "2"}, "message"), ElementsAre("second")); // It stays where it is.
    EXPECT_EQ(working({"cat", "2:屋根.dwg"}), "roof");
    EXPECT_EQ(status(), kClean);
    EXPECT_THAT(working({"verify"}), HasSubstr("nothing is damaged"));
}

TEST_F(Amend, ChangesTheMessageAlone)
{
    repo.write("план.dwg", "unfinished");
    working({"commit", "--amend", "-m", "Ajoute le toit"});
    EXPECT_THAT(values({"show"}, "message"), ElementsAre("Ajoute le toit"));
    EXPECT_THAT(paths({"show"}), ElementsAre("屋根.dwg"));
    EXPECT_THAT(status(), HasSubstr("modified: план.dwg"));
}

TEST_F(Amend, KeepsTheMessageWithoutEditing)
{
    repo.write("more.txt", "more");
    working({"add", "more.txt"});
    working({"commit", "--amend", "--no-edit"});
    EXPECT_THAT(values({"show"}, "message"), ElementsAre("second"));
    EXPECT_THAT(paths({"show"}), ElementsAre("more.txt", "屋根.dwg"));
}

TEST_F(Amend, ShowsTheOldMessageInTheEditor)
{
    EXPECT_EQ(amendWith("f() { cp \"$1\" seen; sed -i 's/second/zweitens/' \"$1\"; }; f").code, 0);
    EXPECT_EQ(
        repo.read("seen"), "second\n# Say what has changed, and why. Lines that begin with '#' are ignored.\n"
                           "# Without a message, nothing is committed.\n");
    EXPECT_THAT(values({"show"}, "message"), ElementsAre("zweitens"));
}

TEST_F(Amend, KeepsTheMessageOfARefusedOne)
{
    working({"tag", "tender"});
    Outcome const refused = amendWith("f() { printf third >\"$1\"; }; f");
    EXPECT_EQ(refused.code, 1);
    EXPECT_THAT(
        refused.err,
        HasSubstr("  Your message is kept: tav commit --amend -F '" + repo.pathTo(".tav/COMMIT_MESSAGE") + "'"));
}

TEST_F(Amend, IsTakenBackAndDoneAgain)
{
    repo.write("屋根.dwg", "better roof");
    working({"add", "屋根.dwg"});
    std::string const before = status();
    working({"commit", "--amend", "-m", "corrected"});
    EXPECT_EQ(working({"undo"}), "Took back 'commit --amend -m corrected'.\n");
    EXPECT_EQ(status(), before);
    EXPECT_THAT(numbers(), ElementsAre("2", "1"));
    EXPECT_EQ(working({"redo"}), "Did again 'commit --amend -m corrected'.\n");
    EXPECT_EQ(status(), kClean);
    EXPECT_THAT(numbers(), ElementsAre("3", "1"));
    EXPECT_EQ(repo.read("屋根.dwg"), "better roof");
}

TEST_F(Amend, ReplacesTheFirstCommit)
{
    working({"undo"});
    working({"undo"}); // The staging of the second one.
    fs::remove(repo.pathTo("屋根.dwg"));
    repo.write("план.dwg", "better");
    working({"commit", "--amend", "-am", "first, corrected"});
    EXPECT_THAT(numbers(), ElementsAre("3"));
    EXPECT_EQ(working({"undo"}), "Took back 'commit --amend -m first, corrected'.\n");
    EXPECT_THAT(numbers(), ElementsAre("1"));
}

TEST_F(Amend, JoinsTheRenamesOfBothCommits)
{
    working({"mv", "план.dwg", "plan.dwg"});
    EXPECT_EQ(commitAll("third").code, 0);
    working({"mv", "plan.dwg", "図面.dwg"});
    working({"mv", "屋根.dwg", "roof.dwg"});
    working({"commit", "--amend", "--no-edit"});
    EXPECT_THAT(working({"show"}), HasSubstr("renamed:  план.dwg -> 図面.dwg"));
    EXPECT_THAT(working({"show"}), HasSubstr("renamed:  屋根.dwg -> roof.dwg"));
    EXPECT_THAT(values({"log", "図面.dwg"}, "message"), ElementsAre("third", "first"));
}

TEST_F(Amend, DoesNotRenameWhatTheReplacedCommitHasAdded)
{
    working({"mv", "屋根.dwg", "roof.dwg"});
    working({"commit", "--amend", "--no-edit"});
    EXPECT_THAT(working({"show"}), HasSubstr("new:      roof.dwg"));
    EXPECT_THAT(paths({"show"}), ElementsAre("roof.dwg"));
}

TEST_F(Amend, TakesAFileAtAPathThatHasBecomeFreeForAnother)
{
    working({"mv", "план.dwg", "plan.dwg"});
    EXPECT_EQ(commitAll("third").code, 0);
    working({"mv", "plan.dwg", "図面.dwg"});
    repo.write("plan.dwg", "drawn anew");
    working({"add", "plan.dwg"});
    working({"commit", "--amend", "--no-edit"});
    EXPECT_THAT(working({"show"}), HasSubstr("new:      plan.dwg"));
    EXPECT_THAT(working({"show"}), HasSubstr("renamed:  план.dwg -> 図面.dwg"));
}

TEST_F(Amend, ThatRepeatsTheCommitChangesNothing)
{
    EXPECT_THAT(
        working({"commit", "--amend", "--no-edit"}),
        testing::MatchesRegex("Nothing has changed since commit 2 \\([0-9a-f]+\\)\\.\n"));
    EXPECT_THAT(numbers(), ElementsAre("2", "1"));
}

TEST_F(Amend, OfAChangeThatNobodyHasStagedSaysSo)
{
    repo.write("屋根.dwg", "better roof");
    Outcome const nothing =
        failed("tav: Nothing is staged. Use 'tav add NAME' or 'tav add --all' to stage what to commit.\n");
    EXPECT_EQ(tav({"commit", "--amend", "--no-edit"}), nothing);
    EXPECT_EQ(tav({"commit", "-m", "second", "--author", "ann@studio"}), nothing);
    EXPECT_THAT(numbers(), ElementsAre("2", "1"));
}

TEST_F(Amend, RefusesToLeaveNothingOfTheCommit)
{
    working({"rm", "屋根.dwg"});
    EXPECT_EQ(
        tav({"commit", "--amend", "--no-edit"}),
        failed("tav: Commit 2 would change nothing any more. Nothing has been committed; leave out --amend for a new "
               "commit that takes it back.\n"));
    EXPECT_THAT(numbers(), ElementsAre("2", "1"));
    working({"commit", "-m", "third"});
    EXPECT_THAT(working({"show"}), HasSubstr("removed:  屋根.dwg"));
}

TEST_F(Amend, LeavesACommitThatATagNames)
{
    working({"tag", "tender"});
    std::string const before = state();
    EXPECT_EQ(
        tav({"commit", "--amend", "-m", "another"}),
        failed("tav: Commit 2 cannot be taken back: 'tender' has it. Make another commit that puts things right. "
               "'tav revert' makes one that does the opposite. Your working folder is as it was.\n"));
    EXPECT_THAT(numbers(), ElementsAre("2", "1"));
    EXPECT_EQ(state(), before);
}

TEST_F(Amend, LeavesACommitThatAnotherFolderHas)
{
    std::string const old = repo.read(".tav/tav.db");
    repo.write("屋根.dwg", "two");
    EXPECT_EQ(commitAll("third").code, 0);
    fetchElsewhere(old);
    EXPECT_EQ(
        tav({"commit", "--amend", "-m", "another"}),
        failed("tav: Commit 3 cannot be taken back: it may be in other working folders. Make another commit that puts "
               "things right. 'tav revert' makes one that does the opposite. Your working folder is as it was.\n"));
    EXPECT_THAT(numbers(), ElementsAre("3", "2", "1"));
}

TEST_F(Amend, NeedsACommit)
{
    working({"undo"});
    working({"undo"});
    working({"undo"});
    EXPECT_EQ(
        tav({"commit", "--amend", "-m", "first"}),
        failed("tav: There is no commit yet that could be replaced. Make one with 'tav commit'.\n"));
}

TEST_F(Amend, IsOnlyMadeAtTheEndOfABranch)
{
    working({"checkout", "1"});
    EXPECT_EQ(tav({"commit", "--amend", "-m", "first"}).code, 1);
    EXPECT_THAT(values({"branch"}, "commit"), ElementsAre("2"));
}

TEST_F(Amend, NeedsAMessageOrTheOldOne)
{
    EXPECT_EQ(
        tav({"commit", "--no-edit"}).err,
        "tav: --no-edit requires --amend. Run 'tav commit --help' to see how it is used.\n");
    EXPECT_EQ(tav({"commit", "--amend", "--no-edit", "-m", "x"}).code, 2);
}

} // namespace
} // namespace host_tests
