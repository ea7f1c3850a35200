/// Memory that runs out on request. The test program that has this among its sources gets it from here.
#pragma once

#include <cstddef>
#include <functional>

namespace scarce_memory {

/// How many blocks of the calling thread are in use.
long usedBlocks();

/// Runs `operation` with memory for `limit` more blocks, and tells whether that was enough: false when it ended in
/// `std::bad_alloc`.
bool worksWithin(long limit, std::function<void()> const& operation);

/// Runs `operation` where no block may have more than `size` bytes, and tells likewise whether that was enough.
bool worksWithBlocksOf(std::size_t size, std::function<void()> const& operation);

} // namespace scarce_memory
