/// Whether the tests run under the address sanitizer, which makes them ten times slower and their stacks larger.
#pragma once

namespace support {

#ifdef __SANITIZE_ADDRESS__
inline constexpr bool kIsSanitized = true;
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
inline constexpr bool kIsSanitized = true;
#else
inline constexpr bool kIsSanitized = false;
#endif
#else
inline constexpr bool kIsSanitized = false;
#endif

} // namespace support
