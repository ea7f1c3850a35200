// What commands leave behind when a call of the system fails, or the process dies in it, SQLite's calls included.
#include "tests/host/run_here.h"
#include "tests/host/scene.h"
#include "tests/support/failing_call.h"
#include "tests/support/stride.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <csignal>
#include <iostream>
#include <tuple>

namespace host_tests {
namespace {

using Lasts = support::FailingCall::Lasts;

constexpr int kAllCallsWorked = 77;
int const kStride = support::stride(5, 7);

struct ErrorRow {
    friend void PrintTo(ErrorRow const& row, std::ostream* stream) { *stream << row.name; }

    char const* name;
    int error;
    Lasts lasts;
    int step;      ///< from call to call; most answers do not depend on the error
    int first = 0; ///< so that not all errors come in the same calls
};

/// 'tav init' does without the list of projects.
constexpr char const* kNoList = "tav: The repository is complete, but 'tav projects' does not know it: ";

class FailingCommand : public testing::TestWithParam<std::tuple<SceneRow, ErrorRow>> {
protected:
    FailingCommand()
    {
        EXPECT_EQ(scene_.tav(command_.arguments).code, 0);
        after_ = scene_.situation();
        filesAfter_ = scene_.files();
    }

    /// Runs the command with its n-th call failing.
    Outcome fail(int n) const
    {
        return scene_.inCopy([&] {
            support::FailingCall const failing(n, error_.error, error_.lasts);
            int const code = runHere(command_.arguments);
            return failing.hasFailed() ? code : kAllCallsWorked;
        });
    }

    /// What is wrong with the way the command ended; empty when nothing is.
    std::string faultOf(Outcome const& outcome) const
    {
        if (error_.error == support::FailingCall::kKillProcess) {
            return outcome.code == -SIGKILL ? "" : "it lives";
        }
        if (outcome.code != 0) {
            return faultOfFailure(outcome);
        }
        bool const isWhole = outcome.err.empty() || outcome.err.rfind(kNoList, 0) == 0;
        return !isWhole                       ? "it complains"
               : scene_.situation() == after_ ? ""
                                              : ("not everything is done" + difference(after_, scene_.situation()));
    }

    SceneRow const command_ = std::get<0>(GetParam());
    ErrorRow const error_ = std::get<1>(GetParam());
    Scene const scene_{command_.prepare};
    Files const before_ = scene_.files();
    Files filesAfter_;
    std::string after_;
};

TEST_P(FailingCommand, LosesNothingAndSucceedsWhenItIsRepeated)
{
    int failures = 0;
    for (int n = error_.first;; n += error_.step * kStride) {
        scene_.reset();
        Outcome const outcome = fail(n);
        if (outcome.code == kAllCallsWorked) {
            break;
        }
        ++failures;
        SCOPED_TRACE("call " + std::to_string(n) + ": " + testing::PrintToString(outcome));
        EXPECT_EQ(faultOf(outcome), "");
        EXPECT_TRUE(areOldOrNew(scene_.files(), before_, filesAfter_));
        Outcome const repeated = scene_.verifyAndRepeat(command_);
        EXPECT_TRUE(isDone(repeated)) << testing::PrintToString(repeated);
        EXPECT_EQ(difference(after_, scene_.situation()), "");
    }
    EXPECT_GT(failures, 60 / error_.step / kStride);
    RecordProperty("failing calls", failures);
    std::cout << failures << " failing calls\n";
}

std::string rowName(testing::TestParamInfo<std::tuple<SceneRow, ErrorRow>> const& row)
{
    return std::string(std::get<0>(row.param).name) + std::get<1>(row.param).name;
}

INSTANTIATE_TEST_SUITE_P(
    Commands, FailingCommand,
    testing::Combine(
        testing::ValuesIn(sceneRows()),
        testing::Values(
            ErrorRow{"FullDisk", ENOSPC, Lasts::once, 1}, ErrorRow{"BrokenDisk", EIO, Lasts::once, 3, 1},
            ErrorRow{"NoRights", EACCES, Lasts::once, 3}, ErrorRow{"Signal", EINTR, Lasts::once, 3, 2},
            ErrorRow{"DiskThatStaysFull", ENOSPC, Lasts::on, 3}, ErrorRow{"DiskThatIsGone", EIO, Lasts::on, 3, 4},
            ErrorRow{"Death", support::FailingCall::kKillProcess, Lasts::once, 1, 2})),
    rowName);

INSTANTIATE_TEST_SUITE_P(
    History, FailingCommand,
    testing::Combine(
        testing::ValuesIn(historyRows()),
        testing::Values(
            ErrorRow{"FullDisk", ENOSPC, Lasts::once, 3}, ErrorRow{"DiskThatIsGone", EIO, Lasts::on, 3, 4},
            ErrorRow{"Death", support::FailingCall::kKillProcess, Lasts::once, 1, 2})),
    rowName);

/// Making a branch is not repeated by the same command, but learned by 'tav fetch'.
class FailingBranch : public testing::TestWithParam<ErrorRow> {};

TEST_P(FailingBranch, IsLearnedByFetchWhenTheServerHasMadeIt)
{
    Scene const scene([](Scene const&) {});
    std::string const local = scene.folder() + "/.tav/tav.db";
    int made = 0;
    int n = 0;
    for (;; n += kStride) {
        scene.reset();
        Outcome const outcome = scene.inCopy([&] {
            support::FailingCall const failing(n, GetParam().error, GetParam().lasts);
            int const code = runHere({"branch", "side"});
            return failing.hasFailed() ? code : kAllCallsWorked;
        });
        if (outcome.code == kAllCallsWorked) {
            break;
        }
        Outcome const fetched = scene.tav({"fetch"});
        EXPECT_EQ(fetched.code, 0) << testing::PrintToString(fetched);
        bool const isMade = fetched.out.find("Nothing") == std::string::npos;
        bool const isHere = scene.tav({"branch"}).out == "* master  (commit 2)\n  side  (commit 2)\n";
        EXPECT_TRUE(isHere || !isMade);
        if (isMade && outcome.code == 1 && outcome.err.find(local) != std::string::npos) {
            ++made;
            EXPECT_EQ(
                outcome.err.substr(outcome.err.find(". ") + 2),
                "The server has the branch; correct that and run 'tav fetch'.\n");
        }
        EXPECT_EQ(scene.tav({"verify"}).code, 0);
    }
    EXPECT_GT(n, 20);
    EXPECT_EQ(made > 0, GetParam().error == ENOSPC);
}

INSTANTIATE_TEST_SUITE_P(
    Errors, FailingBranch,
    testing::Values(
        ErrorRow{"DiskThatStaysFull", ENOSPC, Lasts::on, 1},
        ErrorRow{"Death", support::FailingCall::kKillProcess, Lasts::once, 1, 2}),
    [](auto const& row) { return std::string(row.param.name); });

} // namespace
} // namespace host_tests
