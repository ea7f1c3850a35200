// Commands that bring stored versions back: restore, checkout, switch, export.
#include "tests/host/history_test.h"
#include "tests/host/run_here.h"

#include "platform/os/os_calls.h"

#include <gmock/gmock.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <functional>
#include <map>
#include <sys/stat.h>
#include <unistd.h>

namespace host_tests {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

/// What a copy of this process does when a command in it calls the system. The changes die with the copy.
struct StandIn {
    static inline os::Calls real;
    static inline std::function<void()> act;
    static inline std::string name; ///< of the file whose removal is waited for
    static inline int calls = 0;    ///< that are left until the process dies

    static void whenFlushed(std::function<void()> const& what)
    {
        act = what;
        real = os::calls();
        os::calls().syncfs = [](int file) {
            act();
            return real.syncfs(file);
        };
    }

    static void whenRemoved(std::string const& file, std::function<void()> const& what)
    {
        act = what;
        name = file;
        real = os::calls();
        os::calls().unlinkat = [](int folder, char const* path, int flags) {
            if (path == name) {
                act();
            }
            return real.unlinkat(folder, path, flags);
        };
    }

    /// Dies in the n-th call that changes an entry of a folder.
    static void dieIn(int n)
    {
        calls = n;
        real = os::calls();
        os::calls().renameat = [](int fromFolder, char const* from, int toFolder, char const* to) {
            count();
            return real.renameat(fromFolder, from, toFolder, to);
        };
        os::calls().unlinkat = [](int folder, char const* path, int flags) {
            count();
            return real.unlinkat(folder, path, flags);
        };
        os::calls().mkdirat = [](int folder, char const* path, mode_t mode) {
            count();
            return real.mkdirat(folder, path, mode);
        };
    }

    static void fillTheDisk()
    {
        os::calls().pwrite = [](int, void const*, std::size_t, off_t) -> ssize_t {
            errno = ENOSPC;
            return -1;
        };
    }

private:
    static void count()
    {
        if (calls-- == 0) {
            raise(SIGKILL);
        }
    }
};

/// Two commits: "a.dwg" and "sub/b.txt" as "one", then "a.dwg" as "two", without "sub/b.txt", with "c.dwg".
class Moving : public HistoryTest {
protected:
    Moving()
    {
        repo.write("a.dwg", "one");
        repo.write("sub/b.txt", "one");
        commitAll("the first");
        repo.write("a.dwg", "two");
        repo.write("c.dwg", "two");
        unlink(repo.pathTo("sub/b.txt").c_str());
        rmdir(repo.pathTo("sub").c_str());
        commitAll("the second");
    }

    /// Runs a command in a copy of this process, after `before`.
    Outcome tavAfter(std::function<void()> const& before, Arguments const& arguments) const
    {
        Process process(setting(), [&] {
            before();
            return runHere(arguments);
        });
        return process.wait();
    }

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

    static std::string wouldBeLost(std::string const& names)
    {
        return "tav: These files have uncommitted changes, which would be lost. Commit them first, or discard them "
               "with --force:\n" +
               names;
    }
};

TEST_F(Moving, CheckoutMakesTheFolderWhatItWas)
{
    EXPECT_EQ(
        tav({"checkout", "1"}), done("Now at commit 1 (2 files written, 1 removed).\n"
                                     "To commit here, create a branch with 'tav switch -c NAME'.\n"));
    EXPECT_THAT(filesOfTheUser(), ElementsAre("a.dwg", "sub/", "sub/b.txt"));
    EXPECT_EQ(repo.read("a.dwg"), "one");
    EXPECT_EQ(
        tav({"status"}), done("On branch master\nAt commit 1, which is not the end of the branch (use 'tav switch "
                              "master' to go there)\n\n"
                              "Nothing has changed since the last commit.\n"));
    EXPECT_EQ(tav({"checkout", "2"}).code, 0);
    EXPECT_THAT(filesOfTheUser(), ElementsAre("a.dwg", "c.dwg"));
    EXPECT_EQ(tav({"status"}), done(std::string("On branch master\n\n") + kClean));
}

TEST_F(Moving, CommitsAreNamedByNumberHashBranchAndTag)
{
    std::string const hash = values({"log", "1"}, "hash").at(0);
    tav({"tag", "as-built", "1"});
    for (std::string const& name : {std::string("1"), hash, hash.substr(0, 8), std::string("as-built")}) {
        EXPECT_THAT(values({"show", name}, "number"), ElementsAre("1")) << name;
    }
    EXPECT_THAT(values({"show", "master"}, "number"), ElementsAre("2"));
    for (std::string const name : {"3", "nothing", "0", "-1x", "fff"}) {
        EXPECT_EQ(
            tav({"checkout", "--", name}), failed(
                                               "tav: There is no commit, branch or tag '" + name +
                                               "'. Run 'tav log' or 'tav branch' to see them, or "
                                               "'tav fetch' for those of others.\n"));
    }
}

TEST_F(Moving, CheckoutKeepsUnsavedWorkUnlessForced)
{
    repo.write("a.dwg", "three");
    repo.write("sub/b.txt", "mine");
    EXPECT_EQ(tav({"checkout", "1"}), failed(wouldBeLost("  a.dwg\n  sub/b.txt\n")));
    EXPECT_EQ(repo.read("a.dwg"), "three");
    EXPECT_EQ(repo.read("sub/b.txt"), "mine");
    EXPECT_TRUE(repo.has("c.dwg"));
    EXPECT_EQ(tav({"checkout", "1", "--force"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "one");
    EXPECT_EQ(repo.read("sub/b.txt"), "one");
}

TEST_F(Moving, CheckoutKeepsAChangedFileThatItWouldRemove)
{
    repo.write("c.dwg", "changed");
    EXPECT_EQ(tav({"checkout", "1"}), failed(wouldBeLost("  c.dwg\n")));
    EXPECT_EQ(repo.read("c.dwg"), "changed");
}

TEST_F(Moving, CheckoutLeavesWorkAtOtherPathsAndItsStaging)
{
    repo.write("d.dwg", "new");
    tav({"add", "d.dwg"});
    EXPECT_EQ(tav({"checkout", "1"}).code, 0);
    EXPECT_EQ(repo.read("d.dwg"), "new");
    EXPECT_EQ(
        status(), "Staged for the next commit:\n"
                  "  (use 'tav unstage NAME' to take a file out)\n"
                  "        new:      d.dwg\n\n");
}

TEST_F(Moving, CheckoutKeepsAStagedVersionOfAnotherCommit)
{
    repo.write("a.dwg", "three");
    commitAll("the third");
    tav({"restore", "a.dwg", "--from", "1"});
    tav({"add", "a.dwg"});
    std::string const before = status();
    EXPECT_EQ(tav({"checkout", "2"}), failed(wouldBeLost("  a.dwg\n")));
    EXPECT_EQ(repo.read("a.dwg"), "one");
    EXPECT_EQ(status(), before);
    EXPECT_EQ(tav({"checkout", "1"}), failed(wouldBeLost("  a.dwg\n"))) << "which has that version";
    EXPECT_EQ(status(), before);
    EXPECT_EQ(tav({"checkout", "1", "--force"}).code, 0);
    EXPECT_EQ(status(), kClean);
}

TEST_F(Moving, CheckoutKeepsAStagedRemovalThatTheOtherCommitHasToo)
{
    repo.write("new.txt", "three");
    commitAll("the third");
    tav({"rm", "new.txt"});
    std::string const before = status();
    EXPECT_EQ(tav({"checkout", "2"}), failed(wouldBeLost("  new.txt\n")));
    EXPECT_EQ(status(), before);
}

TEST_F(Moving, CheckoutKeepsAStagedNewFileThatTheOtherCommitHasToo)
{
    repo.write("sub/b.txt", "one");
    tav({"add", "sub/b.txt"});
    std::string const before = status();
    EXPECT_EQ(tav({"checkout", "1"}), failed(wouldBeLost("  sub/b.txt\n")));
    EXPECT_EQ(status(), before);
    EXPECT_EQ(repo.read("sub/b.txt"), "one");
}

TEST_F(Moving, CheckoutOfTheCurrentCommitSaysThatChangesStay)
{
    repo.write("a.dwg", "changed");
    EXPECT_EQ(tav({"checkout", "2"}), done("Now at commit 2.\n1 changed file stays as it is.\n"));
    EXPECT_EQ(repo.read("a.dwg"), "changed");
    tav({"add", "a.dwg"});
    EXPECT_EQ(tav({"checkout", "2"}), done("Now at commit 2.\n1 staged file carried along.\n"));
}

TEST_F(Moving, ForcedCheckoutOfTheCurrentCommitBringsBackItsFiles)
{
    repo.write("a.dwg", "changed");
    tav({"mv", "c.dwg", "d.dwg"});
    EXPECT_EQ(
        tav({"checkout", "2", "--force"}), done("Now at commit 2 (2 files written).\n1 staged file carried along.\n"));
    EXPECT_EQ(repo.read("a.dwg"), "two");
    EXPECT_EQ(repo.read("c.dwg"), "two");
    EXPECT_THAT(status(), HasSubstr("new:      d.dwg")) << "no renaming any more";
    repo.write("a.dwg", "changed");
    EXPECT_EQ(tav({"switch", "master", "--force"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "two");
}

TEST_F(Moving, CheckoutKeepsARestoredVersionOfAnotherCommit)
{
    repo.write("a.dwg", "three");
    commitAll("the third");
    tav({"restore", "a.dwg", "--from", "1"});
    EXPECT_EQ(tav({"checkout", "2"}), failed(wouldBeLost("  a.dwg\n")));
    EXPECT_EQ(repo.read("a.dwg"), "one");
    EXPECT_EQ(tav({"checkout", "2", "--force"}).code, 0);
    EXPECT_EQ(status(), kClean);
}

TEST_F(Moving, CheckoutKeepsANewFileThatIsTheCopyOfACommittedOne)
{
    repo.write("sub/b.txt", "two");
    EXPECT_EQ(tav({"checkout", "1"}), failed(wouldBeLost("  sub/b.txt\n")));
    EXPECT_EQ(repo.read("sub/b.txt"), "two");
}

TEST_F(Moving, CheckoutKeepsStagedRemovalsAndRenames)
{
    tav({"rm", "a.dwg"});
    EXPECT_EQ(tav({"checkout", "1"}), failed(wouldBeLost("  a.dwg\n")));
    EXPECT_THAT(status(), HasSubstr("removed:  a.dwg"));
    tav({"restore", "a.dwg"});
    tav({"mv", "a.dwg", "d.dwg"});
    EXPECT_EQ(tav({"checkout", "1"}), failed(wouldBeLost("  a.dwg\n")));
    EXPECT_THAT(status(), HasSubstr("renamed:  a.dwg -> d.dwg"));
    EXPECT_FALSE(repo.has("a.dwg"));
}

TEST_F(Moving, CheckoutBringsBackAFileThatIsGone)
{
    unlink(repo.pathTo("a.dwg").c_str());
    EXPECT_EQ(tav({"checkout", "1"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "one");
}

TEST_F(Moving, SwitchCarriesStagedFilesAlongAndSaysSo)
{
    tav({"branch", "sketch"});
    tav({"restore", "a.dwg", "--from", "1"});
    tav({"add", "a.dwg"});
    EXPECT_EQ(tav({"switch", "sketch"}), done("Now on branch sketch.\n1 staged file carried along.\n"));
    EXPECT_EQ(repo.read("a.dwg"), "one");
    EXPECT_EQ(tav({"switch", "master"}).code, 0);
    EXPECT_THAT(status(), HasSubstr("modified: a.dwg"));
}

TEST_F(Moving, CheckoutTakesAFileThatHoldsTheNewContentAsItIs)
{
    repo.write("a.dwg", "one");
    EXPECT_EQ(
        tav({"checkout", "1"}), done("Now at commit 1 (1 file written, 1 removed).\n"
                                     "To commit here, create a branch with 'tav switch -c NAME'.\n"));
    EXPECT_EQ(status(), kClean);
}

TEST_F(Moving, CheckoutPutsFilesInThePlaceOfFoldersAndTheReverse)
{
    repo.write("plan/x.dwg", "in a folder");
    commitAll("a folder");
    unlink(repo.pathTo("plan/x.dwg").c_str());
    rmdir(repo.pathTo("plan").c_str());
    repo.write("plan", "a file");
    commitAll("a file");
    EXPECT_EQ(tav({"checkout", "3"}).code, 0);
    EXPECT_EQ(repo.read("plan/x.dwg"), "in a folder");
    EXPECT_EQ(tav({"checkout", "4"}).code, 0);
    EXPECT_EQ(repo.read("plan"), "a file");
    EXPECT_EQ(status(), kClean);
}

TEST_F(Moving, CheckoutWritesThroughNoLink)
{
    support::TempFolder const outside;
    repo.makeLink("sub", outside.path());
    EXPECT_EQ(tav({"checkout", "1"}).code, 1);
    EXPECT_TRUE(outside.list().empty());
    EXPECT_EQ(repo.read("a.dwg"), "two");
    EXPECT_EQ(tav({"checkout", "1", "--force"}).code, 1);
    EXPECT_TRUE(outside.list().empty());
}

TEST_F(Moving, CheckoutKeepsThePermissionsOfFiles)
{
    ASSERT_EQ(chmod(repo.pathTo("a.dwg").c_str(), 0640), 0);
    tav({"checkout", "1"});
    struct stat status;
    ASSERT_EQ(stat(repo.pathTo("a.dwg").c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777, 0640U);
}

TEST_F(Moving, CommitWantsTheEndOfTheBranch)
{
    tav({"checkout", "1"});
    repo.write("a.dwg", "another way");
    tav({"add", "a.dwg"});
    EXPECT_EQ(
        tav({"commit", "-m", "another way"}),
        failed("tav: You are at an earlier commit, not at the end of the branch 'master'. Run 'tav branch NAME' and "
               "'tav switch NAME' to go on from here, or 'tav switch master' to go back to its end.\n"));
    EXPECT_EQ(tav({"branch", "sketch"}), done("Made the branch 'sketch' at commit 1.\n"));
    EXPECT_EQ(tav({"switch", "sketch"}), done("Now on branch sketch.\n1 staged file carried along.\n"));
    EXPECT_EQ(tav({"commit", "-m", "another way"}).code, 0);
    EXPECT_EQ(tav({"branch"}), done("  master  (commit 2)\n* sketch  (commit 3)\n"));
    EXPECT_EQ(tav({"switch", "master"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "two");
    EXPECT_EQ(status(), kClean);
}

TEST_F(Moving, SwitchWantsABranch)
{
    tav({"tag", "as-built"});
    EXPECT_EQ(
        tav({"switch", "as-built"}), failed("tav: 'as-built' is a tag. Use 'tav checkout as-built' to go there.\n"));
    for (std::string const name : {"1", "nothing"}) {
        EXPECT_EQ(
            tav({"switch", name}),
            failed(
                "tav: There is no branch '" + name +
                "'. Run 'tav branch' to see those that there are, or 'tav switch -c NAME' to create one.\n"));
    }
}

TEST_F(Moving, NamesOfBranchesAndTagsAreTakenOnce)
{
    tav({"branch", "north"});
    tav({"tag", "south"});
    EXPECT_EQ(tav({"tag", "north"}), failed("tav: There is a branch 'north' already. Choose another name.\n"));
    EXPECT_EQ(tav({"branch", "south"}), failed("tav: There is a tag 'south' already. Choose another name.\n"));
    EXPECT_EQ(
        tav({"branch", "12"}),
        failed("tav: The name '12' could be taken for the number of a commit. Choose another name.\n"));
    EXPECT_EQ(tav({"tag"}), done("  south  (commit 2)\n"));
}

TEST_F(Moving, RestoreBringsAnEarlierVersionBack)
{
    EXPECT_EQ(tav({"restore", "a.dwg", "--from", "1"}), done("1 file as in commit 1, 1 written.\n"));
    EXPECT_EQ(repo.read("a.dwg"), "one");
    EXPECT_THAT(status(), HasSubstr("modified: a.dwg"));
    EXPECT_EQ(tav({"restore", "a.dwg"}), done("1 file as in commit 2, 1 written.\n"));
    EXPECT_EQ(repo.read("a.dwg"), "two");
    EXPECT_EQ(tav({"restore", "a.dwg"}), done("Nothing to restore: already as in commit 2.\n"));
    EXPECT_EQ(status(), kClean);
}

TEST_F(Moving, RestoreBringsWholeFoldersAndMissingFilesBack)
{
    EXPECT_EQ(tav({"restore", "sub", "--from", "1"}), done("1 file as in commit 1, 1 written.\n"));
    EXPECT_EQ(repo.read("sub/b.txt"), "one");
    unlink(repo.pathTo("a.dwg").c_str());
    unlink(repo.pathTo("c.dwg").c_str());
    EXPECT_EQ(tav({"restore", "."}), done("3 files as in commit 2, 2 written.\n"));
    EXPECT_EQ(repo.read("a.dwg"), "two");
}

TEST_F(Moving, RestoreKeepsUnsavedWorkUnlessForced)
{
    repo.write("a.dwg", "unsaved");
    EXPECT_EQ(tav({"restore", "a.dwg"}), failed(wouldBeLost("  a.dwg\n")));
    tav({"add", "a.dwg"});
    EXPECT_EQ(tav({"restore", "a.dwg"}), failed(wouldBeLost("  a.dwg\n")));
    EXPECT_EQ(repo.read("a.dwg"), "unsaved");
    EXPECT_EQ(tav({"restore", "a.dwg", "--force"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "two");
    EXPECT_EQ(status(), kClean);
}

TEST_F(Moving, CheckoutReadsWhatItOverwritesWhateverTheIndexSays)
{
    tav({"checkout", "1"});
    struct stat status;
    ASSERT_EQ(stat(repo.pathTo("a.dwg").c_str(), &status), 0);
    repo.write("a.dwg", "own");
    std::array<timespec, 2> const times = {status.st_atim, status.st_mtim};
    ASSERT_EQ(utimensat(AT_FDCWD, repo.pathTo("a.dwg").c_str(), times.data(), 0), 0);
    EXPECT_EQ(tav({"checkout", "2"}), failed(wouldBeLost("  a.dwg\n")));
    EXPECT_EQ(repo.read("a.dwg"), "own");
}

TEST_F(Moving, FilesThatOneCommandWroteShowWhenTheyChangePlaces)
{
    repo.write("p.txt", "left");
    repo.write("q.txt", "rite");
    commitAll("two sides");
    tav({"checkout", "1"});
    tav({"checkout", "3"});
    ASSERT_EQ(status(), kClean);
    ASSERT_EQ(rename(repo.pathTo("p.txt").c_str(), repo.pathTo("swap").c_str()), 0);
    ASSERT_EQ(rename(repo.pathTo("q.txt").c_str(), repo.pathTo("p.txt").c_str()), 0);
    ASSERT_EQ(rename(repo.pathTo("swap").c_str(), repo.pathTo("q.txt").c_str()), 0);
    EXPECT_THAT(status(), HasSubstr("modified: p.txt"));
    EXPECT_THAT(status(), HasSubstr("modified: q.txt"));
}

TEST_F(Moving, CheckoutStopsAtTheFirstSightOfAFileThatHasBeenChangedMeanwhile)
{
    auto const edit = [&] { repo.write("a.dwg", "edited"); };
    EXPECT_EQ(
        tavAfter([&] { StandIn::whenFlushed(edit); }, {"checkout", "1"}),
        failed("tav: 'a.dwg' changed while this command was running. Nothing has been written; run the "
               "command again.\n"));
    EXPECT_EQ(repo.read("a.dwg"), "edited");
    EXPECT_THAT(filesOfTheUser(), ElementsAre("a.dwg", "c.dwg"));
    EXPECT_THAT(tav({"status"}).out, Not(HasSubstr("interrupted")));
    EXPECT_EQ(tav({"checkout", "1"}), failed(wouldBeLost("  a.dwg\n")));
}

TEST_F(Moving, CheckoutLeavesAFileThatIsChangedWhileOthersTakeTheirPlaces)
{
    auto const edit = [&] { repo.write("a.dwg", "edited"); };
    EXPECT_EQ(
        tavAfter([&] { StandIn::whenRemoved("c.dwg", edit); }, {"checkout", "1"}),
        failed("tav: 'a.dwg' changed while this command was running. Everything written so far is complete; run the "
               "command again.\n"));
    EXPECT_EQ(repo.read("a.dwg"), "edited");
    EXPECT_EQ(tav({"checkout", "1"}), failed(wouldBeLost("  a.dwg\n")));
    EXPECT_EQ(tav({"checkout", "2"}).code, 0);
    EXPECT_EQ(repo.read("c.dwg"), "two");
    EXPECT_EQ(repo.read("a.dwg"), "edited");
    EXPECT_THAT(status(), HasSubstr("modified: a.dwg"));
}

TEST_F(Moving, RestoreLeavesAFileThatHasBeenMadeMeanwhile)
{
    auto const edit = [&] { repo.write("sub/b.txt", "mine"); };
    EXPECT_EQ(
        tavAfter([&] { StandIn::whenFlushed(edit); }, {"restore", "sub", "--from", "1"}),
        failed("tav: 'sub/b.txt' changed while this command was running. Nothing has been written; run the "
               "command again.\n"));
    EXPECT_EQ(repo.read("sub/b.txt"), "mine");
}

TEST_F(Moving, CheckoutPutsNoFileInThePlaceOfAFolderWithOtherFiles)
{
    repo.write("plan/x.dwg", "in a folder");
    commitAll("a folder");
    unlink(repo.pathTo("plan/x.dwg").c_str());
    rmdir(repo.pathTo("plan").c_str());
    repo.write("plan", "a file");
    commitAll("a file");
    tav({"checkout", "3"});
    repo.write("plan/inner/.notes", "mine");
    for (Arguments const& arguments : {Arguments{"checkout", "4"}, {"checkout", "4", "--force"}}) {
        EXPECT_EQ(
            tav(arguments), failed("tav: 'plan/inner/.notes' is in a folder that a file of the commit replaces. "
                                   "Nothing has been written; move it away first.\n"));
        EXPECT_EQ(repo.read("plan/x.dwg"), "in a folder");
    }
    ASSERT_EQ(unlink(repo.pathTo("plan/inner/.notes").c_str()), 0);
    EXPECT_EQ(tav({"checkout", "4"}).code, 0);
    EXPECT_EQ(repo.read("plan"), "a file");
}

TEST_F(Moving, CheckoutOnAFullDiskHasBegunNothing)
{
    EXPECT_EQ(
        tavAfter(StandIn::fillTheDisk, {"checkout", "1"}),
        failed(
            "tav: 'a.dwg' cannot be restored: '" + repo.pathTo(".tav/restoring/0") +
            "' cannot be written: No space left on device. Check the free space.\n"));
    EXPECT_EQ(tav({"status"}), done(std::string("On branch master\n\n") + kClean));
    EXPECT_THAT(filesOfTheUser(), ElementsAre("a.dwg", "c.dwg"));
}

/// The files of each commit, by its number.
using Contents = std::map<std::string, std::string>;

class InterruptedMove : public Moving {
protected:
    InterruptedMove()
    {
        unlink(repo.pathTo("a.dwg").c_str());
        repo.write("a.dwg/x.dwg", "three");
        repo.write("c.dwg", "three");
        repo.write("d.dwg", "three");
        commitAll("the third");
    }

    void expectAt(std::string const& commit, std::string const& when) const
    {
        Contents contents;
        for (std::string const& name : filesOfTheUser()) {
            if (name.back() != '/') {
                contents[name] = repo.read(name);
            }
        }
        EXPECT_EQ(contents, contents_.at(commit)) << "at commit " << commit << ", " << when;
        EXPECT_EQ(status(), kClean) << "at commit " << commit << ", " << when;
    }

    /// Whether the command came to its end.
    bool dieIn(int n, std::string const& commit) const
    {
        Outcome const outcome = tavAfter([&] { StandIn::dieIn(n); }, {"checkout", commit});
        EXPECT_TRUE(outcome.code == 0 || outcome.code == -SIGKILL) << testing::PrintToString(outcome);
        return outcome.code == 0;
    }

    std::map<std::string, Contents> const contents_ = {
        {"1", {{"a.dwg", "one"}, {"sub/b.txt", "one"}}},
        {"2", {{"a.dwg", "two"}, {"c.dwg", "two"}}},
        {"3", {{"a.dwg/x.dwg", "three"}, {"c.dwg", "three"}, {"d.dwg", "three"}}}};
};

TEST_F(InterruptedMove, LeavesNothingBehindAfterAnyOtherMove)
{
    for (std::string const next : {"1", "2", "3"}) {
        int n = 0;
        for (bool isDone = false; !isDone; ++n) {
            isDone = dieIn(n, "1");
            EXPECT_EQ(tav({"checkout", next}).code, 0);
            expectAt(next, "after death in call " + std::to_string(n));
            ASSERT_EQ(tav({"checkout", "3"}).code, 0);
        }
        EXPECT_GT(n, 5);
    }
}

TEST_F(InterruptedMove, LeavesNothingBehindAfterTwoOfThem)
{
    for (std::string const next : {"1", "2", "3"}) {
        int n = 0;
        for (bool isDone = false; !isDone; ++n) {
            isDone = dieIn(n, "1");
            dieIn(n, "2");
            EXPECT_EQ(tav({"checkout", next}).code, 0);
            expectAt(next, "after two deaths in call " + std::to_string(n));
            ASSERT_EQ(tav({"checkout", "3"}).code, 0);
        }
        EXPECT_GT(n, 5);
    }
}

TEST_F(Moving, RestoreLeavesNoRemovalStaged)
{
    tav({"rm", "a.dwg"});
    tav({"restore", "a.dwg", "--from", "1"});
    EXPECT_EQ(state().find("staged_files"), std::string::npos) << state();
    EXPECT_THAT(status(), HasSubstr("modified: a.dwg"));
}

TEST_F(Moving, RestoreKeepsAStagedVersionOfAnotherCommitUnlessForced)
{
    tav({"restore", "a.dwg", "--from", "1"});
    tav({"add", "a.dwg"});
    EXPECT_EQ(tav({"restore", "a.dwg"}), failed(wouldBeLost("  a.dwg\n")));
    EXPECT_EQ(repo.read("a.dwg"), "one");
    EXPECT_EQ(tav({"restore", "a.dwg", "--force"}).code, 0);
    EXPECT_EQ(status(), kClean);
}

TEST_F(Moving, RestoreBringsBackAStagedFileThatIsGone)
{
    repo.write("a.dwg", "three");
    tav({"add", "a.dwg"});
    unlink(repo.pathTo("a.dwg").c_str());
    EXPECT_EQ(tav({"restore", "a.dwg"}).code, 0);
    EXPECT_EQ(status(), kClean);
}

TEST_F(Moving, RestoreOfARenamedFileLeavesItsCopyNew)
{
    tav({"mv", "a.dwg", "d.dwg"});
    EXPECT_EQ(tav({"restore", "a.dwg"}).code, 0);
    EXPECT_THAT(status(), HasSubstr("new:      d.dwg"));
    EXPECT_THAT(status(), Not(HasSubstr("renamed")));
}

TEST_F(Moving, RestoreSaysWhatACommitDoesNotHave)
{
    EXPECT_EQ(
        tav({"restore", "sub/b.txt"}),
        failed(
            "tav: No file of commit 2 matches 'sub/b.txt'. Name another one with --from, or run 'tav log' to see the "
            "commits.\n"));
}

TEST_F(Moving, ExportWritesTheFilesOfACommitElsewhere)
{
    support::TempFolder const target;
    EXPECT_EQ(
        tav({"export", "1", target.pathTo("old")}),
        done("Wrote 2 files of commit 1 into '" + target.pathTo("old") + "'.\n"));
    EXPECT_THAT(target.list(), ElementsAre("old/", "old/a.dwg", "old/sub/", "old/sub/b.txt"));
    EXPECT_EQ(target.read("old/a.dwg"), "one");
    EXPECT_EQ(
        tav({"export", "1", target.path()}),
        failed("tav: '" + target.path() + "' is not empty. Name a folder that is empty or does not exist yet.\n"));
}

TEST_F(Moving, GcKeepsWhatCommitsNeed)
{
    repo.write(".tav/objects/" + std::string(64, 'a'), "left over");
    Outcome const outcome = tav({"gc"});
    EXPECT_EQ(outcome, done("Removed 1 stored version that no commit needs; 9 bytes freed.\n"));
    EXPECT_FALSE(repo.has(".tav/objects/" + std::string(64, 'a')));
    EXPECT_EQ(tav({"verify"}), done("Read 3 stored versions; nothing is damaged.\n"));
    EXPECT_EQ(tav({"checkout", "1"}).code, 0);
}

TEST_F(Moving, VerifyFindsDamage)
{
    std::string store;
    for (std::string const& name : repo.list()) {
        store = name.find(".tav/tf/a-") == 0 ? name : store;
    }
    std::string bytes = repo.read(store);
    bytes[bytes.size() - 2] = static_cast<char>(bytes[bytes.size() - 2] ^ 1);
    repo.write(store, bytes);
    repo.write("a.dwg", "own"); // Else the damage would be repaired from a working file.
    repo.write("c.dwg", "own");
    Outcome const outcome = tav({"verify"});
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(
        outcome.err, testing::MatchesRegex("tav: 1 of 3 stored versions cannot be read. Put copies of these files from "
                                           "a backup in their place:\n  .*/\\.tav/tf/a-[0-9a-f]*\\.tf, for 'a.dwg' of "
                                           "commit 2: The content of 'tf:a-[^ ]*' is damaged\\.\n"));
    EXPECT_EQ(tav({"restore", "a.dwg", "--from", "1", "--force"}).code, 0);
}

TEST_F(Moving, EndsAtAnOpenConflict)
{
    repo.write(".tav/conflict/plans/roof.theirs.dwg", "theirs");
    repo.write("a.dwg", "three");
    tav({"add", "a.dwg"});
    tav({"branch", "sketch"});
    for (Arguments const& command :
         {Arguments{"commit", "-m", "x"}, {"switch", "sketch"}, {"checkout", "1"}, {"checkout", "1", "--force"}}) {
        EXPECT_EQ(
            tav(command), failed("tav: These drawings are in conflict. Put the version to keep in its place, "
                                 "remove the others from '.tav/conflict', and run the command again:\n"
                                 "  plans/roof.dwg\n"))
            << command.front();
    }
    EXPECT_EQ(repo.read("a.dwg"), "three");
    ASSERT_EQ(unlink(repo.pathTo(".tav/conflict/plans/roof.theirs.dwg").c_str()), 0);
    EXPECT_EQ(tav({"commit", "-m", "x"}).code, 0);
}

TEST_F(Moving, EndsAtAConflictFolderThatCannotBeRead)
{
    repo.write(".tav/conflict", "a file");
    for (Arguments const& command : {Arguments{"status"}, {"commit", "-m", "x"}, {"checkout", "1"}}) {
        EXPECT_EQ(
            tav(command), failed(
                              "tav: The conflict folder '" + repo.pathTo(".tav/conflict") +
                              "' cannot be read: Not a directory. Check your permissions for it.\n"));
    }
}

TEST_F(Moving, MissingDatabaseIsNotMistakenForANewRepository)
{
    ASSERT_EQ(unlink(repo.pathTo(".tav/tav.db").c_str()), 0);
    for (char const* const command : {"status", "log", "gc"}) {
        EXPECT_EQ(
            tav({command}), failed(
                                "tav: The database '" + repo.path() +
                                "/.tav/tav.db' is missing or empty, though versions are stored here. Run 'tav init', "
                                "with --server FOLDER where the history is not in the default place.\n"));
    }
    EXPECT_FALSE(repo.has(".tav/tav.db"));
}

TEST_F(Moving, MissingServerIsNotMadeAgain)
{
    support::TempFolder const place;
    support::TempRepository const other;
    std::string const server = place.pathTo("server");
    ASSERT_EQ(tavIn(other.path(), {"init", "--server", server}).code, 0);
    ASSERT_EQ(rename(server.c_str(), place.pathTo("moved").c_str()), 0);
    other.write("a.dwg", "one");
    tavIn(other.path(), {"add", "a.dwg"});
    EXPECT_EQ(
        tavIn(other.path(), {"commit", "-m", "drawn"}), failed(
                                                            "tav: The server folder '" + server +
                                                            "' is missing. Connect its drive or move the folder back. "
                                                            "If it has a new place, run 'tav server FOLDER'.\n"));
    EXPECT_FALSE(place.has("server"));
}

TEST_F(Moving, ProjectsListsTheRepository)
{
    EXPECT_THAT(values({"projects"}, "path"), testing::Contains(repo.path()));
}

} // namespace
} // namespace host_tests
