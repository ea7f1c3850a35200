#include "tests/host/history_test.h"

#include "common/mu_common_versions.h"

#include <gmock/gmock.h>

#include <unistd.h>

namespace host_tests {
namespace {

using testing::ElementsAre;

std::string digestOf(std::string const& content)
{
    return generateSha(content.data(), static_cast<int>(content.size())).ansi_str();
}

class Diff : public HistoryTest {
protected:
    Diff()
    {
        repo.write("a.dwg", "one");
        repo.write("notes.txt", "first\nsecond\nthird\n");
        repo.write("old.txt", "to be renamed");
        repo.write("r.txt", "to be removed, soon");
        commitAll("the first");
    }
};

TEST_F(Diff, ShowsNothingWhereNothingHasChanged)
{
    EXPECT_EQ(tav({"diff"}), done(""));
    EXPECT_EQ(tav({"diff", "--json"}), done("[\n]\n"));
}

TEST_F(Diff, ShowsSizesDigestsAndLines)
{
    repo.write("a.dwg", "two!");
    repo.write("notes.txt", "first\n2nd\nthird\n");
    repo.write("new.txt", "new");
    ASSERT_EQ(rename(repo.pathTo("old.txt").c_str(), repo.pathTo("renamed.txt").c_str()), 0);
    ASSERT_EQ(unlink(repo.pathTo("r.txt").c_str()), 0);
    EXPECT_EQ(
        tav({"diff"}), done(
                           "modified: a.dwg (3 bytes -> 4 bytes)\n"
                           "    old  " +
                           digestOf("one") + "\n    new  " + digestOf("two!") +
                           "\n"
                           "new:      new.txt (3 bytes)\n"
                           "    new  " +
                           digestOf("new") +
                           "\n"
                           "modified: notes.txt (19 bytes -> 16 bytes)\n"
                           "    old  " +
                           digestOf("first\nsecond\nthird\n") + "\n    new  " + digestOf("first\n2nd\nthird\n") +
                           "\n"
                           "    @@ -1,3 +1,3 @@\n"
                           "     first\n"
                           "    -second\n"
                           "    +2nd\n"
                           "     third\n"
                           "removed:  r.txt (19 bytes)\n"
                           "    old  " +
                           digestOf("to be removed, soon") +
                           "\n"
                           "renamed:  old.txt -> renamed.txt (13 bytes)\n"));
}

TEST_F(Diff, TakesNamesAndFolders)
{
    repo.write("a.dwg", "two!");
    repo.write("sub/b.dwg", "two!");
    repo.write("notes.txt", "");
    EXPECT_THAT(values({"diff", "a.dwg", "sub"}, "path"), ElementsAre("a.dwg", "sub/b.dwg"));
}

/// Two more commits: one that changes a drawing and renames a text, and one that changes both.
class DiffOfCommits : public Diff {
protected:
    DiffOfCommits()
    {
        repo.write("a.dwg", "two!");
        tav({"mv", "notes.txt", "заметки.txt"});
        commitAll("the second");
        repo.write("заметки.txt", "first\nsecond\n3rd\n");
        repo.write("図面.dwg", "new");
        commitAll("the third");
        repo.write("図面.dwg", "not committed");
    }
};

TEST_F(DiffOfCommits, ComparesTwoCommits)
{
    EXPECT_EQ(
        tav({"diff", "--stat", "1", "3"}), done("modified: a.dwg (3 bytes -> 4 bytes)\n"
                                                "renamed:  notes.txt -> заметки.txt (19 bytes -> 17 bytes)\n"
                                                "new:      図面.dwg (3 bytes)\n"
                                                "3 files: 1 modified, 1 new, 1 renamed\n"));
    EXPECT_EQ(tav({"diff", "1..3", "--json"}), tav({"diff", "1", "3", "--json"}));
    EXPECT_THAT(values({"diff", "3", "2"}, "change"), ElementsAre("modified", "removed"));
    EXPECT_EQ(tav({"diff", "2", "@~1"}), done(""));
}

TEST_F(DiffOfCommits, ShowsTheLinesOfTextsOfCommits)
{
    std::string const text = tav({"diff", "@~2", "@", "заметки"}).out;
    EXPECT_NE(text.find("    -third\n    +3rd\n"), std::string::npos) << text;
    EXPECT_EQ(tav({"diff", "--stat", "@~2", "@", "--", "заметки.txt"}).out.find("@@"), std::string::npos);
}

TEST_F(DiffOfCommits, ComparesTheFolderWithACommit)
{
    EXPECT_THAT(values({"diff"}, "path"), ElementsAre("図面.dwg"));
    EXPECT_THAT(values({"diff", "1"}, "path"), ElementsAre("a.dwg", "notes.txt", "заметки.txt", "図面.dwg"));
    EXPECT_THAT(values({"diff", "@~2", "--", "図面.dwg"}, "change"), ElementsAre("added"));
    EXPECT_EQ(
        tav({"diff", "2", "--", "r.txt"}),
        failed("tav: No changed file matches 'r.txt'. Run 'tav status' to see what has changed.\n"));
}

TEST_F(DiffOfCommits, ShowsATotalInsteadOfDetailsForManyFiles)
{
    for (char const* name : {"1.txt", "2.txt", "3.txt", "4.txt", "5.txt"}) {
        repo.write(name, "new");
    }
    std::string const text = tav({"diff"}).out;
    EXPECT_EQ(text.find("    new  "), std::string::npos) << text;
    EXPECT_NE(text.find("6 files: 1 modified, 5 new\n"), std::string::npos) << text;
    EXPECT_NE(tav({"diff", "--text"}).out.find("    new  "), std::string::npos);
}

TEST_F(Diff, LeavesOutManyLinesUnlessTheyAreAskedFor)
{
    std::string many;
    for (int i = 0; i < 300; ++i) {
        many += std::to_string(i) + "\n";
    }
    repo.write("notes.txt", many);
    EXPECT_NE(tav({"diff", "notes.txt"}).out.find("    304 lines; 'tav diff --text' shows them\n"), std::string::npos)
        << tav({"diff", "notes.txt"}).out;
    EXPECT_NE(tav({"diff", "--text", "notes.txt"}).out.find("    +299\n"), std::string::npos);
}

using Cat = Diff;

TEST_F(Cat, PrintsAFileOfACommitByteForByte)
{
    std::string const bytes("\0\xff\x1b[31m\n", 8);
    repo.write("図面/план.dwg", bytes);
    commitAll("the second");
    repo.write("図面/план.dwg", "changed");
    EXPECT_EQ(tav({"cat", "2:図面/план.dwg"}), done(bytes));
    EXPECT_EQ(tav({"show", "master:план"}), done(bytes));
    EXPECT_EQ(tavIn(repo.pathTo("図面"), {"cat", ":план.dwg"}), done(bytes));
}

TEST_F(Cat, PrintsOnlyTextOnATerminal)
{
    repo.write("colour.txt", "\x1b[31mred\n");
    repo.write("b.dwg", std::string("\0", 1));
    commitAll("the second");
    EXPECT_EQ(tavOnTerminal({"cat", "@:colour.txt"}).out, "\\x1B[31mred\n");
    EXPECT_EQ(
        tavOnTerminal({"cat", "@:b.dwg"}),
        failed("tav: 'b.dwg' is not text, and a terminal cannot show it. Write it to "
               "a file, as in 'tav cat 2:NAME >FILE'.\n"));
}

TEST_F(Cat, SaysWhatIsNotThere)
{
    EXPECT_EQ(
        tav({"cat", "1:новый.dwg"}),
        failed("tav: Commit 1 has no file 'новый.dwg'. Run 'tav files --at 1' to see its files.\n"));
    EXPECT_EQ(
        tav({"cat", "a.dwg"}),
        failed("tav: 'a.dwg' does not name a file in a commit. Type a commit, a colon and a name, as in "
               "'tav cat 12:roof.dwg'.\n"));
}

TEST_F(Diff, ComparesNoBytesLineByLine)
{
    repo.write("notes.txt", "first\n\xff\n");
    std::string const text = tav({"diff", "notes.txt"}).out;
    EXPECT_EQ(text.find("@@"), std::string::npos) << text;
}

} // namespace
} // namespace host_tests
