// Histories that a working folder does not know as a whole: an older database put back, and two folders on one server.
#include "host/database/sqlite.h"

#include "tests/host/history_test.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <regex>

namespace host_tests {
namespace {

namespace fs = std::filesystem;
using testing::ElementsAre;
using testing::HasSubstr;

class Fetch : public HistoryTest {
protected:
    void commitFile(std::string const& name, std::string const& content, std::string const& message) const
    {
        repo.write(name, content);
        ASSERT_EQ(commitAll(message).code, 0);
    }

    /// What a folder shows of a commit that it did not make is what the other one shows.
    std::string shownIn(std::string const& folder, std::string const& commit) const
    {
        // Branches need not be the same in both folders.
        static std::regex const references("\"refs\" : \\[[^\\]]*\\]");
        return std::regex_replace(tavIn(folder, {"log", commit, "--json"}).out, references, "");
    }

    std::vector<std::string> numbersKnown() const
    {
        tav::Database const database(repo.pathTo(".tav/tav.db"));
        tav::Statement rows = database.prepare("SELECT number FROM commits ORDER BY number");
        std::vector<std::string> numbers;
        while (rows.next()) {
            numbers.push_back(std::to_string(rows.integer(0)));
        }
        return numbers;
    }
};

class OlderDatabase : public Fetch {
protected:
    /// Three commits, and the database as it was after the first.
    OlderDatabase()
    {
        commitFile("plan.dwg", "one", "first");
        std::string const old = repo.read(".tav/tav.db");
        commitFile("plan.dwg", "two", "second");
        commitFile("plan.dwg", "three", "third");
        commitFile("note.txt", "lost?", "fourth");
        repo.write(".tav/tav.db", old);
    }
};

TEST_F(OlderDatabase, LearnsWhatTheServerHas)
{
    EXPECT_EQ(tav({"fetch"}), done("Fetched 3 commits.\nBranches and tags that are new or have moved: 1.\n"));
    EXPECT_THAT(numbersKnown(), ElementsAre("1", "2", "3", "4"));
    EXPECT_EQ(tav({"fetch"}), done("Nothing is new on the server.\n"));
    EXPECT_EQ(tav({"switch", "master"}).code, 0);
    EXPECT_EQ(status(), kClean);
    EXPECT_EQ(tav({"restore", "plan.dwg", "--from", "2"}).code, 0);
    EXPECT_EQ(repo.read("plan.dwg"), "two");
}

TEST_F(OlderDatabase, LosesNothingToGc)
{
    EXPECT_EQ(tav({"gc"}), done("Removed 0 stored versions that no commit needs; 0 bytes freed.\n"));
    EXPECT_EQ(tav({"verify"}), done("Read 5 stored versions; nothing is damaged.\n"));
    EXPECT_EQ(tav({"restore", "plan.dwg", "--from", "2", "--force"}).code, 0);
    EXPECT_EQ(repo.read("plan.dwg"), "two");
}

TEST_F(OlderDatabase, IsNoticedByVerify)
{
    EXPECT_EQ(
        tav({"verify"}), (Outcome{
                             1, "Read 2 stored versions; nothing is damaged.\n",
                             "tav: The server has 3 commits that are not known here. Run 'tav fetch' to get them.\n"}));
}

TEST_F(OlderDatabase, ClosesItsGapWithTheNextCommit)
{
    repo.write("plan.dwg", "mine");
    tav({"add", "plan.dwg"});
    EXPECT_EQ(
        tav({"commit", "-m", "mine"}),
        failed("tav: You are at an earlier commit, not at the end of the branch 'master'. Run 'tav branch NAME' and "
               "'tav switch NAME' to go on from here, or 'tav switch master' to go back to its end.\n"));
    EXPECT_EQ(tav({"branch", "mine"}).code, 0);
    EXPECT_EQ(tav({"switch", "mine"}).code, 0);
    EXPECT_EQ(tav({"commit", "-m", "mine"}).code, 0);
    EXPECT_THAT(numbersKnown(), ElementsAre("1", "2", "3", "4", "5"));
    EXPECT_EQ(tav({"gc"}), done("Removed 0 stored versions that no commit needs; 0 bytes freed.\n"));
    EXPECT_EQ(tav({"checkout", "3"}).code, 0);
    EXPECT_EQ(repo.read("plan.dwg"), "three");
}

TEST_F(OlderDatabase, ClosesAGapThatAnEarlierVersionLeft)
{
    ASSERT_EQ(tav({"fetch"}).code, 0);
    tav::Database database(repo.pathTo(".tav/tav.db"));
    database.run("PRAGMA foreign_keys = OFF; DELETE FROM changes WHERE number IN (2, 3);"
                 "DELETE FROM parents WHERE number IN (2, 3); DELETE FROM commits WHERE number IN (2, 3);"
                 "DELETE FROM contents WHERE url NOT IN (SELECT url FROM changes);");
    EXPECT_THAT(numbersKnown(), ElementsAre("1", "4"));
    EXPECT_THAT(tav({"verify"}).err, HasSubstr("The server has 2 commits that are not known here."));
    EXPECT_EQ(tav({"gc"}), done("Removed 0 stored versions that no commit needs; 0 bytes freed.\n"));
    EXPECT_THAT(numbersKnown(), ElementsAre("1", "2", "3", "4"));
    EXPECT_EQ(tav({"verify"}), done("Read 5 stored versions; nothing is damaged.\n"));
}

class TwoFolders : public Fetch {
protected:
    /// A project folder with one commit, copied: both use one repository of the server.
    TwoFolders()
    {
        commitFile("plan.dwg", "one", "first");
        fs::copy(repo.path(), other(), fs::copy_options::recursive);
    }

    std::string other() const { return place_.pathTo("copy"); }
    Outcome inOther(Arguments const& arguments) const { return tavIn(other(), arguments); }

    /// Commits in the copy, on the branch of its own.
    void commitInOther(std::string const& name, std::string const& content, std::string const& message) const
    {
        place_.write("copy/" + name, content);
        ASSERT_EQ(inOther({"add", name}).code, 0);
        ASSERT_EQ(inOther({"commit", "-m", message, "--author", "bob@studio"}).code, 0);
    }

    void makeBranchInOther() const
    {
        ASSERT_EQ(inOther({"branch", "copy"}).code, 0);
        ASSERT_EQ(inOther({"switch", "copy"}).code, 0);
    }

    support::TempFolder const place_;
};

TEST_F(TwoFolders, LearnEachOthersCommitsWithTheirOwn)
{
    makeBranchInOther();
    commitFile("plan.dwg", "two", "second");
    commitInOther("plan.dwg", "other two", "other second");
    commitFile("old.txt", "text", "third");
    EXPECT_THAT(numbersKnown(), ElementsAre("1", "2", "3", "4"));
    for (std::string const commit : {"1", "2", "3"}) {
        EXPECT_EQ(shownIn(other(), commit), shownIn(repo.path(), commit));
    }
    EXPECT_EQ(inOther({"fetch"}), done("Fetched 1 commit.\nBranches and tags that are new or have moved: 1.\n"));
    EXPECT_EQ(shownIn(other(), "4"), shownIn(repo.path(), "4"));
    EXPECT_EQ(inOther({"log", "master"}).out, tav({"log", "master"}).out);
}

TEST_F(TwoFolders, ShowARenameOfTheOther)
{
    ASSERT_EQ(tav({"mv", "plan.dwg", "roof.dwg"}).code, 0);
    ASSERT_EQ(tav({"commit", "-m", "renames"}).code, 0);
    ASSERT_EQ(inOther({"fetch"}).code, 0);
    EXPECT_THAT(inOther({"show", "2"}).out, HasSubstr("renamed:  plan.dwg -> roof.dwg"));
}

TEST_F(TwoFolders, KeepWhatTheirOwnCommitsNeedInGc)
{
    makeBranchInOther();
    commitFile("plan.dwg", "two", "second");
    commitInOther("plan.dwg", "other two", "other second");
    EXPECT_EQ(tav({"gc"}), done("Removed 0 stored versions that no commit needs; 0 bytes freed.\n"));
    EXPECT_EQ(inOther({"gc"}), done("Removed 0 stored versions that no commit needs; 0 bytes freed.\n"));
    EXPECT_EQ(
        inOther({"verify"}), done("Read 3 stored versions; nothing is damaged.\n"
                                  "Not here: 1 version of commits that were made in other folders.\n"));
    EXPECT_EQ(inOther({"checkout", "1"}).code, 0);
    EXPECT_EQ(inOther({"checkout", "3"}).code, 0);
}

TEST_F(TwoFolders, SayWhichVersionsAreInTheOtherOne)
{
    ASSERT_EQ(tav({"branch", "side"}).code, 0);
    ASSERT_EQ(tav({"switch", "side"}).code, 0);
    repo.write("a.txt", "there already");
    commitFile("b.txt", "two", "second");
    place_.write("copy/a.txt", "there already");
    ASSERT_EQ(inOther({"fetch"}).code, 0);
    auto const elsewhere = [](std::string const& name) {
        return failed(
            "tav: This version of '" + name +
            "' was made in another folder, and its content is not here. Nothing has "
            "been written; get the file from that folder.\n");
    };
    std::string const before = inOther({"status", "--json"}).out;
    for (Arguments const& command :
         {Arguments{"checkout", "2"},
          {"switch", "side"},
          {"checkout", "2", "--force"},
          {"restore", "b.txt", "--from", "2"},
          {"cat", "2:b.txt"}}) {
        EXPECT_EQ(inOther(command), elsewhere("b.txt")) << command.front();
    }
    EXPECT_EQ(inOther({"export", "2", "exported"}), elsewhere("a.txt"));
    EXPECT_EQ(inOther({"status", "--json"}).out, before);
    EXPECT_FALSE(place_.has("copy/exported"));
    EXPECT_EQ(inOther({"restore", "plan.dwg", "--from", "2"}).code, 0);
}

TEST_F(TwoFolders, RefuseAFolderThatFollowsAnEarlierCommitOfItsBranch)
{
    commitFile("plan.dwg", "two", "second");
    ASSERT_EQ(inOther({"rm", "plan.dwg"}).code, 0);
    EXPECT_EQ(
        inOther({"commit", "-m", "removes"}),
        failed("tav: You are at an earlier commit, not at the end of the branch 'master'. Run 'tav branch NAME' and "
               "'tav switch NAME' to go on from here, or 'tav switch master' to go back to its end.\n"));
}

TEST_F(TwoFolders, DoNotMoveABranchOfTheOther)
{
    commitFile("plan.dwg", "two", "second");
    ASSERT_EQ(inOther({"branch", "side"}).code, 0);
    EXPECT_EQ(
        tav({"branch", "side"}),
        failed("tav: There is a branch 'side' already. Choose another name. Run 'tav fetch' to see what the server has "
               "under this name.\n"));
    EXPECT_EQ(
        tav({"tag", "side"}),
        failed("tav: 'side' is the name of a branch already. Choose another name. Run 'tav fetch' to see what the "
               "server has under this name.\n"));
    EXPECT_EQ(inOther({"fetch"}).code, 0);
    EXPECT_THAT(inOther({"branch"}).out, HasSubstr("  side  (commit 1)\n"));
}

TEST_F(TwoFolders, SayHowToGetABranchThatOnlyTheServerKnows)
{
    ASSERT_EQ(inOther({"branch", "side"}).code, 0);
    EXPECT_EQ(
        tav({"switch", "side"}),
        failed("tav: 'side' is known only to the server. Run 'tav fetch' to get it, and then this command again.\n"));
    EXPECT_EQ(tav({"fetch"}).code, 0);
    EXPECT_EQ(tav({"switch", "side"}), done("Now on branch side.\n"));
}

TEST_F(TwoFolders, LearnBranchesAndTagsWithACommit)
{
    makeBranchInOther();
    commitInOther("plan.dwg", "other two", "other second");
    ASSERT_EQ(inOther({"tag", "seen"}).code, 0);
    commitFile("plan.dwg", "two", "second");
    EXPECT_EQ(tav({"tag"}), done("  seen  (commit 2)\n"));
    EXPECT_EQ(tav({"branch"}), done("  copy  (commit 2)\n* master  (commit 3)\n"));
}

} // namespace
} // namespace host_tests
