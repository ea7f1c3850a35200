#include "tests/host/history_test.h"

#include <string>
#include <vector>

namespace host_tests {
namespace {

/// Two commits on "master", and a third on "вариант".
class References : public HistoryTest {
protected:
    References()
    {
        repo.write("屋根.txt", "1");
        commitAll("First");
        repo.write("屋根.txt", "2");
        commitAll("Second");
        tav({"switch", "-c", "вариант"});
        repo.write("屋根.txt", "3");
        commitAll("Third");
        tav({"switch", "master"});
    }

    std::vector<std::string> branches() const { return values({"branch"}, "name"); }
};

using Names = std::vector<std::string>;

TEST_F(References, OfABranchAreDeletedWhereAnotherOneLeadsToItsCommits)
{
    tav({"branch", "same", "2"});
    EXPECT_EQ(tav({"branch", "-d", "same"}), done("Deleted the branch 'same', which was at commit 2.\n"));
    EXPECT_EQ(branches(), (Names{"master", "вариант"}));
    EXPECT_EQ(tav({"fetch"}), done("Nothing is new on the server.\n"));
    EXPECT_EQ(tav({"branch", "same", "2"}).code, 0);
}

TEST_F(References, ThatAloneLeadToCommitsAreDeletedByForceOnly)
{
    EXPECT_EQ(
        tav({"branch", "-d", "вариант"}),
        failed("tav: Only the branch 'вариант' leads to its last commits. Create a tag there to keep them in the "
               "history, or delete it with --force.\n"));
    EXPECT_EQ(branches(), (Names{"master", "вариант"}));
    EXPECT_EQ(
        tav({"branch", "-d", "вариант", "--force"}), done("Deleted the branch 'вариант', which was at commit 3.\n"));
    EXPECT_EQ(branches(), Names{"master"});
    EXPECT_EQ(tav({"branch", "again", "3"}).code, 0);
}

TEST_F(References, AreOnlyShownByADryRun)
{
    tav({"tag", "тендер", "1"});
    EXPECT_EQ(
        tav({"tag", "-d", "--dry-run", "тендер"}), done("Would delete the tag 'тендер', which was at commit 1.\n"));
    EXPECT_EQ(values({"tag"}, "name"), Names{"тендер"});
    EXPECT_EQ(tav({"tag", "-d", "тендер"}), done("Deleted the tag 'тендер', which was at commit 1.\n"));
    EXPECT_EQ(values({"tag"}, "name"), Names());
}

TEST_F(References, OfTheCurrentBranchAreNotDeleted)
{
    EXPECT_EQ(
        tav({"branch", "-d", "master"}),
        failed("tav: You are on the branch 'master'. Run 'tav switch' to go to another branch first.\n"));
}

TEST_F(References, OfAnotherTypeAreNotDeleted)
{
    EXPECT_EQ(
        tav({"tag", "-d", "вариант"}),
        failed("tav: There is no tag 'вариант'. Run 'tav tag' to see those that there are.\n"));
    EXPECT_EQ(
        tav({"branch", "-d", "нет"}),
        failed("tav: There is no branch 'нет'. Run 'tav branch' to see those that there are.\n"));
}

TEST_F(References, OfTheCurrentBranchAreRenamedWithIt)
{
    EXPECT_EQ(tav({"branch", "-m", "основа"}), done("Renamed the branch 'master' to 'основа'.\n"));
    EXPECT_EQ(branches(), (Names{"вариант", "основа"}));
    repo.write("屋根.txt", "4");
    EXPECT_EQ(commitAll("Fourth").code, 0);
    EXPECT_EQ(tav({"log", "--oneline", "-1"}), done("4  Fourth  (основа)\n"));
    EXPECT_EQ(tav({"fetch"}), done("Nothing is new on the server.\n"));
}

TEST_F(References, OfAnotherBranchAreRenamed)
{
    EXPECT_EQ(tav({"branch", "-m", "вариант", "屋根"}), done("Renamed the branch 'вариант' to '屋根'.\n"));
    EXPECT_EQ(branches(), (Names{"master", "屋根"}));
    EXPECT_EQ(
        tav({"branch", "-m", "屋根", "master"}),
        failed("tav: There is a branch 'master' already. Choose another name.\n"));
}

TEST_F(References, ArePassedByCheckout)
{
    EXPECT_EQ(tav({"checkout", "вариант"}), done("Now on branch вариант (1 file written).\n"));
    repo.write("屋根.txt", "5");
    EXPECT_EQ(commitAll("Fifth").code, 0);
}

TEST_F(References, AreSuggestedWhereNoCommitCanBeMade)
{
    EXPECT_EQ(
        tav({"checkout", "1"}),
        done("Now at commit 1 (1 file written).\nTo commit here, create a branch with 'tav switch -c NAME'.\n"));
    EXPECT_EQ(tav({"switch", "-c", "from first"}), done("Now on branch from first.\n"));
    repo.write("屋根.txt", "6");
    EXPECT_EQ(commitAll("Sixth").code, 0);
}

TEST_F(References, AreNotLeftBehindByASwitchThatIsRefused)
{
    repo.write("屋根.txt", "changed");
    EXPECT_EQ(tav({"switch", "-c", "new", "1"}).code, 1);
    EXPECT_EQ(branches(), (Names{"master", "вариант"}));
    EXPECT_EQ(tav({"fetch"}), done("Nothing is new on the server.\n"));
    EXPECT_EQ(tav({"switch", "-c", "new"}).code, 0);
}

TEST_F(References, AreNotFilesToCheckOut)
{
    EXPECT_EQ(
        tav({"checkout", "屋根.txt"}),
        failed("tav: '屋根.txt' is a file, not a commit. Run 'tav restore 屋根.txt' to bring a file back.\n"));
}

class FirstBranch : public HistoryTest {};

TEST_F(FirstBranch, GetsItsNameBeforeTheFirstCommit)
{
    EXPECT_EQ(tav({"switch", "-c", "основа"}), done("Now on branch основа.\n"));
    repo.write("屋根.txt", "1");
    EXPECT_EQ(commitAll("First").code, 0);
    EXPECT_EQ(values({"branch"}, "name"), Names{"основа"});
}

} // namespace
} // namespace host_tests
