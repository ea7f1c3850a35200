/// Advice to the system about memory.
#pragma once

#include "platform/mu_platform_export.h"

#include <cstddef>

namespace os {

/// From this size on, the C library maps each block separately. Advice on smaller blocks may stick to parts of the
/// heap.
inline constexpr std::size_t kAlwaysMapped = std::size_t{32} << 20;

/// Asks for large pages for the whole pages of `size` bytes at `begin`, which must not have been written to yet: the
/// first access to a page costs more than filling it. If the system refuses, pages stay small.
MU_PLATFORM_EXPORT void adviseLargePages(void* begin, std::size_t size);

} // namespace os
