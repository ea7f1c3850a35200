// Files that are gone though nobody has removed them with 'tav rm'.
#include "tests/host/history_test.h"

#include <gmock/gmock.h>

#include <filesystem>

namespace host_tests {
namespace {

namespace fs = std::filesystem;
using testing::HasSubstr;

class MissingFiles : public HistoryTest {
protected:
    MissingFiles()
    {
        for (int i = 1; i <= 6; ++i) {
            repo.write("plan-" + std::to_string(i) + ".dwg", "plan " + std::to_string(i));
        }
        repo.write("survey/north.dwg", "north");
        repo.write("survey/south.dwg", "south");
        repo.write("notes.txt", "first");
        EXPECT_EQ(commitAll("first").code, 0);
    }

    void lose(std::string const& name) const { fs::remove_all(repo.pathTo(name)); }

    void losePlans(int count) const
    {
        for (int i = 1; i <= count; ++i) {
            lose("plan-" + std::to_string(i) + ".dwg");
        }
    }

    Outcome commit(Arguments const& more = {}) const
    {
        Arguments arguments = {"commit", "-m", "next", "--author", "ann@studio"};
        arguments.insert(arguments.end(), more.begin(), more.end());
        return tav(arguments);
    }

    static Outcome refused(std::string const& lines)
    {
        return failed(
            "tav: The commit would remove these files, which were not removed with 'tav rm'. If a drive is missing, "
            "connect it; else add --all-removed to remove them, or --without-removed to keep them in the "
            "repository:\n" +
            lines);
    }

    std::vector<std::string> changes() const { return values({"show"}, "path"); }
};

TEST_F(MissingFiles, GoWithTheNextCommitWhenTheyAreFew)
{
    losePlans(5);
    EXPECT_THAT(status(), HasSubstr("Removed:\n  (the next commit takes these without staging)\n"));
    EXPECT_EQ(commit().code, 0);
    EXPECT_EQ(changes().size(), 5U);
}

TEST_F(MissingFiles, TakeTheUsersWordWhenTheyAreMany)
{
    losePlans(6);
    repo.write("notes.txt", "second");
    tav({"add", "notes.txt"});
    EXPECT_EQ(
        commit(), refused("  plan-1.dwg\n  plan-2.dwg\n  plan-3.dwg\n  plan-4.dwg\n  plan-5.dwg\n  plan-6.dwg\n"));
    EXPECT_EQ(values({"log"}, "number"), std::vector<std::string>{"1"});
    EXPECT_THAT(
        status(),
        HasSubstr("Removed:\n  (use 'tav commit --all-removed' to remove these, or '--without-removed' to keep them in "
                  "the repository)\n"));
    EXPECT_EQ(commit({"--all-removed"}).code, 0);
    EXPECT_EQ(changes().size(), 7U);
}

TEST_F(MissingFiles, TakeTheUsersWordWhenAWholeFolderIsGone)
{
    lose("survey");
    EXPECT_EQ(commit(), refused("  survey/ (2 files)\n"));
    EXPECT_EQ(commit({"--all-removed"}).code, 0);
    EXPECT_EQ(changes(), (std::vector<std::string>{"survey/north.dwg", "survey/south.dwg"}));
}

TEST_F(MissingFiles, TakeTheUsersWordWhereADriveWasMounted)
{
    lose("survey");
    lose("plan-1.dwg");
    repo.makeFolder("survey");
    EXPECT_EQ(commit(), refused("  survey/ (2 files)\n  plan-1.dwg\n"));
}

TEST_F(MissingFiles, NeedNoWordInAFolderWithOtherFiles)
{
    lose("survey");
    repo.write("survey/new.dwg", "new");
    EXPECT_EQ(commit().code, 0);
    EXPECT_EQ(changes(), (std::vector<std::string>{"survey/north.dwg", "survey/south.dwg"}));
}

TEST_F(MissingFiles, AreListedInAFewLines)
{
    for (int i = 1; i <= 30; ++i) {
        repo.write("many/" + std::to_string(100 + i) + ".txt", std::to_string(i));
    }
    repo.write("many/stays.txt", "");
    commitAll("many");
    for (int i = 1; i <= 30; ++i) {
        lose("many/" + std::to_string(100 + i) + ".txt");
    }
    Outcome const outcome = commit();
    EXPECT_THAT(outcome.err, HasSubstr("  many/120.txt\n  and 10 more\n"));
    EXPECT_THAT(outcome.err, testing::Not(HasSubstr("many/121.txt")));
}

TEST_F(MissingFiles, StayInTheRepositoryOnRequest)
{
    lose("survey");
    lose("plan-1.dwg");
    repo.write("notes.txt", "second");
    tav({"add", "notes.txt"});
    EXPECT_EQ(commit({"--without-removed"}).code, 0);
    EXPECT_EQ(changes(), std::vector<std::string>{"notes.txt"});
    EXPECT_THAT(status(), HasSubstr("removed:  plan-1.dwg\n"));
    EXPECT_EQ(tav({"restore", "survey"}).code, 0);
    EXPECT_EQ(repo.read("survey/north.dwg"), "north");
}

TEST_F(MissingFiles, StayAlsoWhenTheyWereStagedBefore)
{
    repo.write("plan-1.dwg", "changed");
    repo.write("notes.txt", "second");
    tav({"add", "--all"});
    lose("plan-1.dwg");
    EXPECT_EQ(commit({"--without-removed"}).code, 0);
    EXPECT_EQ(changes(), std::vector<std::string>{"notes.txt"});
}

TEST_F(MissingFiles, CannotStayWhereAFolderHasTakenTheirPlace)
{
    lose("plan-1.dwg");
    repo.write("plan-1.dwg/detail.dwg", "new");
    tav({"add", "plan-1.dwg/detail.dwg"});
    EXPECT_EQ(
        commit({"--without-removed"}),
        failed("tav: A commit must not hold 'plan-1.dwg' both as a file and as a folder. Nothing has been committed; "
               "commit the removal of one of them too.\n"));
    EXPECT_EQ(commit({"--all-removed"}).code, 0);
}

TEST_F(MissingFiles, AloneMakeNoCommitWhenTheyStay)
{
    lose("plan-1.dwg");
    EXPECT_EQ(
        commit({"--without-removed"}),
        failed("tav: Nothing is staged. Use 'tav add NAME' or 'tav add --all' to stage what to commit.\n"));
}

TEST_F(MissingFiles, AreNotThoseThatTavRemoved)
{
    EXPECT_EQ(tav({"rm", "survey"}).code, 0);
    EXPECT_EQ(commit({"--without-removed"}).code, 0);
    EXPECT_EQ(changes().size(), 2U);
}

TEST_F(MissingFiles, AreNotThoseThatHaveNewNames)
{
    EXPECT_EQ(tav({"add", "--all"}), done("Nothing new to stage.\n")) << "which notes the inodes";
    fs::rename(repo.pathTo("survey"), repo.pathTo("site"));
    EXPECT_THAT(status(), HasSubstr("Renamed:\n  (the next commit takes these without staging)\n"));
    EXPECT_EQ(commit({"--without-removed"}).code, 0);
    EXPECT_EQ(values({"show"}, "previous"), (std::vector<std::string>{"survey/north.dwg", "survey/south.dwg"}));
}

class MissingFilesWithCopies : public MissingFiles {
protected:
    /// As if the folder had been a drive.
    MissingFilesWithCopies()
    {
        fs::copy(repo.pathTo("survey"), repo.pathTo("copy"));
        lose("survey");
        repo.makeFolder("survey");
        repo.write("notes.txt", "second");
        tav({"add", "notes.txt"});
    }
};

TEST_F(MissingFilesWithCopies, TakeTheUsersWord)
{
    EXPECT_EQ(commit(), refused("  survey/ (2 files)\n"));
    EXPECT_THAT(
        status(), HasSubstr("Renamed:\n  (some may be copies of missing files; use 'tav commit --all-removed' to take "
                            "these, or '--without-removed' to keep the files in the repository)\n"));
    EXPECT_EQ(commit({"--all-removed"}).code, 0);
    EXPECT_EQ(values({"show"}, "previous"), (std::vector<std::string>{"survey/north.dwg", "survey/south.dwg"}));
}

TEST_F(MissingFilesWithCopies, StayInTheRepositoryOnRequest)
{
    tav({"add", "copy/north.dwg"});
    EXPECT_EQ(commit({"--without-removed"}).code, 0);
    EXPECT_EQ(changes(), (std::vector<std::string>{"copy/north.dwg", "notes.txt"}));
    EXPECT_EQ(values({"show"}, "previous"), std::vector<std::string>());
}

TEST_F(MissingFiles, AreEitherRemovedOrKept)
{
    EXPECT_EQ(
        commit({"--all-removed", "--without-removed"}),
        misused("tav: --all-removed excludes --without-removed. Run 'tav commit --help' to see how it is used.\n"));
}

} // namespace
} // namespace host_tests
