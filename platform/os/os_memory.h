/// Advice to the system about memory.
#pragma once

#include "platform/mu_platform_export.h"

#include <cstddef>

namespace os {

/// From this size on, the C library maps a block for itself alone. Advice on smaller ones may stay with parts of the
/// heap.
inline constexpr std::size_t kAlwaysMapped = std::size_t{32} << 20;

/// Asks for large pages for the whole pages of `size` bytes at `begin`, which nobody has written to yet: the first
/// touch of a page costs more than filling it. Where that is refused, pages stay small.
MU_PLATFORM_EXPORT void adviseLargePages(void* begin, std::size_t size);

} // namespace os
