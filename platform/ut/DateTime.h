/// The time stamp of a file.
#pragma once

#include <cstdint>

namespace ut {

/// A moment as file systems keep it. A plain value, unset when made.
class DateTime {
public:
    DateTime() noexcept = default;
    /// Set to `ticks`, counted as `getTicks` gives them.
    explicit DateTime(std::int64_t ticks) noexcept : ticks_(ticks) {}

    /// Nanoseconds since 1970-01-01T00:00:00Z, negative before it; 0 for an unset date.
    std::int64_t getTicks() const noexcept { return ticks_; }

private:
    std::int64_t ticks_ = 0;
};

} // namespace ut
