#include "tests/host/history_test.h"

#include <gmock/gmock.h>

#include <filesystem>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

class Undo : public HistoryTest {
protected:
    Undo()
    {
        repo.write("plan.dwg", "one");
        EXPECT_EQ(commitAll("first").code, 0);
    }

    std::string working(Arguments const& arguments) const
    {
        Outcome const outcome = tav(arguments);
        EXPECT_EQ(outcome.code, 0) << testing::PrintToString(outcome);
        return outcome.out;
    }

    void permit(char const* name, fs::perms permissions) const { fs::permissions(repo.pathTo(name), permissions); }
    fs::perms permissionsOf(char const* name) const { return fs::status(repo.pathTo(name)).permissions(); }

    /// The commands of the log, the newest first.
    std::vector<std::string> commands() const { return values({"undo", "--list"}, "command"); }
    std::vector<std::string> states() const { return values({"undo", "--list"}, "state"); }
};

TEST_F(Undo, BringsBackWhatWasStagedInItsOrder)
{
    for (char const* const name : {"c.txt", "план.dwg", "図面.dwg"}) {
        repo.write(name, "new");
        working({"add", name});
    }
    std::string const before = state();
    working({"unstage", "план.dwg"});
    EXPECT_EQ(working({"undo"}), "Took back 'unstage план.dwg'.\n");
    EXPECT_EQ(state(), before);
    working({"undo"});
    EXPECT_THAT(
        status(),
        HasSubstr("New, not staged:\n  (use 'tav add NAME' or 'tav add --all' to stage)\n        図面.dwg\n"));
    EXPECT_EQ(working({"redo"}), "Did again 'add 図面.dwg'.\n");
    EXPECT_EQ(state(), before);
}

TEST_F(Undo, BringsRemovedFilesBack)
{
    working({"rm", "plan.dwg"});
    EXPECT_EQ(working({"undo"}), "Took back 'rm plan.dwg': 1 file written, 0 removed.\n");
    EXPECT_EQ(repo.read("plan.dwg"), "one");
    EXPECT_EQ(status(), kClean);
    working({"redo"});
    EXPECT_FALSE(repo.has("plan.dwg"));
}

TEST_F(Undo, BringsBackThePermissionsOfRemovedFiles)
{
    permit("plan.dwg", fs::perms(0750));
    working({"rm", "plan.dwg"});
    working({"undo"});
    EXPECT_EQ(permissionsOf("plan.dwg"), fs::perms(0750));
}

TEST_F(Undo, BringsBackThePermissionsOfFilesThatACheckoutRemoves)
{
    repo.write("屋根.dwg", "roof");
    permit("屋根.dwg", fs::perms(0440));
    EXPECT_EQ(commitAll("second").code, 0);
    working({"checkout", "1"});
    EXPECT_FALSE(repo.has("屋根.dwg"));
    working({"undo"});
    EXPECT_EQ(permissionsOf("屋根.dwg"), fs::perms(0440));
    EXPECT_EQ(repo.read("屋根.dwg"), "roof");
    EXPECT_EQ(status(), kClean);
}

TEST_F(Undo, BringsBackWhatRestoreHasOverwritten)
{
    repo.write("plan.dwg", "unsaved");
    working({"restore", "plan.dwg", "--force"});
    EXPECT_EQ(repo.read("plan.dwg"), "one");
    working({"gc"});
    working({"undo"});
    EXPECT_EQ(repo.read("plan.dwg"), "unsaved");
}

TEST_F(Undo, RenamesBackAndKeepsWhatWasEditedSince)
{
    working({"mv", "plan.dwg", "чертёж.dwg"});
    repo.write("чертёж.dwg", "edited");
    EXPECT_EQ(working({"undo"}), "Took back 'mv plan.dwg чертёж.dwg'.\n");
    EXPECT_EQ(repo.read("plan.dwg"), "edited");
    EXPECT_FALSE(repo.has("чертёж.dwg"));
}

TEST_F(Undo, LeavesAFileThatHasTakenTheOldName)
{
    working({"mv", "plan.dwg", "roof.dwg"});
    repo.write("plan.dwg", "another");
    EXPECT_EQ(
        tav({"undo"}), failed("tav: 'mv plan.dwg roof.dwg' cannot be taken back. Nothing has changed; see 'tav undo "
                              "--list':\n  There is another 'plan.dwg' by now.\n"));
    EXPECT_EQ(repo.read("plan.dwg"), "another");
    EXPECT_EQ(repo.read("roof.dwg"), "one");
}

TEST_F(Undo, GoesBackToTheCommitWithWhatWasDiscarded)
{
    repo.write("plan.dwg", "two");
    EXPECT_EQ(commitAll("second").code, 0);
    repo.write("plan.dwg", "unsaved");
    working({"checkout", "1", "--force"});
    EXPECT_EQ(repo.read("plan.dwg"), "one");
    working({"undo"});
    EXPECT_EQ(repo.read("plan.dwg"), "unsaved");
    EXPECT_THAT(status(), HasSubstr("modified: plan.dwg"));
}

TEST_F(Undo, DoesNotCountAMoveToWhereOneIs)
{
    std::vector<std::string> const before = commands();
    working({"switch", "master"});
    working({"switch", "--force", "master"});
    working({"checkout", "1"});
    EXPECT_EQ(commands(), before);
}

TEST_F(Undo, OverwritesOnlyByForceAndKeepsThatToo)
{
    working({"rm", "plan.dwg"});
    repo.write("plan.dwg", "drawn since");
    EXPECT_EQ(
        tav({"undo"}), failed("tav: These files have uncommitted changes, which would be lost. Commit them first, or "
                              "discard them with --force:\n  plan.dwg\n"));
    EXPECT_EQ(
        working({"undo", "--force"}), "Took back 'rm plan.dwg': 1 file written, 0 removed.\n"
                                      "        overwritten: plan.dwg\nRun 'tav redo' to have those back.\n");
    EXPECT_EQ(repo.read("plan.dwg"), "one");
    working({"redo"});
    EXPECT_EQ(repo.read("plan.dwg"), "drawn since");
}

TEST_F(Undo, TakesACommitBackAndStagesItAgain)
{
    repo.write("plan.dwg", "two");
    working({"add", "plan.dwg"});
    std::string const before = status();
    working({"commit", "-m", "second", "--author", "ann@studio"});
    EXPECT_EQ(working({"undo"}), "Took back 'commit -m second'.\n");
    EXPECT_EQ(status(), before);
    EXPECT_THAT(values({"log"}, "number"), ElementsAre("1"));
    EXPECT_THAT(values({"branch"}, "commit"), ElementsAre("1"));
    EXPECT_THAT(values({"show", "2"}, "message"), ElementsAre("second")); // It stays where it is.
    working({"redo"});
    EXPECT_THAT(values({"log"}, "number"), ElementsAre("2", "1"));
    EXPECT_EQ(status(), kClean);
}

TEST_F(Undo, TakesTheFirstCommitBack)
{
    working({"undo"});
    EXPECT_EQ(working({"branch"}), "There is no branch yet.\n");
    EXPECT_THAT(status(), HasSubstr("new:      plan.dwg"));
    EXPECT_EQ(commitAll("anew").code, 0);
    EXPECT_THAT(values({"log"}, "number"), ElementsAre("2"));
    EXPECT_EQ(working({"verify"}).substr(0, 5), "Read ");
}

TEST_F(Undo, LeavesACommitThatATagNames)
{
    repo.write("plan.dwg", "two");
    EXPECT_EQ(commitAll("second").code, 0);
    working({"tag", "as built"});
    EXPECT_EQ(
        tav({"undo"}),
        failed("tav: Commit 2 cannot be taken back: 'as built' has it. Make another commit that puts "
               "things right. 'tav revert' makes one that does the opposite. Your working folder is as it was.\n"));
    EXPECT_EQ(status(), kClean);
}

TEST_F(Undo, HasNothingToDoAgainAfterAnotherCommand)
{
    repo.write("a.txt", "new");
    working({"add", "a.txt"});
    working({"undo"});
    repo.write("b.txt", "new");
    working({"add", "b.txt"});
    EXPECT_EQ(tav({"redo"}), failed("tav: There is nothing to redo. See 'tav undo --list'.\n"));
    EXPECT_THAT(commands(), ElementsAre("add b.txt", "add a.txt", "commit -m first", "add --all"));
    EXPECT_THAT(states(), ElementsAre("done", "superseded", "done", "done"));
}

TEST_F(Undo, IsForgottenOnRequestAndItsContentsGo)
{
    repo.write("plan.dwg", "unsaved");
    working({"restore", "plan.dwg", "--force"});
    EXPECT_EQ(working({"gc"}), "Removed 0 stored versions that no commit needs; 0 bytes freed.\n");
    EXPECT_THAT(working({"gc", "--drop-undo"}), HasSubstr("Removed 1 stored version that no commit needs; "));
    EXPECT_EQ(tav({"undo"}), failed("tav: There is nothing to undo. See 'tav undo --list'.\n"));
    EXPECT_EQ(status(), kClean);
}

TEST_F(Undo, KeepsContentsUpToTheSizeThatIsSet)
{
    for (std::string const content : {"12345", "67890", "abcde"}) {
        repo.write("plan.dwg", content);
        working({"restore", "plan.dwg", "--force"});
    }
    working({"config", "undo.size", "15"});
    EXPECT_EQ(working({"gc"}), "Removed 0 stored versions that no commit needs; 0 bytes freed.\n");
    working({"config", "undo.size", "14"});
    EXPECT_THAT(
        working({"gc"}), StartsWith("Forgot the 3 oldest commands that 'tav undo' could take back.\n"
                                    "Removed 1 stored version that no commit needs; "));
    EXPECT_EQ(commands().size(), 2U);
    working({"undo"});
    EXPECT_EQ(repo.read("plan.dwg"), "abcde");
}

TEST_F(Undo, KeepsTheNewestHoweverLittleRoomThereIs)
{
    repo.write("plan.dwg", "unsaved");
    working({"restore", "plan.dwg", "--force"});
    working({"config", "undo.size", "0"});
    working({"gc"});
    working({"undo"});
    EXPECT_EQ(repo.read("plan.dwg"), "unsaved");
}

TEST_F(Undo, IsForgottenAtATerminalOnlyByAYes)
{
    Setting terminal = setting();
    terminal.isOnTerminal = true;
    terminal.input = "n\n";
    EXPECT_EQ(run(terminal, {"gc", "--drop-undo"}).code, 1);
    EXPECT_EQ(commands().size(), 2U);
    terminal.input = "y\n";
    EXPECT_EQ(run(terminal, {"gc", "--drop-undo"}).code, 0);
    EXPECT_EQ(commands().size(), 0U);
}

TEST_F(Undo, ShowsWhatItWouldDoAndDoesNothing)
{
    working({"rm", "plan.dwg"});
    EXPECT_THAT(working({"undo", "--dry-run"}), HasSubstr("        write:  plan.dwg\n"));
    EXPECT_FALSE(repo.has("plan.dwg"));
    EXPECT_THAT(states(), ElementsAre("done", "done", "done"));
}

TEST_F(Undo, RefusesWhereTheFolderStandsElsewhere)
{
    repo.write("plan.dwg", "two");
    EXPECT_EQ(commitAll("second").code, 0);
    working({"branch", "вариант"});
    std::string const onMaster = state();
    std::string const onVariant = std::regex_replace(onMaster, std::regex("master"), "вариант");
    repo.write(".tav/tav.state", onVariant); // As an editor may do.
    EXPECT_EQ(
        tav({"undo"}), failed("tav: 'commit -m second' cannot be taken back. Nothing has changed; see 'tav undo "
                              "--list':\n  The working folder is at another commit or branch now.\n"));
    EXPECT_EQ(state(), onVariant);
    EXPECT_THAT(values({"log"}, "number"), ElementsAre("2", "1"));
}

TEST_F(Undo, RefusesWhereTheStagedFilesAreOthers)
{
    repo.write("a.txt", "new");
    repo.write("b.txt", "new");
    working({"add", "a.txt"});
    working({"add", "b.txt"});
    repo.write(".tav/tav.state", kFreshState); // As an editor may do.
    EXPECT_EQ(
        tav({"undo"}), failed("tav: 'add b.txt' cannot be taken back. Nothing has changed; see 'tav undo --list':\n"
                              "  Other files are staged by now.\n"));
    EXPECT_EQ(state(), kFreshState);
}

} // namespace
} // namespace host_tests
