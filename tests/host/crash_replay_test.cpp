// What commands leave behind when the machine stops at some moment: the process's writes up to there, less what the
// disk had not been waited for.
#include "tests/host/recorded_calls.h"
#include "tests/host/run_here.h"
#include "tests/host/scene.h"
#include "tests/host/sqlite_calls.h"
#include "tests/support/stride.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <iostream>

namespace host_tests {
namespace {

std::size_t const kStep = static_cast<std::size_t>(support::stride(3, 5));

class CrashReplay : public testing::TestWithParam<SceneRow> {
protected:
    CrashReplay()
    {
        Arguments arguments = {"-C", scene_.folder()};
        arguments.insert(arguments.end(), command_.arguments.begin(), command_.arguments.end());
        SqliteCalls const withSqlite;
        RecordedCalls const recorded(top_, start_);
        EXPECT_EQ(runHere(arguments), 0);
        int const lock = start_.names.at("repository/.tav/tav.lock"); // What is in it does not count.
        for (Step const& step : recorded.steps()) {
            if (step.file != lock) {
                steps_.push_back(step);
            }
        }
        after_ = scene_.situation();
        filesAfter_ = scene_.files();
    }

    ~CrashReplay() override { std::filesystem::current_path("/"); }

    void put(Disk const& disk) const
    {
        std::filesystem::remove_all(top_);
        disk.write(top_);
    }

    /// What cleaning removes is in nobody's way and waits for the next one.
    bool comesBack() const { return command_.arguments.front() == "gc"; }

    SceneRow const command_ = GetParam();
    Scene const scene_{command_.prepare};
    std::string const top_ = scene_.place().pathTo("now");
    Files const before_ = scene_.files();
    Disk const start_ = Disk::read(top_);
    std::vector<Step> steps_;
    Files filesAfter_;
    std::string after_;
};

TEST_P(CrashReplay, LosesNothingAndSucceedsWhenItIsRepeated)
{
    std::size_t crashes = 0;
    for (std::size_t end = 0; end <= steps_.size(); end += kStep) {
        for (Disk const& disk : disksAfterCrash(start_, steps_, end)) {
            put(disk);
            SCOPED_TRACE("before step " + std::to_string(end) + ", crash " + std::to_string(++crashes));
            EXPECT_TRUE(areOldOrNew(scene_.files(), before_, filesAfter_));
            if (end == steps_.size() && !comesBack()) { // The user has been told that it is done.
                EXPECT_EQ(difference(after_, scene_.situation()), "");
            }
            Outcome const repeated = scene_.verifyAndRepeat(command_);
            EXPECT_TRUE(isDone(repeated)) << testing::PrintToString(repeated);
            EXPECT_EQ(difference(after_, scene_.situation()), "");
        }
    }
    EXPECT_GT(crashes, 50U / kStep);
    RecordProperty("crashes", static_cast<int>(crashes));
    std::cout << steps_.size() << " steps, " << crashes << " crashes\n";
}

INSTANTIATE_TEST_SUITE_P(Commands, CrashReplay, testing::ValuesIn(sceneRows()), [](auto const& row) {
    return row.param.name;
});

INSTANTIATE_TEST_SUITE_P(History, CrashReplay, testing::ValuesIn(historyRows()), [](auto const& row) {
    return row.param.name;
});

} // namespace
} // namespace host_tests
