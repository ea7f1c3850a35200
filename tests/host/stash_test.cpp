// Putting unfinished work aside.
#include "tests/host/history_test.h"

#include "host/database/sqlite.h"

#include <gmock/gmock.h>

#include <filesystem>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

class Stash : public HistoryTest {
protected:
    /// A commit, and over it a file of each kind of change.
    Stash()
    {
        repo.write("план.dwg", "one");
        repo.write("notes.txt", "a");
        repo.write("gone/old.dwg", "old");
        repo.write("屋根.dwg", "roof");
        EXPECT_EQ(commitAll("first").code, 0);
        repo.write("план.dwg", "unfinished");
        repo.write("neu/größe.dwg", "new");
        repo.write("staged.txt", "staged");
        EXPECT_EQ(tav({"add", "staged.txt"}).code, 0);
        EXPECT_EQ(tav({"rm", "gone/old.dwg"}).code, 0);
        EXPECT_EQ(tav({"mv", "屋根.dwg", "roof.dwg"}).code, 0);
        before_ = status();
    }

    std::string working(Arguments const& arguments) const
    {
        Outcome const outcome = tav(arguments);
        EXPECT_EQ(outcome.code, 0) << testing::PrintToString(outcome);
        return outcome.out;
    }

    std::vector<std::string> ids() const { return values({"stash", "list"}, "id"); }

    void expectAsBefore() const
    {
        EXPECT_EQ(status(), before_);
        EXPECT_EQ(repo.read("план.dwg"), "unfinished");
        EXPECT_EQ(repo.read("neu/größe.dwg"), "new");
        EXPECT_EQ(repo.read("staged.txt"), "staged");
        EXPECT_EQ(repo.read("roof.dwg"), "roof");
        EXPECT_FALSE(repo.has("gone/old.dwg"));
    }

    std::string before_;
};

TEST_F(Stash, LeavesTheFolderAsTheCommitHasIt)
{
    EXPECT_EQ(working({"stash"}), "Put 6 files aside as stash 1. 'tav stash pop' brings them back.\n");
    EXPECT_EQ(status(), kClean);
    EXPECT_EQ(repo.read("план.dwg"), "one");
    EXPECT_EQ(repo.read("gone/old.dwg"), "old");
    EXPECT_EQ(repo.read("屋根.dwg"), "roof");
    EXPECT_FALSE(repo.has("neu"));
    EXPECT_FALSE(repo.has("staged.txt"));
}

TEST_F(Stash, PopBringsExactlyThatBack)
{
    working({"stash"});
    working({"gc"});
    EXPECT_EQ(working({"stash", "pop"}), "Brought back stash 1: 4 files written, 2 removed.\n");
    expectAsBefore();
    EXPECT_THAT(ids(), IsEmpty());
}

TEST_F(Stash, IsTakenBackAndDoneAgain)
{
    working({"shelve", "-m", "half a roof"});
    working({"undo"});
    expectAsBefore();
    EXPECT_THAT(ids(), IsEmpty());
    working({"redo"});
    EXPECT_EQ(status(), kClean);
    EXPECT_THAT(ids(), ElementsAre("1"));
    working({"stash", "pop"});
    working({"undo"});
    EXPECT_EQ(status(), kClean);
    EXPECT_THAT(ids(), ElementsAre("1"));
    working({"redo"});
    expectAsBefore();
    EXPECT_THAT(ids(), IsEmpty());
}

TEST_F(Stash, ThatIsDroppedComesBackWithUndo)
{
    working({"stash"});
    EXPECT_EQ(working({"stash", "drop"}), "Dropped stash 1; 'tav undo' brings it back.\n");
    EXPECT_THAT(ids(), IsEmpty());
    working({"gc"});
    EXPECT_EQ(working({"undo"}), "Took back 'stash drop 1'.\n");
    working({"stash", "pop"});
    expectAsBefore();
}

TEST_F(Stash, StaysWhenTheLogIsForgotten)
{
    working({"stash"});
    working({"gc", "--drop-undo"});
    working({"stash", "pop"});
    expectAsBefore();
    working({"stash"});
    working({"stash", "drop"});
    working({"gc", "--drop-undo"});
    EXPECT_THAT(ids(), IsEmpty());
    EXPECT_THAT(working({"verify"}), HasSubstr("Read 5 stored versions"));
}

TEST_F(Stash, TakesOnlyTheNamedFiles)
{
    EXPECT_EQ(
        working({"stash", "план.dwg", "neu"}), "Put 2 files aside as stash 1. 'tav stash pop' brings them back.\n");
    EXPECT_EQ(repo.read("план.dwg"), "one");
    EXPECT_FALSE(repo.has("neu"));
    EXPECT_THAT(status(), HasSubstr("renamed:  屋根.dwg -> roof.dwg"));
    EXPECT_THAT(status(), HasSubstr("new:      staged.txt"));
    working({"stash", "pop"});
    expectAsBefore();
}

TEST_F(Stash, KeepsBothNamesOfARenamedFileTogether)
{
    working({"stash", "push", "roof.dwg"});
    EXPECT_TRUE(repo.has("屋根.dwg"));
    EXPECT_FALSE(repo.has("roof.dwg"));
    EXPECT_THAT(working({"stash", "show"}), HasSubstr("\n        renamed:  屋根.dwg -> roof.dwg\n"));
    working({"stash", "pop"});
    expectAsBefore();
}

TEST_F(Stash, IsListedWithItsMessageAndItsFiles)
{
    EXPECT_EQ(working({"stash", "list"}), "Nothing has been put aside.\n");
    working({"stash", "план.dwg", "-m", "полкрыши"});
    working({"stash", "staged.txt"});
    EXPECT_THAT(
        working({"stash", "list"}), testing::MatchesRegex("2  [-0-9: ]+  on master, commit 1, 1 file\n"
                                                          "1  [-0-9: ]+  on master, commit 1, 1 file: полкрыши\n"));
    EXPECT_THAT(working({"stash", "show", "1"}), HasSubstr("\n        modified: план.dwg\n"));
    EXPECT_THAT(values({"stash", "show", "1"}, "path"), ElementsAre("план.dwg"));
}

TEST_F(Stash, IsAppliedTwiceAndStays)
{
    working({"stash"});
    working({"stash", "apply", "1"});
    expectAsBefore();
    EXPECT_EQ(working({"stash", "apply"}), "Brought back stash 1: 0 files written, 0 removed.\n");
    expectAsBefore();
    EXPECT_THAT(ids(), ElementsAre("1"));
}

TEST_F(Stash, IsNotWrittenOverOtherChanges)
{
    working({"stash"});
    repo.write("план.dwg", "other work");
    repo.write("neu/größe.dwg", "other work");
    fs::remove(repo.pathTo("屋根.dwg"));
    std::string const before = status();
    EXPECT_EQ(
        tav({"stash", "pop"}),
        failed("tav: These files have other changes by now than what was put aside. Nothing has changed; commit these "
               "changes or put them aside too, and run the command again:\n  neu/größe.dwg\n  план.dwg\n"));
    EXPECT_EQ(status(), before);
    EXPECT_EQ(repo.read("план.dwg"), "other work");
    EXPECT_THAT(ids(), ElementsAre("1"));
}

TEST_F(Stash, IsNotStagedOverOtherChanges)
{
    working({"stash"});
    working({"rm", "план.dwg"});
    working({"undo"});
    working({"mv", "план.dwg", "roof.dwg"});
    Outcome const refused = tav({"stash", "pop"});
    EXPECT_EQ(refused.code, 1);
    EXPECT_THAT(refused.err, HasSubstr("  roof.dwg\n"));
}

TEST_F(Stash, ComesBackAtAnotherCommitWhereItsFilesAreTheSame)
{
    working({"stash"});
    repo.write("other.txt", "other");
    EXPECT_EQ(commitAll("second").code, 0);
    working({"stash", "pop"});
    expectAsBefore();
}

TEST_F(Stash, OfARenamedFileIsANewOneWhereTheOldNameIsGone)
{
    working({"stash", "roof.dwg"});
    working({"rm", "屋根.dwg"});
    EXPECT_EQ(commitAll("second").code, 0);
    working({"stash", "pop"});
    EXPECT_THAT(status(), HasSubstr("new:      roof.dwg"));
}

TEST_F(Stash, NeedsSomethingToPutAside)
{
    working({"stash"});
    EXPECT_EQ(
        tav({"stash"}), failed("tav: There is nothing to put aside. Nothing has changed since the last commit.\n"));
    EXPECT_EQ(
        tav({"stash", "none.txt"}),
        failed("tav: No changed file matches 'none.txt'. Run 'tav status' to see what has changed.\n"));
    EXPECT_EQ(
        tav({"stash", "pop", "5"}), failed("tav: There is no stash '5'. Run 'tav stash list' to see what there is.\n"));
}

TEST_F(Stash, LeavesIgnoredFilesAlone)
{
    working({"ignore", "--add", "*.bak"});
    repo.write("план.bak", "backup");
    working({"stash", "план.dwg", "staged.txt"});
    EXPECT_EQ(repo.read("план.bak"), "backup");
    EXPECT_EQ(tav({"stash", "план.bak"}).code, 1);
}

TEST_F(Stash, IsVerifiedAndItsDamageIsNamed)
{
    working({"stash", "staged.txt"});
    for (char const* const table : {"operation_files", "operation_staging", "operation_renames", "operations"}) {
        tav::Database(repo.pathTo(".tav/tav.db")).run(("DELETE FROM " + std::string(table)).c_str());
    }
    working({"gc"});
    EXPECT_EQ(working({"verify"}).substr(0, 7), "Read 6 ");
    for (fs::directory_entry const& entry : fs::directory_iterator(repo.pathTo(".tav/objects"))) {
        if (entry.is_regular_file()) {
            fs::resize_file(entry.path(), 3);
        }
    }
    EXPECT_THAT(tav({"verify"}).err, HasSubstr("for 'staged.txt' of the commands to undo or the stash: "));
}

TEST_F(Stash, NeedsACommitToGoBackTo)
{
    while (tav({"undo"}).code == 0) {
    }
    EXPECT_EQ(
        tav({"stash"}),
        failed("tav: There is no commit yet that the files could go back to. Make one with 'tav commit'.\n"));
}

} // namespace
} // namespace host_tests
