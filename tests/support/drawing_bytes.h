/// Drawings with preview pictures, made byte by byte.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace support {

/// `value` in as many bytes as its name says, the lowest first.
std::string littleEndian16(std::uint32_t value);
std::string littleEndian32(std::uint32_t value);

/// One picture of a preview. Its place is where `drawingOf` puts its bytes.
struct PreviewEntry {
    int code; ///< 1 header, 2 bitmap, 3 metafile, 6 PNG
    std::string bytes;
};

/// A drawing of the version "AC" plus `version`, with these pictures and some bytes after them.
std::string drawingOf(std::vector<PreviewEntry> const& entries, std::string const& version = "1015");

/// Where the parts of a drawing made by `drawingOf` are.
constexpr std::size_t kPreviewAt = 0x40;
constexpr std::size_t kLengthAt = kPreviewAt + 16;
constexpr std::size_t kCountAt = kPreviewAt + 20;
constexpr std::size_t entryAt(std::size_t index)
{
    return kPreviewAt + 21 + 9 * index;
}

/// `bytes` with `value` written over the four bytes at `at`.
std::string with32(std::string bytes, std::size_t at, std::uint32_t value);

/// The fields of a bitmap's header.
struct BitmapFields {
    std::uint32_t headerSize = 40;
    std::uint32_t width = 2;
    std::uint32_t height = 2;
    std::uint32_t planes = 1;
    std::uint32_t bits = 8;
    std::uint32_t compression = 0;
    std::uint32_t colors = 0;
};

/// A header with these fields; for 12 bytes the old form with its fields of 16 bits.
std::string bitmapHeader(BitmapFields const& fields);

/// What a PNG of this size begins with: its signature and its first chunk.
std::string pngHeader(std::uint32_t width, std::uint32_t height);

} // namespace support
