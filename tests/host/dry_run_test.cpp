// What commands would do, said without doing any of it.
#include "tests/host/history_test.h"
#include "tests/support/rows.h"

#include "host/repository/journal.h"

#include "platform/os/os_lock.h"

#include <chrono>
#include <filesystem>
#include <map>
#include <sys/stat.h>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

struct DryRunRow {
    char const* name;
    Arguments arguments;
    std::string out;
    std::string err = {};
};

/// Two commits of "план.dwg" and "sub/b \"1\".txt", and work that is in neither.
class DryRun
    : public HistoryTest
    , public testing::WithParamInterface<DryRunRow> {
protected:
    DryRun()
    {
        repo.write("план.dwg", "one");
        repo.write("sub/b \"1\".txt", "one");
        commitAll("first");
        tav({"tag", "tender"});
        tav({"branch", "draft"});
        repo.write("план.dwg", "two");
        repo.write("-c.dwg", "two");
        commitAll("second");
        repo.write("sub/b \"1\".txt", "unsaved");
        repo.write("new.txt", "staged");
        tav({"add", "new.txt"});
    }

    /// Contents, times and permissions of everything in the working folder.
    std::map<std::string, std::string> everything() const
    {
        std::map<std::string, std::string> found;
        for (std::string const& name : repo.list()) {
            struct stat entry = {};
            EXPECT_EQ(lstat(repo.pathTo(name).c_str(), &entry), 0);
            found[name] = std::to_string(entry.st_ino) + " " + std::to_string(entry.st_mode) + " " +
                          std::to_string(entry.st_mtim.tv_sec) + "." + std::to_string(entry.st_mtim.tv_nsec) + " " +
                          (S_ISREG(entry.st_mode) ? repo.read(name) : "");
        }
        return found;
    }
};

TEST_P(DryRun, SaysWhatWouldHappenWhileAnotherCommandHoldsTheLockAndChangesNothing)
{
    std::map<std::string, std::string> const before = everything();
    os::FileLock lock;
    ASSERT_FALSE(lock.acquire(repo.pathTo(".tav/tav.lock"), "'tav commit', process 7", std::chrono::milliseconds(0)));
    std::map<std::string, std::string> const locked = everything();
    EXPECT_EQ(tav(GetParam().arguments), (Outcome{0, GetParam().out, GetParam().err}));
    EXPECT_EQ(everything(), locked);
}

INSTANTIATE_TEST_SUITE_P(
    Commands, DryRun,
    testing::Values(
        DryRunRow{"Rm", {"rm", "--dry-run", "план.dwg"}, "Would remove: план.dwg\n"},
        DryRunRow{"RmOfADash", {"rm", "--dry-run", "--", "-c.dwg"}, "Would remove: -c.dwg\n"},
        DryRunRow{"Mv", {"mv", "--dry-run", "план.dwg", "图.dwg"}, "Would rename 'план.dwg' to '图.dwg'.\n"},
        DryRunRow{
            "MvIntoAFolder", {"mv", "--dry-run", "план.dwg", "sub"}, "Would rename 'план.dwg' to 'sub/план.dwg'.\n"},
        DryRunRow{"Restore", {"restore", "--dry-run", "план.dwg", "--from", "1"}, "Would write:  план.dwg\n"},
        DryRunRow{"RestoreOfNothing", {"restore", "--dry-run", "план.dwg"}, "No file would be changed.\n"},
        DryRunRow{
            "RestoreForced",
            {"restore", "--dry-run", "--force", "."},
            "Would write:  sub/b \"1\".txt (has uncommitted changes)\n"},
        DryRunRow{"RestoreTo", {"restore", "--dry-run", "--to", "old.dwg", "план.dwg"}, "Would write:  old.dwg\n"},
        DryRunRow{
            "Checkout",
            {"checkout", "--dry-run", "1"},
            "Would go to commit 1.\nWould write:  план.dwg\nWould remove: -c.dwg\n"},
        DryRunRow{
            "CheckoutForced",
            {"checkout", "--dry-run", "--force", "1"},
            "Would go to commit 1.\nWould write:  sub/b \"1\".txt (has uncommitted changes)\nWould write:  план.dwg\n"
            "Would remove: -c.dwg\n"},
        DryRunRow{
            "Switch",
            {"switch", "--dry-run", "draft"},
            "Would go to branch draft.\nWould write:  план.dwg\nWould remove: -c.dwg\n"},
        DryRunRow{
            "SwitchToNew",
            {"switch", "--dry-run", "-c", "вариант"},
            "Would go to the new branch вариант.\nNo file would be changed.\n"},
        DryRunRow{"Gc", {"gc", "--dry-run"}, "Would remove at most 0 stored versions.\n"},
        DryRunRow{
            "Branch",
            {"branch", "-d", "--dry-run", "draft"},
            "Would delete the branch 'draft', which was at commit 1.\n"},
        DryRunRow{
            "Tag", {"tag", "-d", "--dry-run", "tender"}, "Would delete the tag 'tender', which was at commit 1.\n"},
        DryRunRow{
            "IgnoreAdd",
            {"ignore", "--dry-run", "--add", "*.dwg"},
            "Names that match '^.*\\.dwg$' would be ignored.\n",
            "tav: The rule is for new files: it does not apply to 2 committed or staged files with such a name.\n"},
        DryRunRow{
            "IgnoreRemove", {"ignore", "--dry-run", "--remove", "*.bak"}, "Would remove the rule '^.*\\.bak$'.\n"}),
    support::rowName);

struct RefusedRow {
    char const* name;
    Arguments arguments;
};

class RefusedDryRun
    : public HistoryTest
    , public testing::WithParamInterface<RefusedRow> {};

TEST_P(RefusedDryRun, FailsAsTheCommandDoes)
{
    repo.write("a.dwg", "one");
    commitAll("first");
    repo.write("a.dwg", "two");
    repo.write("b.dwg", "two");
    commitAll("second");
    tav({"tag", "south", "1"});
    repo.write("a.dwg", "unsaved");
    Arguments dry = GetParam().arguments;
    dry.insert(dry.begin() + 1, "--dry-run");
    Outcome const outcome = tav(dry);
    EXPECT_EQ(outcome.code, 1);
    EXPECT_EQ(outcome, tav(GetParam().arguments));
}

INSTANTIATE_TEST_SUITE_P(
    Commands, RefusedDryRun,
    testing::Values(
        RefusedRow{"RmOfWork", {"rm", "a.dwg"}}, RefusedRow{"RmOfNothing", {"rm", "none.dwg"}},
        RefusedRow{"MvOfNothing", {"mv", "none.dwg", "c.dwg"}}, RefusedRow{"MvOntoAFile", {"mv", "a.dwg", "b.dwg"}},
        RefusedRow{"MvToAHiddenName", {"mv", "a.dwg", ".a.dwg"}}, RefusedRow{"RestoreOverWork", {"restore", "a.dwg"}},
        RefusedRow{"RestoreToAFile", {"restore", "--to", "b.dwg", "a.dwg"}},
        RefusedRow{"CheckoutOverWork", {"checkout", "1"}}, RefusedRow{"CheckoutOfNothing", {"checkout", "none"}},
        RefusedRow{"SwitchToATag", {"switch", "south"}}, RefusedRow{"SwitchToNothing", {"switch", "none"}},
        RefusedRow{"SwitchToATakenName", {"switch", "-c", "south"}},
        RefusedRow{"SwitchToABadName", {"switch", "-c", "12"}},
        RefusedRow{"BranchOfTheFolder", {"branch", "-d", "master"}}),
    support::rowName);

class PendingDryRun
    : public HistoryTest
    , public testing::WithParamInterface<RefusedRow> {};

TEST_P(PendingDryRun, SaysThatACommitIsCompletedFirst)
{
    repo.write("a.dwg", "one");
    commitAll("first");
    tav({"branch", "draft"});
    {
        tav::LocalDatabase database = tav::LocalDatabase::openForChanges(repo.root());
        tav::Operation commit;
        commit.kind = tav::Kind::commit;
        commit.phase = tav::Phase::running;
        tav::beginCommit(commit, {L"{}", {}, {}}, database);
    }
    Outcome const outcome = tav(GetParam().arguments);
    EXPECT_EQ(outcome.code, 0);
    EXPECT_EQ(outcome.err, "tav: A commit was interrupted. The next command that changes something completes it.\n");
}

INSTANTIATE_TEST_SUITE_P(
    Commands, PendingDryRun,
    testing::Values(
        RefusedRow{"Rm", {"rm", "--dry-run", "a.dwg"}}, RefusedRow{"Mv", {"mv", "--dry-run", "a.dwg", "b.dwg"}},
        RefusedRow{"Restore", {"restore", "--dry-run", "a.dwg"}},
        RefusedRow{"Switch", {"switch", "--dry-run", "draft"}}, RefusedRow{"Gc", {"gc", "--dry-run"}},
        RefusedRow{"Branch", {"branch", "-d", "--dry-run", "draft"}}),
    support::rowName);

} // namespace
} // namespace host_tests
