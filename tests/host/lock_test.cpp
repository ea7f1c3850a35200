#include "tests/host/run_here.h"
#include "tests/host/tav_test.h"

#include "host/repository/journal.h"

#include "platform/os/os_calls.h"
#include "platform/os/os_lock.h"

#include <array>
#include <cerrno>
#include <chrono>
#include <csignal>
#include <fcntl.h>
#include <memory>
#include <sys/file.h>
#include <unistd.h>
#include <utility>

namespace host_tests {
namespace {

std::vector<Arguments> const kChanges = {
    {"init"},        {"add", "a.dwg"},         {"unstage", "b.dwg"}, {"mv", "a.dwg", "c.dwg"},
    {"rm", "a.dwg"}, {"ignore", "--add", "x"},
};

/// A child tells its parent through a pipe that it has met a lock that somebody else holds.
class MeetingOfALock {
public:
    MeetingOfALock() { EXPECT_EQ(pipe2(ends_.data(), O_CLOEXEC), 0); }
    MeetingOfALock(MeetingOfALock const&) = delete;
    MeetingOfALock& operator=(MeetingOfALock const&) = delete;
    ~MeetingOfALock()
    {
        close(ends_[0]);
        closeWriter();
    }

    /// In the child: from now on a lock that is taken is told.
    void tell() const
    {
        writer = ends_[1];
        os::calls().flock = [](int file, int operation) {
            int const result = ::flock(file, operation);
            int const error = errno;
            if (result == -1 && error == EWOULDBLOCK) {
                [[maybe_unused]] auto const told = ::write(writer, "", 1);
            }
            errno = error;
            return result;
        };
    }

    /// In the parent: whether the child has met the lock, and not ended before.
    bool wait()
    {
        closeWriter();
        char byte = 0;
        return read(ends_[0], &byte, 1) == 1;
    }

private:
    inline static int writer = -1;

    void closeWriter() { close(std::exchange(ends_[1], -1)); }

    std::array<int, 2> ends_{};
};

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

TEST_F(Lock, IsWaitedForBrieflyByEveryChangeAndItsHolderNamed)
{
    std::vector<std::string> const before = repo.list();
    std::string const stateBefore = state();
    os::FileLock const lock = hold("'tav add', process 7 on \x1b[31melsewhere");
    auto const start = std::chrono::steady_clock::now();
    std::vector<std::unique_ptr<Process>> processes; // They wait at the same time.
    for (Arguments const& arguments : kChanges) {
        processes.push_back(std::make_unique<Process>(setting(), arguments));
    }
    for (std::size_t i = 0; i < kChanges.size(); ++i) {
        EXPECT_EQ(
            processes[i]->wait(), failed("tav: 'tav add', process 7 on \\x1B[31melsewhere, is changing the repository. "
                                         "Run the command again when that is done.\n"))
            << kChanges[i].front();
        EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::seconds(2)) << kChanges[i].front();
    }
    EXPECT_EQ(repo.list(), before);
    EXPECT_EQ(state(), stateBefore);
}

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
    MeetingOfALock meeting;
    Process process(setting(), [&] {
        lock.reset(); // The copy that came with the process; the lock is still held here.
        meeting.tell();
        return runHere({"add", "a.dwg"});
    });
    EXPECT_TRUE(meeting.wait());
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
    tav::Operation commit;
    commit.kind = tav::Kind::commit;
    commit.phase = tav::Phase::running;
    tav::beginCommit(commit, {L"{}", {}, {}}, database);
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
