#include "preview/picture_headers.h"

#include <algorithm>
#include <array>

namespace preview::detail {

namespace {

constexpr std::uint32_t kMaxSide = 0x7FFF'FFFF;

enum Compression : std::uint32_t { none = 0, runs8 = 1, runs4 = 2, masks = 3, masksWithAlpha = 6 };

bool isRuns(std::uint32_t compression)
{
    return compression == runs8 || compression == runs4;
}

bool hasMasks(std::uint32_t compression)
{
    return compression == masks || compression == masksWithAlpha;
}

// What the header says, before anything follows from it.
struct BitmapHeader {
    std::uint32_t size = 0;
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    std::uint32_t planes = 0;
    std::uint32_t bits = 0;
    std::uint32_t compression = none;
    std::uint32_t colors = 0; ///< 0: as many as the bits can tell apart
    bool isTopDown = false;
};

bool isKnownHeaderSize(std::uint32_t size)
{
    constexpr std::array<std::uint32_t, 7> kSizes = {12, 40, 52, 56, 64, 108, 124};
    return std::find(kSizes.begin(), kSizes.end(), size) != kSizes.end();
}

BitmapHeader parseOldHeader(std::string_view header)
{
    BitmapHeader result;
    result.size = 12;
    result.width = littleEndian16(header, 4);
    result.height = littleEndian16(header, 6);
    result.planes = littleEndian16(header, 8);
    result.bits = littleEndian16(header, 10);
    return result;
}

BitmapHeader parseHeader(std::string_view header)
{
    BitmapHeader result;
    result.size = littleEndian32(header, 0);
    result.width = littleEndian32(header, 4);
    std::uint32_t const height = littleEndian32(header, 8);
    result.isTopDown = height > kMaxSide;
    result.height = result.isTopDown ? 0U - height : height;
    result.planes = littleEndian16(header, 12);
    result.bits = littleEndian16(header, 14);
    result.compression = littleEndian32(header, 16);
    result.colors = littleEndian32(header, 32);
    return result;
}

bool isPossible(std::uint32_t compression, std::uint32_t bits)
{
    switch (compression) {
    case none: return bits == 1 || bits == 4 || bits == 8 || bits == 16 || bits == 24 || bits == 32;
    case runs8: return bits == 8;
    case runs4: return bits == 4;
    case masks:
    case masksWithAlpha: return bits == 16 || bits == 32;
    default: return false;
    }
}

// Masks are part of the longer headers, and follow the header of 40 bytes. Other headers have none.
std::uint32_t sizeOfMasks(BitmapHeader const& header)
{
    if (header.size != 40 || !hasMasks(header.compression)) {
        return 0;
    }
    return header.compression == masksWithAlpha ? 16 : 12;
}

std::uint32_t numberOfColors(BitmapHeader const& header)
{
    return header.colors == 0 && header.bits <= 8 ? 1U << header.bits : header.colors;
}

BitmapLayout layoutOf(BitmapHeader const& header)
{
    BitmapLayout layout;
    layout.bitsPerPixel = header.bits;
    layout.compression = header.compression;
    layout.masks = hasMasks(header.compression) ? 40 : 0;
    layout.palette = header.size + sizeOfMasks(header);
    layout.colors = numberOfColors(header);
    layout.bytesPerColor = header.size == 12 ? 3 : 4;
    layout.pixels = layout.palette + layout.colors * layout.bytesPerColor;
    layout.isTopDown = header.isTopDown;
    return layout;
}

std::uint64_t bytesPerRow(BitmapHeader const& header)
{
    return (std::uint64_t(header.width) * header.bits + 31) / 32 * 4;
}

char const* checkHeader(BitmapHeader const& header)
{
    if (header.planes != 1) {
        return "The bitmap does not have one plane.";
    }
    if (!isPossible(header.compression, header.bits)) {
        return "The bitmap has an unknown form of pixels.";
    }
    if (hasMasks(header.compression) && header.size == 64) {
        return "The bitmap has an unknown form of pixels."; // Headers of this size have no masks.
    }
    if (header.isTopDown && isRuns(header.compression)) {
        return "The bitmap has its rows of run lengths upside down.";
    }
    if (header.width == 0 || header.width > kMaxSide || header.height == 0 || header.height > kMaxSide) {
        return "The bitmap has an impossible width or height.";
    }
    // For true colors a palette is only a hint for screens of 256 colors.
    return header.colors > (header.bits <= 8 ? 1U << header.bits : 256U) ? "The bitmap has too many colors." : nullptr;
}

} // namespace

char const* readBitmapHeader(std::string_view header, Preview& picture)
{
    if (header.size() < 4 || !isKnownHeaderSize(littleEndian32(header, 0))) {
        return "The bitmap has a header of unknown size.";
    }
    std::uint32_t const size = littleEndian32(header, 0);
    if (header.size() < size) {
        return "The bitmap ends inside its header.";
    }
    BitmapHeader const fields = size == 12 ? parseOldHeader(header) : parseHeader(header);
    if (char const* problem = checkHeader(fields)) {
        return problem;
    }
    picture.width = fields.width;
    picture.height = fields.height;
    picture.bitmap = layoutOf(fields);
    if (picture.bitmap.pixels >= picture.length) {
        return "The bitmap ends before its pixels.";
    }
    if (isRuns(fields.compression)) {
        return nullptr;
    }
    std::uint64_t const row = bytesPerRow(fields);
    if (row > (picture.length - picture.bitmap.pixels) / fields.height) {
        return "The bitmap is shorter than its rows.";
    }
    picture.bitmap.bytesPerRow = static_cast<std::uint32_t>(row);
    return nullptr;
}

char const* readPngHeader(std::string_view header, Preview& picture)
{
    constexpr std::string_view kBegin("\x89PNG\r\n\x1A\n\0\0\0\x0DIHDR", 16);
    constexpr std::size_t kWidthAt = 16;
    constexpr std::size_t kHeightAt = 20;
    constexpr std::size_t kSize = 33; // With the checksum of the first chunk.
    if (header.size() < kSize || header.substr(0, kBegin.size()) != kBegin) {
        return "The PNG does not begin as one.";
    }
    auto const bigEndian32 = [&](std::size_t at) {
        return byteAt(header, at) << 24U | byteAt(header, at + 1) << 16U | byteAt(header, at + 2) << 8U |
               byteAt(header, at + 3);
    };
    picture.width = bigEndian32(kWidthAt);
    picture.height = bigEndian32(kHeightAt);
    bool const isPossible = picture.width - 1 < kMaxSide && picture.height - 1 < kMaxSide;
    return isPossible ? nullptr : "The PNG has an impossible width or height.";
}

} // namespace preview::detail
