// Commands that are ended by a signal at some moment.
#include "tests/host/tav_test.h"

#include <chrono>
#include <csignal>
#include <random>
#include <thread>

namespace host_tests {
namespace {

constexpr int kRounds = 50;
constexpr int kFiles = 200;

std::string nameOf(int number)
{
    return "drawing-" + std::to_string(number) + ".dwg";
}

class Interrupted : public TavTest {
protected:
    Interrupted()
    {
        for (int i = 0; i < kFiles; ++i) {
            repo.write("old/" + nameOf(i), "drawing " + std::to_string(i));
        }
    }

    using Duration = std::chrono::microseconds;

    Duration timeOf(Arguments const& arguments) const
    {
        auto const start = std::chrono::steady_clock::now();
        EXPECT_EQ(tav(arguments).code, 0);
        return std::chrono::duration_cast<Duration>(std::chrono::steady_clock::now() - start);
    }

    /// Sends SIGINT or SIGKILL at some moment of the command.
    void interrupt(Arguments const& arguments, Duration whole)
    {
        Process process(setting(), arguments);
        std::this_thread::sleep_for(Duration(std::uniform_int_distribution<long>(0, whole.count())(random_)));
        int const signal = random_() % 2 == 0 ? SIGINT : SIGKILL;
        process.send(signal);
        Outcome const outcome = process.wait();
        EXPECT_TRUE(outcome.code == 0 || outcome.code == -signal) << testing::PrintToString(outcome);
    }

    void expectWholeDrawingsIn(std::string const& folder) const
    {
        for (int i = 0; i < kFiles; ++i) {
            EXPECT_EQ(repo.read(folder + "/" + nameOf(i)), "drawing " + std::to_string(i));
        }
    }

    std::minstd_rand random_; // The same delays in every run.
};

TEST_F(Interrupted, AddStagesAllOrNothing)
{
    Duration const whole = timeOf({"add", "--all"});
    std::string const after = state();
    for (int round = 0; round < kRounds; ++round) {
        repo.write(".tav/tav.state", kFreshState);
        interrupt({"add", "--all"}, whole);
        EXPECT_TRUE(state() == kFreshState || state() == after) << state();
    }
    expectWholeDrawingsIn("old");
    EXPECT_EQ(tav({"add", "--all"}).code, 0);
    EXPECT_EQ(state(), after);
    EXPECT_EQ(repo.list().size(), std::size_t{kFiles} + 4); // No leftovers beside ".tav", its two files and "old".
}

TEST_F(Interrupted, MvLeavesEveryDrawingWholeUnderOneOfItsNames)
{
    Duration const whole = timeOf({"mv", "old", "new"});
    std::string const after = state();
    ASSERT_EQ(tav({"mv", "new", "old"}).code, 0);
    for (int round = 0; round < kRounds; ++round) {
        interrupt({"mv", "old", "new"}, whole);
        EXPECT_TRUE(state() == kFreshState || state() == after) << state();
        ASSERT_NE(repo.has("old"), repo.has("new"));
        if (repo.has("new")) {
            EXPECT_EQ(tav({"mv", "new", "old"}).code, 0);
            repo.write(".tav/tav.state", kFreshState);
        }
        expectWholeDrawingsIn("old");
    }
}

} // namespace
} // namespace host_tests
