#include "host/progress.h"

#include "tests/host/run_tav.h"

#include <gtest/gtest.h>

#include <array>
#include <chrono>
#include <thread>

namespace host_tests {
namespace {

void pause(int milliseconds)
{
    std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
}

/// What a work of four files prints that takes this long for each.
Outcome printedBy(bool isOnTerminal, std::array<int, 4> const& milliseconds)
{
    Setting setting;
    setting.isOnTerminal = isOnTerminal;
    Process process(setting, [&] {
        tav::Progress progress("files", milliseconds.size());
        for (int const duration : milliseconds) {
            pause(duration);
            progress.advance();
        }
        return 0;
    });
    return process.wait();
}

TEST(Progress, IsShownOnATerminalOnceTheWorkHasTakenLongAndWipedAtTheEnd)
{
    EXPECT_EQ(
        printedBy(true, {0, 600, 150, 150}).err, "\r[###############...............] 2 of 4 files"
                                                 "\r[######################........] 3 of 4 files"
                                                 "\r[##############################] 4 of 4 files"
                                                 "\r\x1b[K");
}

TEST(Progress, IsNotShownForShortWork)
{
    EXPECT_EQ(printedBy(true, {0, 0, 0, 0}), done(""));
}

TEST(Progress, IsNotShownElsewhere)
{
    EXPECT_EQ(printedBy(false, {0, 600, 150, 0}), done(""));
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
