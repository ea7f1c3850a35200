// What a killed 'tav rm' leaves, and how 'tav gc' removes it.
#include "tests/host/history_test.h"
#include "tests/host/run_here.h"
#include "tests/support/failing_call.h"

#include <gmock/gmock.h>

#include <csignal>

namespace host_tests {
namespace {

constexpr int kAllCallsWorked = 77;
std::string const kNothing = "Removed 0 stored versions that no commit needs; 0 bytes freed.\n";

class RemovedFiles : public HistoryTest {
protected:
    RemovedFiles()
    {
        repo.write("a.dwg", "drawing");
        EXPECT_EQ(commitAll("first").code, 0);
    }

    Outcome killRemoval(int n) const
    {
        Process process(setting(), [&] {
            support::FailingCall const failing(n, support::FailingCall::kKillProcess);
            runHere({"rm", "a.dwg"});
            return kAllCallsWorked;
        });
        return process.wait();
    }

    bool hasLeftovers() const { return repo.has(".tav/removed-0"); }
};

TEST_F(RemovedFiles, OfAKilledCommandAreRemovedByTheNextCleaning)
{
    int found = 0;
    for (int n = 0; killRemoval(n).code == -SIGKILL; ++n) {
        bool const isFound = hasLeftovers();
        found += isFound ? 1 : 0;
        std::string const alsoRemoved =
            isFound ? "Removed 1 file that a killed 'tav rm' had left; 7 bytes freed.\n" : "";
        EXPECT_EQ(tav({"gc"}), done(kNothing + alsoRemoved));
        EXPECT_FALSE(hasLeftovers());
        EXPECT_EQ(tav({"restore", "a.dwg"}).code, 0);
        EXPECT_EQ(repo.read("a.dwg"), "drawing");
    }
    EXPECT_GT(found, 3);
}

TEST_F(RemovedFiles, StayWhenNoCommitHasTheirContent)
{
    repo.write(".tav/removed-0", "drawing of nobody else");
    Outcome const outcome{
        0, kNothing,
        "tav: '" + repo.pathTo(".tav/removed-0") +
            "' was left by an interrupted 'tav rm' and has content that is in no commit. Keep it elsewhere or delete "
            "it.\n"};
    EXPECT_EQ(tav({"gc"}), outcome);
    EXPECT_EQ(repo.read(".tav/removed-0"), "drawing of nobody else");
}

TEST_F(RemovedFiles, RepairTheStorageBeforeTheyGo)
{
    ASSERT_EQ(rename(repo.pathTo("a.dwg").c_str(), repo.pathTo(".tav/removed-0").c_str()), 0);
    for (std::string const& name : repo.list()) {
        if (name.find(".tf") != std::string::npos) {
            repo.write(name, repo.read(name).replace(110, 1, "x"));
        }
    }
    EXPECT_EQ(tav({"verify"}).code, 1);
    EXPECT_EQ(tav({"gc"}).code, 0);
    EXPECT_FALSE(hasLeftovers());
    EXPECT_EQ(tav({"restore", "a.dwg"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "drawing");
}

TEST_F(RemovedFiles, AreNotMistakenForOthers)
{
    repo.write(".tav/removed-", "drawing");
    repo.write(".tav/removed-0x", "drawing");
    EXPECT_EQ(tav({"gc"}), done(kNothing));
    EXPECT_TRUE(repo.has(".tav/removed-") && repo.has(".tav/removed-0x"));
}

} // namespace
} // namespace host_tests
