#include "host/terminal/progress.h"

#include "tests/host/run_tav.h"

#include <gtest/gtest.h>

#include <array>
#include <chrono>

namespace host_tests {
namespace {

using Clock = tav::Progress::Clock;

Clock::time_point time{};

Clock::time_point now()
{
    return time;
}

Setting settingOn(bool isOnTerminal)
{
    Setting setting;
    setting.isOnTerminal = isOnTerminal;
    return setting;
}

/// What a work of four files prints that takes this long for each.
Outcome printedBy(bool isOnTerminal, std::array<int, 4> const& milliseconds)
{
    Process process(settingOn(isOnTerminal), [&] {
        tav::Progress progress("files", milliseconds.size(), now);
        for (int const duration : milliseconds) {
            time += std::chrono::milliseconds(duration);
            progress.advance();
        }
        return 0;
    });
    return process.wait();
}

TEST(Progress, IsShownOnATerminalOnceTheWorkHasTakenLongAndWipedAtTheEnd)
{
    EXPECT_EQ(
        printedBy(true, {499, 1, 100, 100}).err, "\r[###############...............] 2 of 4 files"
                                                 "\r[######################........] 3 of 4 files"
                                                 "\r[##############################] 4 of 4 files"
                                                 "\r\x1b[K");
}

TEST(Progress, IsDrawnTenTimesASecondAtMost)
{
    EXPECT_EQ(
        printedBy(true, {600, 99, 1, 99}).err, "\r[#######.......................] 1 of 4 files"
                                               "\r[######################........] 3 of 4 files"
                                               "\r\x1b[K");
}

TEST(Progress, IsNotShownForShortWork)
{
    EXPECT_EQ(printedBy(true, {0, 0, 0, 499}), done(""));
}

TEST(Progress, IsNotShownElsewhere)
{
    EXPECT_EQ(printedBy(false, {0, 600, 150, 0}), done(""));
}

TEST(Progress, OfNothingIsWhole)
{
    Process process(settingOn(true), [] {
        tav::Progress progress("files", 0, now);
        time += std::chrono::milliseconds(600);
        progress.advance(0);
        return 0;
    });
    EXPECT_EQ(process.wait().err, "\r[..............................] 0 of 1 files\r\x1b[K");
}

} // namespace
} // namespace host_tests
