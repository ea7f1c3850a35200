#include "tests/server/test_clock.h"

#include <ctime>
#include <sys/syscall.h>
#include <unistd.h>

namespace {

bool isSet = false;
std::int64_t now = 0;

} // namespace

// Stands before the C library's in the order in which the program's symbols are looked up, so it must be in sight.
extern "C" [[gnu::visibility("default")]] int clock_gettime(clockid_t clock, timespec* time) noexcept
{
    if (!isSet || clock != CLOCK_REALTIME) {
        return static_cast<int>(syscall(SYS_clock_gettime, clock, time));
    }
    std::int64_t const msecs = (now % 1000 + 1000) % 1000;
    time->tv_sec = (now - msecs) / 1000;
    time->tv_nsec = msecs * 1'000'000;
    return 0;
}

namespace server {

TestClock::TestClock(std::int64_t moment)
{
    set(moment);
}

TestClock::~TestClock()
{
    isSet = false;
}

void TestClock::set(std::int64_t moment)
{
    now = moment;
    isSet = true;
}

} // namespace server
