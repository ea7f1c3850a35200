/// The clock of a test.
#pragma once

#include <cstdint>

namespace server {

/// While it lives, the clock of the day stands at a moment that the test has chosen; other clocks go on. One at a time.
class TestClock {
public:
    /// Milliseconds since 1970-01-01T00:00:00Z.
    explicit TestClock(std::int64_t moment);
    TestClock(TestClock const&) = delete;
    TestClock& operator=(TestClock const&) = delete;
    /// Brings the real clock back.
    ~TestClock();

    void set(std::int64_t moment);
};

} // namespace server
