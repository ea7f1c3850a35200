#include "host/changes/folder_view.h"
#include "host/repository/local_database.h"
#include "host/storage/storage_url.h"
#include "host/text/utf8.h"

#include "tests/host/tav_test.h"

#include "common/mu_common_versions.h"

#include <gmock/gmock.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace host_tests {
namespace {

/// Runs the commands on a last commit that is not empty.
class OnCommit : public TavTest {
protected:
    /// Writes files and makes them those of the last commit, beside the ones that are.
    void commit(std::initializer_list<std::string_view> names)
    {
        tav::LocalDatabase database = tav::LocalDatabase::make(repo.root());
        for (std::string_view const name : names) {
            std::string const content = "committed " + std::string(name);
            repo.write(name, content);
            OdString const digest = generateSha(content.data(), static_cast<int>(content.size()));
            files_.push_back({tav::fromUtf8(name), L"po:" + digest, OdString()});
            database.addContent(L"po:" + digest, *tav::digestFromHex(digest.ansi_str()), content.size());
        }
        ++number_;
        OdString const hash = OdString().format(L"%064d", number_);
        database.commits().add({number_, hash, L"ann", L"drawn", 0, {}}, files_);
        database.setCurrentCommit(hash);
    }

    void remove(std::string_view name) const { ASSERT_EQ(unlink(repo.pathTo(name).c_str()), 0); }

    /// What status shows below the line of the branch.
    std::string status() const { return tav({"status"}).out.substr(std::string("On branch master\n\n").size()); }

    std::vector<std::string> filesOfTheUser() const
    {
        std::vector<std::string> names;
        for (std::string const& name : repo.list()) {
            if (name.compare(0, 4, ".tav") != 0) {
                names.push_back(name);
            }
        }
        return names;
    }

private:
    std::vector<tav::FileRecord> files_;
    int number_ = 0;
};

using StatusOnCommit = OnCommit;

TEST_F(StatusOnCommit, ShowsNothingOfUnchangedFiles)
{
    commit({"a.dwg", "plans/b.dwg"});
    EXPECT_EQ(status(), "Nothing has changed since the last commit.\n");
}

TEST_F(StatusOnCommit, ShowsModifiedRemovedAndNewFiles)
{
    commit({"m2.dwg", "plans/m1.dwg", "r2.dwg", "plans/r1.dwg", "same.dwg"});
    repo.write("m2.dwg", "changed");
    repo.write("plans/m1.dwg", "changed");
    remove("r2.dwg");
    remove("plans/r1.dwg");
    repo.add({"new.dwg"});
    EXPECT_EQ(status(), R"(Modified, not staged:
  (use 'tav add NAME' to stage a file)
        modified: m2.dwg
        modified: plans/m1.dwg

Removed:
  (the next commit takes these without staging)
        removed:  plans/r1.dwg
        removed:  r2.dwg

New, not staged:
  (use 'tav add NAME' or 'tav add --all' to stage)
        new.dwg

)");
    EXPECT_EQ(tav({"status", "--json"}), done(R"({
    "at_end" : true,
    "branch" : "master",
    "commit" : 1,
    "conflicts" : [
    ],
    "modified" : [
        "m2.dwg",
        "plans/m1.dwg"
    ],
    "removed" : [
        "plans/r1.dwg",
        "r2.dwg"
    ],
    "renamed" : [
    ],
    "staged" : [
    ],
    "unreachable" : [
    ],
    "unreadable" : [
    ],
    "untracked" : [
        "new.dwg"
    ]
}
)"));
}

TEST_F(StatusOnCommit, ShowsTwoLettersForEachFile)
{
    commit({"m.dwg", "план.dwg", "屋根.dwg", "s.dwg"});
    repo.write("m.dwg", "changed");
    repo.write("s.dwg", "changed");
    tav({"add", "s.dwg"});
    tav({"mv", "屋根.dwg", "b.dwg"});
    remove("план.dwg");
    repo.add({"new.dwg"});
    EXPECT_EQ(tav({"status", "-s"}), done("R  屋根.dwg -> b.dwg\nM  s.dwg\n M m.dwg\n D план.dwg\n?? new.dwg\n"));
    EXPECT_EQ(tav({"st", "--short"}), tav({"status", "-s"}));
}

TEST_F(StatusOnCommit, ShowsARenamedFileOnce)
{
    commit({"a.dwg"});
    tav({"mv", "a.dwg", "b.dwg"});
    EXPECT_EQ(status(), R"(Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        renamed:  a.dwg -> b.dwg

)");
    tav({"unstage", "b.dwg"});
    EXPECT_EQ(status(), R"(Renamed:
  (the next commit takes these without staging)
        renamed:  a.dwg -> b.dwg

)");
}

TEST_F(StatusOnCommit, ShowsANewFileUnderTheFormerNameOfARenamedOne)
{
    commit({"a.dwg"});
    tav({"mv", "a.dwg", "b.dwg"});
    repo.write("a.dwg", "another drawing");
    EXPECT_EQ(status(), R"(Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        renamed:  a.dwg -> b.dwg

Modified, not staged:
  (use 'tav add NAME' to stage a file)
        modified: a.dwg

)");
}

TEST_F(StatusOnCommit, DoesNotReadAFileThatIsKnown)
{
    commit({"a.dwg"});
    repo.write("a.dwg", "changed");
    tav::LocalDatabase database = tav::LocalDatabase::openForChanges(repo.root());
    std::string const url = database.commits().fileList(database.currentCommit()).front().url;
    database.addVerified(
        {{"a.dwg", *tav::digestOf(std::string_view(url)), *tav::FolderView(repo.root()).look(L"a.dwg").stamp}});
    EXPECT_EQ(status(), "Nothing has changed since the last commit.\n");
}

TEST_F(StatusOnCommit, ReadsAFileWhateverTheIndexSays)
{
    commit({"a.dwg"});
    repo.write("a.dwg", "changed");
    timespec const second = {1700000000, 7};
    timespec const times[] = {second, second};
    ASSERT_EQ(utimensat(AT_FDCWD, repo.pathTo("a.dwg").c_str(), times, 0), 0);
    repo.write(".tav/tav.state", R"({ "head" : { "reference" : "master" }, "index" : [ { "path" : "a.dwg",
        "data" : { "last_checked" : 1700000000000000007, "modified" : false } } ] })");
    EXPECT_EQ(status().substr(0, 9), "Modified,");
}

using AddOnCommit = OnCommit;

TEST_F(AddOnCommit, StagesModifiedAndNewFiles)
{
    commit({"b.dwg", "same.dwg"});
    repo.write("b.dwg", "changed");
    repo.add({"a.dwg"});
    EXPECT_EQ(tav({"add", "--all"}), done("Staged 2 files.\n"));
    EXPECT_EQ(status(), R"(Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        new:      a.dwg
        modified: b.dwg

)");
}

TEST_F(AddOnCommit, HasNothingToStageOfUnchangedFiles)
{
    commit({"a (1).dwg", "plans/ground.dwg"});
    tav({"add", "a (1).dwg", "plans/ground.dwg"}); // Stores the contents, which this history lacks.
    for (std::string const name : {"a (1).dwg", "plans/ground.dwg", "ground", "plans", "."}) {
        EXPECT_EQ(tav({"add", name}), done("Nothing new to stage.\n")) << name;
    }
    repo.add({"new.dwg"});
    EXPECT_EQ(tav({"add", "plans", "new.dwg", "ground"}), done("Staged 1 file.\n"));
}

TEST_F(AddOnCommit, FailsForRemovedFiles)
{
    commit({"r.dwg"});
    remove("r.dwg");
    repo.add({"new.dwg"});
    EXPECT_EQ(
        tav({"add", "new.dwg", "r.dwg"}),
        failed("tav: 'r.dwg' has been removed. The next commit includes that without staging.\n"));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(AddOnCommit, ListsModifiedAndNewFilesThatAnAmbiguousNameMatches)
{
    commit({"plans/roof.dwg"});
    repo.write("plans/roof.dwg", "changed");
    repo.add({"annex/roof.dwg"});
    EXPECT_EQ(
        tav({"add", "roof"}), failed("tav: More that one file found with name roof. Type more of the path of the one "
                                     "you mean:\n"
                                     "  annex/roof.dwg\n"
                                     "  plans/roof.dwg\n"));
}

TEST_F(AddOnCommit, StagesAgainAFileThatWasStagedAsRemoved)
{
    commit({"a.dwg"});
    EXPECT_EQ(tav({"rm", "a.dwg"}), done("Removed 1 file; the next commit takes that.\n"));
    repo.write("a.dwg", "another drawing");
    EXPECT_EQ(tav({"add", "a.dwg"}), done("Nothing new to stage.\n"));
    EXPECT_EQ(status(), R"(Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        modified: a.dwg

)");
}

using RmOnCommit = OnCommit;

TEST_F(RmOnCommit, RemovesFilesAndStagesThat)
{
    commit({"a.dwg", "plans/b.dwg", "plans/roof.dwg", "c.dwg"});
    EXPECT_EQ(
        tavIn(repo.pathTo("plans"), {"rm", "../a.dwg", "b.dwg", "oof"}),
        done("Removed 3 files; the next commit takes that.\n"));
    EXPECT_EQ(filesOfTheUser(), (std::vector<std::string>{"c.dwg", "plans/"}));
    EXPECT_EQ(status(), R"(Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        removed:  a.dwg
        removed:  plans/b.dwg
        removed:  plans/roof.dwg

)");
    EXPECT_FALSE(repo.has(".tav/removed-0"));
}

TEST_F(RmOnCommit, StagesTheRemovalOfAFileThatIsGone)
{
    commit({"a.dwg", "b.dwg"});
    remove("a.dwg");
    EXPECT_EQ(tav({"rm", "a.dwg", "b.dwg", "b.dwg"}), done("Removed 2 files; the next commit takes that.\n"));
    EXPECT_TRUE(filesOfTheUser().empty());
}

TEST_F(RmOnCommit, TakesNamesWithTheCharactersOfExpressionsAsTheyStand)
{
    commit({"a (1).dwg", "[b]", "a 1.dwg"});
    EXPECT_EQ(tav({"rm", "a (1).dwg", "[b]"}), done("Removed 2 files; the next commit takes that.\n"));
    EXPECT_EQ(filesOfTheUser(), std::vector<std::string>{"a 1.dwg"});
}

TEST_F(RmOnCommit, RemovesNothingWhenOneOfItsFilesIsInNoCommit)
{
    commit({"a.dwg", "b.dwg"});
    repo.write("b.dwg", "changed");
    repo.add({"new.dwg"});
    std::vector<std::string> const before = filesOfTheUser();
    EXPECT_EQ(
        tav({"rm", "a.dwg", "new.dwg"}), failed("tav: 'new.dwg' is in no commit: removing it would lose it. Use 'tav "
                                                "unstage' if it is staged, and delete it "
                                                "yourself if you do not need it.\n"));
    EXPECT_EQ(
        tav({"rm", "a.dwg", "b.dwg"}), failed("tav: 'b.dwg' has changes that are in no commit. Commit them first.\n"));
    EXPECT_EQ(
        tav({"rm", "a.dwg", "nothing"}),
        failed("tav: No committed file matches 'nothing'. Run 'tav status' to see what there is.\n"));
    EXPECT_EQ(tav({"rm", "a.dwg", "("}).code, 1);
    EXPECT_EQ(filesOfTheUser(), before);
    EXPECT_EQ(repo.read("a.dwg"), "committed a.dwg");
    EXPECT_EQ(state(), kFreshState);
    EXPECT_FALSE(repo.has(".tav/removed-0"));
}

TEST_F(RmOnCommit, RemovesNothingWhenANameMatchesSeveralFiles)
{
    commit({"annex/roof.dwg", "plans/roof.dwg"});
    EXPECT_EQ(
        tav({"rm", "roof"}), failed("tav: More that one file found with name roof. Type more of the path of the one "
                                    "you mean:\n"
                                    "  annex/roof.dwg\n"
                                    "  plans/roof.dwg\n"));
    EXPECT_TRUE(repo.has("annex/roof.dwg"));
}

TEST_F(RmOnCommit, RemovesTheFilesOfAFolderUnlessOneHasChanges)
{
    commit({"plans/a.dwg", "plans/b.dwg", "c.dwg"});
    repo.write("plans/b.dwg", "changed");
    EXPECT_EQ(
        tav({"rm", "plans"}), failed("tav: 'plans/b.dwg' has changes that are in no commit. Commit them first.\n"));
    EXPECT_TRUE(repo.has("plans/a.dwg"));
    repo.write("plans/b.dwg", "committed plans/b.dwg");
    EXPECT_EQ(tav({"rm", "plans"}), done("Removed 2 files; the next commit takes that.\n"));
    EXPECT_TRUE(repo.has("c.dwg"));
}

TEST_F(RmOnCommit, NamesTheChangedFileThatAnExpressionMatches)
{
    commit({"plan.dwg", "note.txt"});
    repo.write("plan.dwg", "changed");
    EXPECT_EQ(tav({"rm", "lan"}), failed("tav: 'plan.dwg' has changes that are in no commit. Commit them first.\n"));
    EXPECT_EQ(
        tav({"rm", ".*"}), failed("tav: More that one file found with name .*. Type more of the path of the one you "
                                  "mean:\n  note.txt\n  plan.dwg\n"));
    EXPECT_TRUE(repo.has("note.txt"));
}

TEST_F(RmOnCommit, SaysThatARemovalIsStagedAlready)
{
    commit({"a.dwg", "plans/b.dwg"});
    EXPECT_EQ(tav({"rm", "a.dwg"}), done("Removed 1 file; the next commit takes that.\n"));
    EXPECT_EQ(tav({"mv", "plans", "old"}).code, 0);
    Outcome const already = done("Nothing new to remove: the next commit takes that already.\n");
    EXPECT_EQ(tav({"rm", "a.dwg"}), already);
    EXPECT_EQ(tav({"rm", "plans"}), already);
}

TEST_F(RmOnCommit, StepsAroundWhatAKilledCommandLeft)
{
    commit({"a.dwg", "b.dwg"});
    repo.write(".tav/removed-0", "left over");
    EXPECT_EQ(tav({"rm", "a.dwg", "b.dwg"}), done("Removed 2 files; the next commit takes that.\n"));
    EXPECT_EQ(repo.read(".tav/removed-0"), "left over");
    EXPECT_FALSE(repo.has(".tav/removed-1"));
    EXPECT_FALSE(repo.has(".tav/removed-2"));
}

using UnstageOnCommit = OnCommit;

TEST_F(UnstageOnCommit, SaysWhatTheNextCommitTakesAllTheSame)
{
    commit({"a.dwg", "b.dwg", "c.dwg", "d.dwg"});
    EXPECT_EQ(tav({"rm", "a.dwg"}).code, 0);
    EXPECT_EQ(tav({"mv", "b.dwg", "moved.dwg"}).code, 0);
    repo.write("c.dwg", "changed");
    EXPECT_EQ(tav({"add", "c.dwg"}).code, 0);
    remove("c.dwg");
    repo.write("d.dwg", "changed");
    EXPECT_EQ(tav({"add", "d.dwg"}).code, 0);
    EXPECT_EQ(tav({"unstage", "d.dwg"}), done("Took 1 file out of the next commit.\n"));
    EXPECT_EQ(
        tav({"unstage", "--all"}),
        done("Unstaged 3 files. The next commit takes these all the same, since files are gone (use 'tav restore NAME' "
             "to bring one back):\n"
             "        renamed:  b.dwg -> moved.dwg\n"
             "        removed:  a.dwg\n"
             "        removed:  c.dwg\n"));
    EXPECT_THAT(status(), testing::HasSubstr("renamed:  b.dwg -> moved.dwg"));
    EXPECT_THAT(status(), testing::HasSubstr("removed:  a.dwg\n        removed:  c.dwg"));
}

TEST_F(UnstageOnCommit, SaysNothingOfFilesThatWereNotNamed)
{
    commit({"a.dwg", "b.dwg"});
    remove("a.dwg");
    repo.add({"new.dwg"});
    EXPECT_EQ(tav({"add", "new.dwg"}).code, 0);
    remove("new.dwg");
    EXPECT_EQ(tav({"unstage", "new.dwg"}), done("Took 1 file out of the next commit.\n"));
}

using MvOnCommit = OnCommit;

TEST_F(MvOnCommit, LeavesARenamedFileThatIsBackAsItWasCommitted)
{
    commit({"a.dwg"});
    tav({"mv", "a.dwg", "b.dwg"});
    tav({"mv", "b.dwg", "a.dwg"});
    EXPECT_EQ(status(), "Nothing has changed since the last commit.\n");
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(MvOnCommit, PutsAFileInThePlaceOfARemovedOne)
{
    commit({"a.dwg", "b.dwg"});
    tav({"rm", "b.dwg"});
    EXPECT_EQ(tav({"mv", "a.dwg", "b.dwg"}), done("Renamed 'a.dwg' to 'b.dwg'.\n"));
    EXPECT_EQ(repo.read("b.dwg"), "committed a.dwg");
    EXPECT_EQ(status(), R"(Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        renamed:  a.dwg -> b.dwg

)");
}

using Rm = TavTest;

TEST_F(Rm, RefusesFilesThatAreInNoCommit)
{
    repo.write("a.dwg", "drawing");
    repo.write("b.dwg", "drawing");
    tav({"add", "b.dwg"});
    std::string const before = state();
    for (std::string const name : {"a.dwg", "b.dwg"}) {
        EXPECT_EQ(
            tav({"rm", name}), failed(
                                   "tav: '" + name +
                                   "' is in no commit: removing it would lose it. Use 'tav unstage' if it is staged, "
                                   "and delete it yourself if "
                                   "you do not need it.\n"));
    }
    EXPECT_EQ(repo.read("a.dwg") + repo.read("b.dwg"), "drawingdrawing");
    EXPECT_EQ(state(), before);
}

TEST_F(Rm, FailsForNamesOfNoCommittedFile)
{
    repo.add({"plans/a.dwg"});
    for (std::string const name : {"nothing", "plans", "."}) {
        EXPECT_EQ(
            tav({"rm", name}),
            failed("tav: No committed file matches '" + name + "'. Run 'tav status' to see what there is.\n"));
    }
    EXPECT_EQ(
        tav({"rm", "/x"}),
        failed("tav: '/x' is not located in the current repository. Name a file below '" + repo.path() + "'.\n"));
    EXPECT_EQ(tav({"rm", ""}), failed("tav: The name is empty. Type '.' for the folder that you are in.\n"));
    EXPECT_EQ(
        tav({"rm", "("}), failed("tav: No file is named '(', and it is not a valid expression. Type the path "
                                 "of a file as 'tav status' "
                                 "shows it.\n"));
    EXPECT_TRUE(repo.has("plans/a.dwg"));
}

} // namespace
} // namespace host_tests
