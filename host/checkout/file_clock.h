/// The clock of a file system, by which files get their times.
#pragma once

#include <cstdint>
#include <string>

namespace tav {

/// Waits until files that are written from now on get later times than those that were written before, and returns the
/// time, in nanoseconds since 1970-01-01T00:00:00Z. Where the clock takes long it is not waited for; 0 when it cannot
/// be read. Makes the file `scratch`, which the caller removes.
std::uint64_t waitForNextTick(std::string const& scratch);

} // namespace tav
