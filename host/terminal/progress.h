/// A progress bar for long work.
#pragma once

#include <chrono>
#include <cstdint>
#include <string>

namespace tav {

/// Shows no progress from now on.
void hideProgress();

/// Shows the progress of an operation on the error stream, once it has taken half a second. Shows nothing if that
/// stream is not a terminal. The line is erased when the operation ends.
class Progress {
public:
    using Clock = std::chrono::steady_clock;

    /// `total` is counted in the unit of `advance`; `what` names it ("files"). `now` tells the time.
    Progress(std::string what, std::uint64_t total, Clock::time_point (*now)() = Clock::now);
    Progress(Progress const&) = delete;
    Progress& operator=(Progress const&) = delete;
    ~Progress();

    void advance(std::uint64_t count = 1);

private:
    void draw() const;

    std::string what_;
    std::uint64_t total_;
    std::uint64_t done_ = 0;
    bool enabled_;
    bool drawn_ = false;
    Clock::time_point (*now_)();
    Clock::time_point next_;
};

} // namespace tav
