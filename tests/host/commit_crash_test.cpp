// Commits that are killed at some moment.
#include "tests/host/history_test.h"
#include "tests/support/sanitized.h"

#include <gmock/gmock.h>

#include <chrono>
#include <csignal>
#include <random>
#include <thread>

namespace host_tests {
namespace {

constexpr int kRounds = support::kIsSanitized ? 4 : 20; // for each of the six seeds
constexpr int kFiles = 8;

class CommitCrash
    : public HistoryTest
    , public testing::WithParamInterface<unsigned> {
protected:
    using Duration = std::chrono::microseconds;

    /// Changes every file, and says what they hold.
    std::string edit(int round) const
    {
        for (int i = 0; i < kFiles; ++i) {
            repo.write(nameOf(i), contentOf(round, i));
        }
        return "round " + std::to_string(round);
    }

    static std::string nameOf(int i) { return "plan-" + std::to_string(i) + (i % 3 == 0 ? ".txt" : ".dwg"); }

    static std::string contentOf(int round, int i)
    {
        return std::string(static_cast<std::size_t>(1000 * i), 'x') + std::to_string(round * kFiles + i);
    }

    Duration timeOf(std::string const& message) const
    {
        auto const start = std::chrono::steady_clock::now();
        EXPECT_EQ(tav({"commit", "-m", message}).code, 0);
        return std::chrono::duration_cast<Duration>(std::chrono::steady_clock::now() - start);
    }

    void killWithin(Duration whole, std::string const& message)
    {
        Process process(setting(), {"commit", "-m", message});
        std::this_thread::sleep_for(Duration(std::uniform_int_distribution<long>(0, whole.count())(random_)));
        process.send(SIGKILL);
        process.wait();
    }

    std::minstd_rand random_{GetParam()}; // The same delays in every run.
};

TEST_P(CommitCrash, LeavesOneCommitOfEachOrderAfterItIsRepeated)
{
    edit(0);
    tav({"add", "--all"});
    Duration const whole = timeOf("round 0") * 5 / 4;
    for (int round = 1; round <= kRounds; ++round) {
        std::string const message = edit(round);
        ASSERT_EQ(tav({"add", "--all"}).code, 0);
        killWithin(whole, message);
        Outcome const verified = tav({"verify"});
        ASSERT_EQ(verified.code, 0) << testing::PrintToString(verified);
        ASSERT_EQ(verified.out.find("Repaired"), std::string::npos) << verified.out;
        ASSERT_EQ(tav({"log", "-n", "1"}).code, 0);
        Outcome const repeated = tav({"commit", "-m", message});
        ASSERT_EQ(repeated.code, 0) << testing::PrintToString(repeated);
        ASSERT_EQ(values({"log", "-n", "1"}, "number"), std::vector<std::string>{std::to_string(round + 1)});
        ASSERT_EQ(status(), kClean);
    }
    EXPECT_EQ(tav({"checkout", "3"}).code, 0);
    for (int i = 0; i < kFiles; ++i) {
        EXPECT_EQ(repo.read(nameOf(i)), contentOf(2, i));
    }
}

INSTANTIATE_TEST_SUITE_P(Seeds, CommitCrash, testing::Values(1U, 2U, 3U, 4U, 5U, 6U));

} // namespace
} // namespace host_tests
