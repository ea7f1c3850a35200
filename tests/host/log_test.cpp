#include "tests/host/history_test.h"

#include <gmock/gmock.h>

#include <string>

namespace host_tests {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

/// Five commits about one drawing, which is renamed on the way, and other files.
class Log : public HistoryTest {
protected:
    Log()
    {
        repo.write("планы/крыша.dwg", "1");
        repo.write("notes.txt", "1");
        commitAll("Draws the roof");
        repo.write("notes.txt", "2");
        commitAll("Notes something");
        repo.write("планы/крыша.dwg", "changed");
        commitAll("Changes the roof");
        repo.makeFolder("planes");
        EXPECT_EQ(tav({"mv", "планы/крыша.dwg", "planes/屋根.dwg"}).code, 0);
        EXPECT_EQ(tav({"commit", "-m", "Renames the roof", "--author", "bob@studio"}).code, 0);
        EXPECT_EQ(tav({"rm", "planes/屋根.dwg"}).code, 0);
        EXPECT_EQ(tav({"commit", "-m", "Removes the roof", "--author", "ann@studio"}).code, 0);
    }

    /// The numbers of the commits that the command shows.
    std::vector<std::string> commits(Arguments arguments) const
    {
        arguments.insert(arguments.begin(), "log");
        return values(arguments, "number");
    }

    /// What it prints, without the dates.
    std::string lines(Arguments arguments) const
    {
        arguments.insert(arguments.begin(), "log");
        std::regex const date(" \\(\\d{4}-\\d\\d-\\d\\d \\d\\d:\\d\\d\\)\n");
        return std::regex_replace(tav(arguments).out, date, "\n");
    }
};

TEST_F(Log, FollowsAFileThroughItsRename)
{
    EXPECT_EQ(lines({"planes/屋根.dwg"}), R"(5  Removes the roof  (master)
   ann ⦁ less than a minute ago
   removed:  planes/屋根.dwg
4  Renames the roof
   bob ⦁ less than a minute ago
   renamed:  планы/крыша.dwg -> planes/屋根.dwg
3  Changes the roof
   ann ⦁ less than a minute ago
   modified: планы/крыша.dwg
1  Draws the roof
   ann ⦁ less than a minute ago
   new:      планы/крыша.dwg
)");
}

TEST_F(Log, EndsTheHistoryOfAFormerNameWithTheRename)
{
    EXPECT_THAT(commits({"планы/крыша.dwg"}), ElementsAre("4", "3", "1"));
    EXPECT_THAT(values({"log", "-1", "планы/крыша.dwg"}, "previous"), ElementsAre("планы/крыша.dwg"));
}

TEST_F(Log, FollowsAFolderAndWhatWasRenamedIntoIt)
{
    EXPECT_THAT(commits({"planes"}), ElementsAre("5", "4", "3", "1"));
    EXPECT_THAT(commits({"планы"}), ElementsAre("4", "3", "1"));
    EXPECT_THAT(commits({"."}), ElementsAre("5", "4", "3", "2", "1"));
}

TEST_F(Log, TakesANameThatWasUsedAgainForANewFile)
{
    repo.write("planes/屋根.dwg", "another one");
    commitAll("Draws another roof");
    EXPECT_THAT(values({"log", "-2", "planes/屋根.dwg"}, "change"), ElementsAre("added", "removed"));
}

TEST_F(Log, FollowsSeveralNames)
{
    EXPECT_THAT(commits({"notes.txt", "planes/屋根.dwg"}), ElementsAre("5", "4", "3", "2", "1"));
    EXPECT_THAT(commits({"notes.txt"}), ElementsAre("2", "1"));
}

TEST_F(Log, FindsAFileByTheEndOfItsPath)
{
    EXPECT_THAT(commits({"notes"}), ElementsAre("2", "1"));
    EXPECT_EQ(tav({"log", "крыша"}), failed("tav: No commit has a file 'крыша'. Run 'tav files' to see the names.\n"));
    EXPECT_THAT(commits({"3", "крыша"}), ElementsAre("3", "1"));
}

TEST_F(Log, BeginsAtACommit)
{
    EXPECT_THAT(commits({"@~2"}), ElementsAre("3", "2", "1"));
    EXPECT_THAT(commits({"3", "notes.txt"}), ElementsAre("2", "1"));
    EXPECT_THAT(commits({"3", "--", "notes.txt"}), ElementsAre("2", "1"));
    EXPECT_EQ(
        tav({"log", "1", "2", "--"}),
        failed("tav: There are 2 commits before '--'. Name at most 1; names of files come after '--'.\n"));
}

TEST_F(Log, RefusesAWordThatIsACommitAndAFile)
{
    repo.write("2", "a file");
    commitAll("Adds a file with a number for a name");
    EXPECT_EQ(
        tav({"log", "2"}), failed("tav: '2' names commit 2, and a file too. Type it before '--' for the commit, and "
                                  "after '--' for the file.\n"));
    EXPECT_THAT(commits({"2", "--"}), ElementsAre("2", "1"));
    EXPECT_THAT(commits({"--", "2"}), ElementsAre("6"));
}

TEST_F(Log, ShowsAsManyCommitsAsAreAskedFor)
{
    EXPECT_THAT(commits({"-2"}), ElementsAre("5", "4"));
    EXPECT_THAT(commits({"-n", "1", "notes.txt"}), ElementsAre("2"));
    EXPECT_THAT(commits({"notes.txt", "-1"}), ElementsAre("2"));
}

TEST_F(Log, RefusesANumberOfCommitsThatIsNone)
{
    for (std::string const count : {"abc", "0", "-1", "1.5", "1234567890123456789"}) {
        EXPECT_EQ(
            tav({"log", "--count=" + count}), misused(
                                                  "tav: --count: '" + count +
                                                  "' is not a number, 1 or more. Run 'tav log --help' to see how it is "
                                                  "used.\n"));
    }
}

TEST_F(Log, ShowsCommitsOfAnAuthor)
{
    EXPECT_THAT(commits({"--author", "bob"}), ElementsAre("4"));
    EXPECT_THAT(commits({"--author", "studio", "-2"}), ElementsAre("5", "4"));
    EXPECT_THAT(commits({"--author", "eve"}), IsEmpty());
}

TEST_F(Log, ShowsCommitsBetweenDates)
{
    EXPECT_THAT(commits({"--since", "1 hour ago", "-1"}), ElementsAre("5"));
    EXPECT_THAT(commits({"--until", "1 hour ago"}), IsEmpty());
    EXPECT_THAT(commits({"--since", "2100-01-01"}), IsEmpty());
    EXPECT_EQ(
        tav({"log", "--since", "soon"}),
        failed("tav: --since 'soon' is not a date. Type one as '2024-03-05', 'yesterday' or '3 days ago'.\n"));
}

TEST_F(Log, ShowsDatesAsTheSettingSays)
{
    repo.write(".tav/config", R"({"log.date":"relative"})");
    EXPECT_EQ(tav({"log", "-1"}), done("5  Removes the roof  (master)\n   ann \u2981 less than a minute ago\n"));
    repo.write(".tav/config", R"({"log.date":"absolute"})");
    EXPECT_TRUE(
        std::regex_search(tav({"log", "-1"}).out, std::regex("\n   ann \u2981 \\d{4}-\\d\\d-\\d\\d \\d\\d:\\d\\d\n$")));
}

TEST_F(Log, ShowsOneLineForEachCommit)
{
    EXPECT_EQ(tav({"log", "--oneline", "-2"}), done("5  Removes the roof  (master)\n4  Renames the roof\n"));
}

TEST_F(Log, ShowsAllBranchesAndTags)
{
    tav({"branch", "вариант", "1"});
    tav({"switch", "вариант"});
    repo.write("variant.txt", "1");
    commitAll("Begins a variant");
    EXPECT_THAT(commits({}), ElementsAre("6", "1"));
    EXPECT_THAT(commits({"--all"}), ElementsAre("6", "5", "4", "3", "2", "1"));
    EXPECT_EQ(tav({"log", "--oneline", "-1"}), done("6  Begins a variant  (вариант)\n"));
}

} // namespace
} // namespace host_tests
