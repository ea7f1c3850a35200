#include "tests/host/tav_test.h"

#include "host/repository/unfinished.h"

#include "platform/os/os_lock.h"

#include <array>
#include <chrono>
#include <csignal>
#include <memory>
#include <thread>
#include <unistd.h>

namespace host_tests {
namespace {

class Lock : public TavTest {
protected:
    Lock()
    {
        repo.add({"a.dwg", "b.dwg"});
        tav({"add", "b.dwg"});
    }

    os::FileLock hold(std::string const& note) const
    {
        os::FileLock lock;
        EXPECT_FALSE(lock.acquire(repo.pathTo(".tav/tav.lock"), note, std::chrono::milliseconds(0)));
        return lock;
    }
};

struct ChangingRow {
    char const* name;
    Arguments arguments;
};

class LockAgainstChanges
    : public Lock
    , public testing::WithParamInterface<ChangingRow> {};

TEST_P(LockAgainstChanges, IsWaitedForShortlyAndItsHolderNamed)
{
    std::vector<std::string> const before = repo.list();
    std::string const stateBefore = state();
    os::FileLock const lock = hold("'tav add', process 7 on \x1b[31melsewhere");
    auto const start = std::chrono::steady_clock::now();
    EXPECT_EQ(
        tav(GetParam().arguments), failed("tav: 'tav add', process 7 on \\x1B[31melsewhere, is changing the "
                                          "repository. Run the command again when that "
                                          "is done.\n"));
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
    EXPECT_EQ(repo.list(), before);
    EXPECT_EQ(state(), stateBefore);
}

INSTANTIATE_TEST_SUITE_P(
    Commands, LockAgainstChanges,
    testing::Values(
        ChangingRow{"Init", {"init"}}, ChangingRow{"Add", {"add", "a.dwg"}},
        ChangingRow{"Unstage", {"unstage", "b.dwg"}}, ChangingRow{"Mv", {"mv", "a.dwg", "c.dwg"}},
        ChangingRow{"Rm", {"rm", "a.dwg"}}, ChangingRow{"IgnoreAdd", {"ignore", "--add", "x"}}),
    rowName<ChangingRow>);

TEST_F(Lock, DoesNotConcernCommandsThatOnlyRead)
{
    os::FileLock const lock = hold("someone");
    EXPECT_EQ(tav({"files"}), done("a.dwg\nb.dwg\n"));
    EXPECT_EQ(tav({"ignore"}), done("^.*\\.bak$\n^.*\\.dwl$\n^.*\\.dwl2$\n"));
    EXPECT_EQ(tav({"status"}), done(R"(On branch master

Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        new:      b.dwg

New, not staged:
  (use 'tav add NAME' or 'tav add --all' to stage)
        a.dwg

)"));
}

TEST_F(Lock, IsTakenOnceItsHolderIsDone)
{
    auto lock = std::make_unique<os::FileLock>(hold("someone"));
    Process process(setting(), {"add", "a.dwg"});
    std::this_thread::sleep_for(std::chrono::milliseconds(500));
    EXPECT_TRUE(process.isRunning());
    lock.reset();
    EXPECT_EQ(process.wait(), done("Staged 1 file.\n"));
}

TEST_F(Lock, OfAKilledProcessIsFree)
{
    Process holder(setting(), [this] {
        os::FileLock const lock = hold("someone");
        raise(SIGKILL);
        return 0;
    });
    EXPECT_EQ(holder.wait().code, -SIGKILL);
    EXPECT_EQ(tav({"add", "a.dwg"}), done("Staged 1 file.\n"));
}

TEST_F(Lock, NamesTheCommandThatHoldsIt)
{
    std::array<char, 256> host{};
    ASSERT_EQ(gethostname(host.data(), host.size()), 0);
    Process process(setting(), {"add", "a.dwg"});
    EXPECT_EQ(process.wait(), done("Staged 1 file.\n"));
    EXPECT_EQ(
        os::FileLock::holder(repo.pathTo(".tav/tav.lock")),
        "'tav add', process " + std::to_string(process.id()) + " on " + host.data());
}

TEST_F(Lock, IsNotTakenThroughALink)
{
    support::TempFolder const elsewhere;
    elsewhere.write("precious", "content");
    ASSERT_EQ(unlink(repo.pathTo(".tav/tav.lock").c_str()), 0);
    repo.makeLink(".tav/tav.lock", elsewhere.pathTo("precious"));
    EXPECT_EQ(
        tav({"add", "a.dwg"}), failed(
                                   "tav: The repository cannot be locked: Too many levels of symbolic links. Move '" +
                                   repo.pathTo(".tav/tav.lock") + "' away; the next command makes a new one.\n"));
    EXPECT_EQ(elsewhere.read("precious"), "content");
}

TEST_F(Lock, OfARunningCommandKeepsItsWorkFromBeingCalledInterrupted)
{
    tav::LocalDatabase database = tav::LocalDatabase::make(repo.root());
    tav::note(tav::CommitUnderWay{L"{}", {}, {}}, database);
    {
        os::FileLock const lock = hold("'tav commit', process 7 on studio");
        for (char const* const command : {"status", "log"}) {
            EXPECT_EQ(tav({command}).err, "tav: 'tav commit', process 7 on studio, is changing the repository.\n");
        }
    }
    for (char const* const command : {"status", "log"}) {
        EXPECT_EQ(
            tav({command}).err,
            "tav: A commit was interrupted. The next command that changes something completes it.\n");
    }
}

} // namespace
} // namespace host_tests
