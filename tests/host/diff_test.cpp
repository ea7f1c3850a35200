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

TEST_F(Diff, ComparesNoBytesLineByLine)
{
    repo.write("notes.txt", "first\n\xff\n");
    std::string const text = tav({"diff", "notes.txt"}).out;
    EXPECT_EQ(text.find("@@"), std::string::npos) << text;
}

} // namespace
} // namespace host_tests
