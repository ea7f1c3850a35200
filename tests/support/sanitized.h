/// Whether what is tested runs under the sanitizers, which make it ten times slower and its stack frames larger.
#pragma once

namespace support {

#ifdef MU_SANITIZED
inline constexpr bool kIsSanitized = true;
#else
inline constexpr bool kIsSanitized = false;
#endif

} // namespace support
