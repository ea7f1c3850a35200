// What `tav undo` makes of commands that the machine stopped at some moment, and of itself when it is stopped.
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

std::size_t const kStep = static_cast<std::size_t>(support::stride(11, 15));

class CrashUndo : public testing::TestWithParam<SceneRow> {
protected:
    ~CrashUndo() override { std::filesystem::current_path("/"); }

    static void prepare(Scene const& scene)
    {
        GetParam().prepare(scene);
        scene.forgetOperations();
    }

    /// What `arguments` write, on top of what there is.
    std::vector<Step> record(Arguments const& arguments, Disk const& start) const
    {
        Arguments all = {"-C", scene_.folder()};
        all.insert(all.end(), arguments.begin(), arguments.end());
        SqliteCalls const withSqlite;
        RecordedCalls const recorded(top_, start);
        EXPECT_EQ(runHere(all), 0);
        std::vector<Step> steps;
        int const lock = start.names.at("repository/.tav/tav.lock"); // What is in it does not count.
        for (Step const& step : recorded.steps()) {
            if (step.file != lock) {
                steps.push_back(step);
            }
        }
        return steps;
    }

    /// Undoes all that has been done after each crash, and finds the work as it was before the command.
    void expectUndone(Disk const& start, std::vector<Step> const& steps) const
    {
        std::size_t crashes = 0;
        for (std::size_t end = 0; end <= steps.size(); end += kStep) {
            for (Disk const& disk : disksAfterCrash(start, steps, end)) {
                std::filesystem::remove_all(top_);
                disk.write(top_);
                SCOPED_TRACE("before step " + std::to_string(end) + ", crash " + std::to_string(++crashes));
                Outcome outcome = scene_.tav({"undo"});
                while (outcome.code == 0) {
                    outcome = scene_.tav({"undo"});
                }
                EXPECT_EQ(outcome.err, "tav: There is nothing to undo. See 'tav undo --list'.\n");
                EXPECT_EQ(difference(before_, scene_.work()), "");
            }
        }
        std::cout << steps.size() << " steps, " << crashes << " crashes\n";
    }

    Scene const scene_{prepare};
    std::string const top_ = scene_.place().pathTo("now");
    std::string const before_ = scene_.work();
};

TEST_P(CrashUndo, TakesBackWhatACommandHasDone)
{
    Disk const start = Disk::read(top_);
    expectUndone(start, record(GetParam().arguments, start));
}

TEST_P(CrashUndo, CompletesWhatItHasBegun)
{
    EXPECT_EQ(scene_.tav(GetParam().arguments).code, 0);
    EXPECT_NE(difference(before_, scene_.work()), "");
    Disk const start = Disk::read(top_);
    expectUndone(start, record({"undo"}, start));
}

INSTANTIATE_TEST_SUITE_P(Commands, CrashUndo, testing::ValuesIn(undoRows()), [](auto const& row) {
    return row.param.name;
});

} // namespace
} // namespace host_tests
