#include "host/cli/progress.h"

#include "tests/host/run_tav.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdio>
#include <thread>

namespace host_tests {
namespace {

void pause(int milliseconds)
{
    std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
}

/// What a work of four files prints that takes some time for each.
Outcome printedBy(bool isOnTerminal, int millisecondsForEach)
{
    Setting setting;
    setting.isOnTerminal = isOnTerminal;
    Process process(setting, [=] {
        tav::Progress progress("files", 4);
        for (int i = 0; i < 4; ++i) {
            pause(millisecondsForEach);
            progress.advance();
        }
        return 0;
    });
    return process.wait();
}

TEST(Progress, IsShownOnATerminalOnceTheWorkHasTakenLongAndWipedAtTheEnd)
{
    std::string const drawn = printedBy(true, 300).err;
    EXPECT_EQ(
        drawn, "\r[###############...............] 2 of 4 files"
               "\r[######################........] 3 of 4 files"
               "\r[##############################] 4 of 4 files"
               "\r\x1b[K");
}

TEST(Progress, IsNotShownForShortWork)
{
    EXPECT_EQ(printedBy(true, 0), done(""));
}

TEST(Progress, IsNotShownElsewhere)
{
    EXPECT_EQ(printedBy(false, 200), done(""));
}

TEST(Progress, OfNothingIsWhole)
{
    Setting setting;
    setting.isOnTerminal = true;
    Process process(setting, [] {
        tav::Progress progress("files", 0);
        pause(600);
        progress.advance(0);
        return 0;
    });
    EXPECT_EQ(process.wait().err, "\r[..............................] 0 of 1 files\r\x1b[K");
}

} // namespace
} // namespace host_tests
