// Folders that were moved away and replaced by links.
#include "tests/host/history_test.h"

#include <gmock/gmock.h>

#include <filesystem>

namespace host_tests {
namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;

constexpr char const* kBehindLinks =
    "Behind links to folders:\n  (tav does not enter these; the next commit keeps the files as they are)\n"
    "        plans/a.dwg\n        plans/deep/b.txt\n\n";

class FolderLink : public HistoryTest {
protected:
    FolderLink()
    {
        repo.write("plans/a.dwg", "one");
        repo.write("plans/deep/b.txt", "one");
        repo.write("notes.txt", "one");
        EXPECT_EQ(commitAll("first").code, 0);
    }

    /// Puts a link in the place of the folder.
    void moveAway() const
    {
        fs::rename(repo.pathTo("plans"), elsewhere.pathTo("plans"));
        repo.makeLink("plans", elsewhere.pathTo("plans"));
    }

    std::string exported(std::string const& name) const
    {
        support::TempFolder const target;
        EXPECT_EQ(tav({"export", "master", target.pathTo("all")}).code, 0);
        return target.read("all/" + name);
    }

    support::TempFolder const elsewhere;
};

TEST_F(FolderLink, IsNotEnteredForCommittedFilesNorForNewOnes)
{
    moveAway();
    elsewhere.write("plans/a.dwg", "changed");
    elsewhere.write("plans/new.dwg", "new");
    EXPECT_EQ(status(), kBehindLinks);
    EXPECT_EQ(tav({"diff"}), done(""));
}

TEST_F(FolderLink, LeavesTheCommittedFilesInTheNextCommit)
{
    moveAway();
    repo.write("notes.txt", "two");
    EXPECT_EQ(commitAll("second").code, 0);
    EXPECT_EQ(values({"show"}, "path"), std::vector<std::string>{"notes.txt"});
    EXPECT_EQ(exported("plans/a.dwg"), "one");
    EXPECT_EQ(status(), kBehindLinks);
}

TEST_F(FolderLink, LeavesThemAlsoWhenItLeadsNowhere)
{
    moveAway();
    fs::remove_all(elsewhere.pathTo("plans"));
    EXPECT_EQ(status(), kBehindLinks);
    repo.write("notes.txt", "two");
    EXPECT_EQ(commitAll("second").code, 0);
    EXPECT_EQ(exported("plans/a.dwg"), "one");
}

TEST_F(FolderLink, HasNothingToStage)
{
    moveAway();
    elsewhere.write("plans/a.dwg", "changed");
    for (char const* const name : {"plans", "plans/a.dwg", "plans/deep/b.txt"}) {
        EXPECT_EQ(
            tav({"add", name}), failed(
                                    "tav: '" + std::string(name) +
                                    "' is behind a link to a folder, which tav does not enter. Replace the link "
                                    "with the folder itself.\n"));
    }
    EXPECT_EQ(tav({"add", "--all"}), done("Nothing new to stage.\n"));
}

TEST_F(FolderLink, EndsTheCommitOfAFileThatWasStagedBefore)
{
    repo.write("plans/a.dwg", "two");
    ASSERT_EQ(tav({"add", "plans/a.dwg"}).code, 0);
    moveAway();
    Outcome const refused = failed("tav: 'plans/a.dwg' is staged, but a link has taken the place of its folder. "
                                   "Replace the link with the folder itself, or run 'tav unstage' for the file.\n");
    EXPECT_EQ(tav({"commit", "-m", "second"}), refused);
    fs::remove_all(elsewhere.pathTo("plans"));
    EXPECT_EQ(tav({"commit", "-m", "second", "--all-removed"}), refused);
}

TEST_F(FolderLink, KeepsWhatItLeadsToWhenTheFilesAreRemoved)
{
    moveAway();
    EXPECT_EQ(tav({"rm", "plans"}), done("Removed 2 files; the next commit takes that.\n"));
    EXPECT_EQ(elsewhere.read("plans/a.dwg"), "one");
    EXPECT_EQ(tav({"commit", "-m", "second"}).code, 0);
    EXPECT_EQ(values({"show"}, "change"), (std::vector<std::string>{"removed", "removed"}));
    EXPECT_EQ(status(), kClean);
    EXPECT_EQ(elsewhere.read("plans/a.dwg"), "one");
}

TEST_F(FolderLink, IsNotWrittenThrough)
{
    repo.write("plans/a.dwg", "two");
    commitAll("second");
    moveAway();
    EXPECT_EQ(tav({"checkout", "1"}).code, 1);
    EXPECT_EQ(tav({"restore", "plans/a.dwg", "--from", "1", "--force"}).code, 1);
    EXPECT_EQ(elsewhere.read("plans/a.dwg"), "two");
}

TEST_F(FolderLink, MakesNoDifferenceOnceTheFolderIsBack)
{
    moveAway();
    fs::remove(repo.pathTo("plans"));
    fs::rename(elsewhere.pathTo("plans"), repo.pathTo("plans"));
    EXPECT_EQ(status(), kClean);
}

} // namespace
} // namespace host_tests
