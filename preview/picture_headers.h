/// Checks the headers of the two kinds of pictures that have a size in pixels.
#pragma once

#include "preview/mu_preview.h"

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace preview::detail {

/// The longest picture header that is read: that of version 5 bitmaps.
constexpr std::size_t kMaxHeaderSize = 124;

inline std::uint32_t byteAt(std::string_view bytes, std::size_t at)
{
    return static_cast<unsigned char>(bytes[at]);
}

inline std::uint32_t littleEndian16(std::string_view bytes, std::size_t at)
{
    return byteAt(bytes, at) | byteAt(bytes, at + 1) << 8U;
}

inline std::uint32_t littleEndian32(std::string_view bytes, std::size_t at)
{
    return littleEndian16(bytes, at) | littleEndian16(bytes, at + 2) << 16U;
}

/// Each sets the size and layout of the picture of `picture.length` bytes that begins with `header`, which has its
/// first `kMaxHeaderSize` bytes, or all of them if there are fewer. Returns null when the header is valid, else a
/// sentence that says what is wrong.
char const* readBitmapHeader(std::string_view header, Preview& picture);
char const* readPngHeader(std::string_view header, Preview& picture);

} // namespace preview::detail
