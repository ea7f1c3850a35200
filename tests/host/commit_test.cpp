#include "tests/host/history_test.h"

#include <gmock/gmock.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace host_tests {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::MatchesRegex;
using testing::SizeIs;

class Commit : public HistoryTest {
protected:
    void remove(std::string const& name) const { ASSERT_EQ(unlink(repo.pathTo(name).c_str()), 0); }

    void move(std::string const& from, std::string const& to) const
    {
        ASSERT_EQ(rename(repo.pathTo(from).c_str(), repo.pathTo(to).c_str()), 0);
    }

    void setTime(std::string const& name, timespec time) const
    {
        timespec const times[] = {time, time};
        ASSERT_EQ(utimensat(AT_FDCWD, repo.pathTo(name).c_str(), times, 0), 0);
    }
};

TEST_F(Commit, TakesWhatIsStagedAndNothingElse)
{
    repo.write("a.dwg", "one");
    repo.write("b.dwg", "two");
    tav({"add", "a.dwg"});
    Outcome const outcome = tav({"commit", "-m", "the first"});
    EXPECT_EQ(outcome.code, 0);
    EXPECT_THAT(outcome.out, MatchesRegex("Made commit 1 \\([0-9a-f]{12}\\)\\.\n"));
    EXPECT_EQ(outcome.err, "");
    EXPECT_THAT(values({"show", "1"}, "path"), ElementsAre("a.dwg"));
    EXPECT_EQ(
        status(), "New, not staged:\n"
                  "  (use 'tav add NAME' or 'tav add --all' to stage)\n"
                  "        .tav/properties/ignore\n"
                  "        b.dwg\n\n");
}

TEST_F(Commit, GivesTheSameNameToTheSameContentAndOrder)
{
    repo.write("a.dwg", "one");
    std::string const first = commitAll("drawn").out;
    support::TempRepository const other;
    EXPECT_EQ(tavIn(other.path(), {"init"}).code, 0);
    other.write("a.dwg", "one");
    tavIn(other.path(), {"add", "--all"});
    EXPECT_EQ(tavIn(other.path(), {"commit", "-m", "drawn", "--author", "ann@studio"}).out, first);
    other.write("a.dwg", "two");
    EXPECT_NE(tavIn(other.path(), {"commit", "-m", "drawn", "--author", "ann@studio"}).out, first);
}

TEST_F(Commit, NotesAuthorMessageAndParents)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    repo.write("a.dwg", "two");
    commitAll("the \"second\"\nof two");
    EXPECT_THAT(values({"log"}, "number"), ElementsAre("2", "1"));
    EXPECT_THAT(values({"log"}, "author"), ElementsAre("ann@studio", "ann@studio"));
    std::vector<std::string> const hashes = values({"log"}, "hash");
    ASSERT_THAT(hashes, SizeIs(2));
    std::string const shownCommit = tav({"show"}).out;
    EXPECT_THAT(shownCommit, testing::StartsWith("Commit 2 (master)\nHash:   " + hashes[0] + "\nAuthor: ann@studio\n"));
    EXPECT_THAT(
        shownCommit, testing::EndsWith("\n\n    the \"second\"\n    of two\n\n        modified: a.dwg (3 bytes)\n"));
    EXPECT_THAT(
        tav({"show", "--json"}).out, testing::HasSubstr("\"parents\" : [\n        \"" + hashes[1] + "\"\n    ]"));
}

TEST_F(Commit, TakesFilesThatAreGoneWithoutStaging)
{
    repo.write("a.dwg", "one");
    repo.write("b.dwg", "two");
    commitAll("the first");
    remove("b.dwg");
    EXPECT_EQ(tav({"commit", "-m", "removed"}).code, 0);
    EXPECT_EQ(status(), kClean);
    EXPECT_THAT(values({"show", "2"}, "change"), ElementsAre("removed"));
}

TEST_F(Commit, TakesRenamesThatNobodyTold)
{
    repo.write("a.dwg", "one");
    repo.write("plans/b.dwg", "another drawing");
    commitAll("the first");
    move("plans/b.dwg", "c.dwg");
    EXPECT_EQ(
        status(), "Renamed:\n"
                  "  (the next commit takes these without staging)\n"
                  "        renamed:  plans/b.dwg -> c.dwg\n\n");
    EXPECT_EQ(tav({"commit", "-m", "renamed"}).code, 0);
    EXPECT_EQ(status(), kClean);
    EXPECT_THAT(values({"show"}, "previous"), ElementsAre("plans/b.dwg"));
    EXPECT_THAT(values({"show"}, "path"), ElementsAre("c.dwg"));
}

TEST_F(Commit, KeepsTheRevisionsOfARenamedDrawingTogether)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    tav({"mv", "a.dwg", "b.dwg"});
    repo.write("b.dwg", "two");
    commitAll("renamed and changed");
    std::vector<std::string> stores;
    for (std::string const& name : repo.list()) {
        if (name.find(".tf") != std::string::npos && name.back() != '/') {
            stores.push_back(name);
        }
    }
    EXPECT_THAT(stores, ElementsAre(testing::StartsWith(".tav/tf/a-")));
    EXPECT_THAT(values({"show"}, "previous"), ElementsAre("a.dwg"));
}

TEST_F(Commit, StoresEqualContentOnce)
{
    repo.write("a.txt", "equal content");
    repo.write("b.txt", "equal content");
    repo.write("c.dwg", "equal drawing");
    repo.write("d.dwg", "equal drawing");
    commitAll("the first");
    std::size_t stored = 0;
    for (std::string const& name : repo.list()) {
        bool const isContent = name.find(".tav/objects/") == 0 || name.find(".tav/tf/") == 0;
        stored += isContent && name.back() != '/' ? 1 : 0;
    }
    EXPECT_EQ(stored, 3U); // with the ignore file
    EXPECT_EQ(tav({"verify"}), done("Read 3 stored versions; nothing is damaged.\n"));
}

TEST_F(Commit, SaysThatThereIsNothingToCommit)
{
    EXPECT_EQ(commitAll("the first").code, 0);
    EXPECT_EQ(
        tav({"commit", "-m", "again"}),
        failed("tav: There are no modified or untracked files for commit. Change something first.\n"));
    repo.write("a.dwg", "one");
    EXPECT_EQ(
        tav({"commit", "-m", "again"}),
        failed("tav: Nothing is staged. Use 'tav add NAME' or 'tav add --all' to stage what to commit.\n"));
}

TEST_F(Commit, MakesNoSecondCommitWhenItsOrderIsRepeated)
{
    repo.write("a.dwg", "one");
    std::string const first = commitAll("the first").out;
    Outcome const again = tav({"commit", "-m", "the first", "--author", "ann@studio"});
    EXPECT_EQ(again, done("Nothing has changed since" + first.substr(std::string("Made").size())));
    EXPECT_THAT(values({"log"}, "number"), ElementsAre("1"));
}

TEST_F(Commit, RefusesStagedFilesThatAreAsTheyWereCommitted)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    repo.write("a.dwg", "two");
    tav({"add", "a.dwg"});
    repo.write("a.dwg", "one");
    EXPECT_EQ(
        tav({"commit", "-m", "again"}),
        failed("tav: The staged files are the same as in the last commit. Run 'tav unstage --all' to clear it.\n"));
    EXPECT_THAT(values({"log"}, "number"), ElementsAre("1"));
}

TEST_F(Commit, NamesAllStagedNewFilesThatAreGone)
{
    repo.write("a.dwg", "one");
    repo.write("b.dwg", "two");
    repo.write("c.dwg", "three");
    tav({"add", "a.dwg", "b.dwg", "c.dwg"});
    remove("a.dwg");
    remove("b.dwg");
    EXPECT_EQ(
        tav({"commit", "-m", "drawn"}),
        failed("tav: These new files are staged, but they are gone. Bring them back, or take them out of the commit "
               "with 'tav unstage', a file or folder, or --all:\n  a.dwg\n  b.dwg\n"));
    tav({"unstage", "a.dwg", "b.dwg"});
    EXPECT_EQ(tav({"commit", "-m", "drawn"}).code, 0);
    EXPECT_THAT(values({"show"}, "path"), ElementsAre("c.dwg"));
}

TEST_F(Commit, TakesAStagedFileThatIsGoneForRemovedIfItWasCommitted)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    repo.write("a.dwg", "two");
    tav({"add", "a.dwg"});
    remove("a.dwg");
    EXPECT_EQ(tav({"commit", "-m", "removed"}).code, 0);
    EXPECT_THAT(values({"show"}, "change"), ElementsAre("removed"));
}

TEST_F(Commit, FindsNothingChangedWhenMvTakesARenameByHandBack)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    move("a.dwg", "b.dwg");
    EXPECT_EQ(tav({"mv", "b.dwg", "a.dwg"}).code, 0);
    EXPECT_EQ(status(), kClean);
    tav({"mv", "a.dwg", "b.dwg"});
    move("b.dwg", "c.dwg");
    EXPECT_EQ(tav({"mv", "c.dwg", "a.dwg"}).code, 0);
    EXPECT_EQ(status(), kClean);
}

TEST_F(Commit, TakesAFileThatMvPutsInThePlaceOfACommittedOneForModified)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    move("a.dwg", "b.dwg");
    repo.write("b.dwg", "two");
    tav({"mv", "b.dwg", "a.dwg"});
    EXPECT_EQ(
        status(), "Staged for the next commit:\n"
                  "  (use 'tav unstage NAME' to take a file out)\n"
                  "        modified: a.dwg\n\n");
    EXPECT_EQ(tav({"commit", "-m", "changed"}).code, 0);
    EXPECT_THAT(values({"show"}, "change"), ElementsAre("modified"));
}

TEST_F(Commit, ShowsARenamedFileOnceWhenItsOldNameIsRemovedToo)
{
    std::string const renamed = "Staged for the next commit:\n"
                                "  (use 'tav unstage NAME' to take a file out)\n"
                                "        renamed:  plan.dwg -> q.dwg\n\n";
    repo.write("plan.dwg", "one");
    commitAll("the first");
    tav({"mv", "plan.dwg", "q.dwg"});
    EXPECT_EQ(
        tav({"rm", "plan.dwg"}), failed("tav: 'plan.dwg' has been renamed to 'q.dwg'. The next commit takes that.\n"));
    EXPECT_EQ(status(), renamed);
    repo.write("plan.dwg", "one");
    EXPECT_EQ(tav({"rm", "plan.dwg"}), done("Removed 1 file; the next commit takes that.\n"));
    EXPECT_EQ(status(), renamed);
}

TEST_F(Commit, KeepsBytesThatAreNotUtf8InTheLog)
{
    repo.write("a.dwg", "one");
    tav({"add", "a.dwg"});
    ASSERT_EQ(tav({"commit", "-m", "caf\xE9", "--author", "Andr\xE9@studio"}).code, 0);
    EXPECT_THAT(
        tav({"log"}).out, testing::StartsWith("1  caf\xE9  (master)\n"
                                              "   Andr\xE9 \xE2\xA6\x81 less than a minute ago ("));
}

TEST_F(Commit, RefusesAnEmptyMessage)
{
    repo.write("a.dwg", "one");
    tav({"add", "a.dwg"});
    EXPECT_EQ(tav({"commit"}).code, 2);
    EXPECT_EQ(
        tav({"commit", "-m", " \n"}),
        failed("tav: The message is empty. Say what has changed, and who made the change.\n"));
}

TEST_F(Commit, WantsAServer)
{
    support::TempRepository const bare;
    bare.write(".tav/tav.state", kFreshState);
    bare.write("a.dwg", "one");
    tavIn(bare.path(), {"add", "a.dwg"});
    EXPECT_EQ(
        tavIn(bare.path(), {"commit", "-m", "drawn"}),
        failed("tav: The repository has no server yet. Run 'tav init' to complete it.\n"));
    EXPECT_EQ(tavIn(bare.path(), {"init"}).code, 0);
    EXPECT_EQ(tavIn(bare.path(), {"commit", "-m", "drawn"}).code, 0);
}

TEST_F(Commit, TakesNamesOfAnyBytes)
{
    std::string const name = "H\xC3\xA4user \xF0\x9F\x8F\xA0/\xFF\xFE.dwg";
    repo.write(name, "one");
    EXPECT_EQ(commitAll("drawn \xF0\x9F\x8F\xA0").code, 0);
    EXPECT_EQ(status(), kClean);
    remove(name);
    EXPECT_EQ(tav({"restore", name}).code, 0);
    EXPECT_EQ(repo.read(name), "one");
    EXPECT_THAT(tav({"log"}).out, testing::StartsWith("1  drawn \xF0\x9F\x8F\xA0  (master)\n"));
}

TEST_F(Commit, ReadsAFileThatWasNotOlderThanTheCommand)
{
    repo.write("a.dwg", "one");
    timespec const tomorrow = {time(nullptr) + 86400, 7};
    setTime("a.dwg", tomorrow);
    commitAll("the first");
    EXPECT_EQ(status(), kClean);
    repo.write("a.dwg", "two");
    setTime("a.dwg", tomorrow);
    EXPECT_THAT(status(), testing::StartsWith("Modified, not staged:\n"));
}

TEST_F(Commit, FindsADrawingUnchangedThatWasOnlyTouched)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    setTime("a.dwg", {1700000000, 7});
    EXPECT_EQ(status(), kClean);
    EXPECT_EQ(tav({"add", "--all"}), done("Nothing new to stage.\n"));
}

TEST_F(Commit, ClearsStagingAndEntersTheIndex)
{
    repo.write("a.dwg", "one");
    setTime("a.dwg", {1700000000, 7});
    commitAll("the first");
    EXPECT_THAT(
        state(),
        MatchesRegex("\\{\n    \"head\" : \\{\n        \"reference\" : \"master\"\n    \\},\n    \"index\" : \\[\n.*"
                     "\"last_checked\" : 1700000000000000007,\n                \"modified\" : false\n            \\},\n"
                     "            \"path\" : \"a.dwg\"\n        \\}\n    \\]\n\\}"));
}

TEST_F(Commit, LeavesEverythingAsItIsWhenTheServerIsGone)
{
    repo.write("a.dwg", "one");
    tav({"add", "--all"});
    std::string const before = state();
    std::string const away = home() + "/data/tav/server.away";
    ASSERT_EQ(rename((home() + "/data/tav/server").c_str(), away.c_str()), 0);
    std::string const file = home() + "/data/tav/server";
    close(open(file.c_str(), O_CREAT | O_WRONLY, 0644));
    EXPECT_EQ(tav({"commit", "-m", "drawn"}).code, 1);
    EXPECT_EQ(state(), before);
    EXPECT_THAT(values({"log"}, "number"), IsEmpty());
    ASSERT_EQ(unlink(file.c_str()), 0);
    ASSERT_EQ(rename(away.c_str(), file.c_str()), 0);
    EXPECT_EQ(tav({"commit", "-m", "drawn"}).code, 0);
    EXPECT_THAT(values({"log"}, "number"), ElementsAre("1"));
}

TEST_F(Commit, KeepsACommittedFileThatIsIgnoredByNow)
{
    repo.write("a.old", "one");
    commitAll("the first");
    tav({"ignore", "--add", "^.*\\.old$"});
    repo.write("b.dwg", "two");
    commitAll("the second");
    EXPECT_THAT(values({"show"}, "change"), ElementsAre("modified", "added"));
    repo.write("a.old", "changed");
    EXPECT_THAT(status(), testing::HasSubstr("modified: a.old"));
}

TEST_F(Commit, TakesACopyOfARenamedFileForNew)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    tav({"mv", "a.dwg", "b.dwg"});
    repo.write("aa.dwg", "one");
    EXPECT_THAT(
        status(), testing::HasSubstr("New, not staged:\n"
                                     "  (use 'tav add NAME' or 'tav add --all' to stage)\n"
                                     "        aa.dwg\n"));
    EXPECT_EQ(tav({"commit", "-m", "renamed"}).code, 0);
    EXPECT_THAT(values({"show"}, "path"), ElementsAre("b.dwg"));
    EXPECT_TRUE(repo.has("aa.dwg"));
}

TEST_F(Commit, TakesACopyOfAFileThatWasRemovedOnPurposeForNew)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    repo.write("copy.dwg", "one");
    tav({"rm", "a.dwg"});
    EXPECT_EQ(tav({"commit", "-m", "removed"}).code, 0);
    EXPECT_THAT(values({"show"}, "path"), ElementsAre("a.dwg"));
    EXPECT_THAT(values({"show"}, "change"), ElementsAre("removed"));
}

TEST_F(Commit, TakesNoEmptyFileForARenamedOne)
{
    repo.write("empty.dwg", "");
    commitAll("the first");
    remove("empty.dwg");
    repo.write("other.dwg", "");
    EXPECT_THAT(status(), testing::HasSubstr("removed:  empty.dwg"));
}

TEST_F(Commit, NotesARenameThatWasStagedAsANewFile)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    move("a.dwg", "b.dwg");
    tav({"add", "--all"});
    EXPECT_THAT(status(), testing::HasSubstr("renamed:  a.dwg -> b.dwg"));
    EXPECT_EQ(tav({"commit", "-m", "renamed"}).code, 0);
    EXPECT_THAT(values({"show"}, "previous"), ElementsAre("a.dwg"));
}

TEST_F(Commit, IsLostToNoGcWithoutItsDatabase)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    repo.write(".tav/tav.db", "");
    EXPECT_EQ(tav({"gc"}).code, 1);
    EXPECT_EQ(tav({"verify"}).code, 1);
}

TEST_F(Commit, TakesAFileOfAnUnsafeNameForNoRenamedOne)
{
    repo.write("a.dwg", "one");
    commitAll("the first");
    move("a.dwg", "b\n.dwg");
    EXPECT_THAT(status(), testing::HasSubstr("removed:  a.dwg"));
    EXPECT_EQ(tav({"commit", "-m", "removed"}).code, 0);
    EXPECT_THAT(values({"show"}, "change"), ElementsAre("removed"));
}

TEST_F(Commit, RefusesAServerInTheWorkingFolder)
{
    support::TempRepository const other;
    EXPECT_EQ(
        tavIn(other.path(), {"init", "--server", "server"}),
        failed(
            "tav: '" + other.pathTo("server") +
            "' is inside the working folder. Name a folder outside of it for the server.\n"));
    EXPECT_FALSE(other.has("server"));
    EXPECT_THAT(tavIn(other.path(), {"init", "--server", "."}).err, testing::HasSubstr("is inside the working folder"));
    EXPECT_EQ(tavIn(other.path(), {"init", "--server", ".server"}).code, 0);
}

TEST_F(Commit, RefusesNamesThatNoSystemShallMeet)
{
    repo.write("a\x1b[31m.dwg", "one");
    repo.write("b\n.dwg", "two");
    repo.write(".tav/tav.state", stateWithAdded({"a\\u001B[31m.dwg", "b\\n.dwg"}));
    EXPECT_EQ(
        tav({"commit", "-m", "drawn"}),
        failed("tav: No commit can keep these names. Nothing has been committed; rename the files, or take them out "
               "with 'tav unstage NAME':\n"
               "  The path 'a\\x1B[31m.dwg' holds a control character or a line end.\n"
               "  The path 'b\\x0A.dwg' holds a control character or a line end.\n"));
}

TEST_F(Commit, IsShownWithItsControlCharactersEscapedOnATerminal)
{
    repo.write("a.dwg", "one");
    commitAll("red \x1b[31m");
    for (char const* const command : {"log", "show"}) {
        std::string const text = tavOnTerminal({command}).out;
        EXPECT_EQ(text.find('\x1b'), std::string::npos) << text;
        EXPECT_NE(text.find("red \\x1B[31m"), std::string::npos) << text;
    }
}

TEST_F(Commit, TakesTheChangedContentOfAFileThatWasMovedThereAndBack)
{
    repo.write("a.dwg", "old");
    repo.write("b.dwg", "same");
    commitAll("first");
    repo.write("a.dwg", "new");
    tav({"add", "a.dwg"});
    tav({"mv", "a.dwg", "away.dwg"});
    tav({"mv", "b.dwg", "off.dwg"});
    tav({"mv", "away.dwg", "a.dwg"});
    tav({"mv", "off.dwg", "b.dwg"});
    EXPECT_EQ(values({"status"}, "path"), (std::vector<std::string>{"a.dwg"}));
    EXPECT_EQ(values({"status"}, "change"), (std::vector<std::string>{"modified"}));
    EXPECT_EQ(tav({"commit", "-m", "second", "--author", "ann@studio"}).code, 0);
    EXPECT_EQ(status(), kClean);
}

} // namespace
} // namespace host_tests
