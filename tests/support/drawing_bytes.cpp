#include "tests/support/drawing_bytes.h"

namespace support {

namespace {

std::string bigEndian32(std::uint32_t value)
{
    std::string const little = littleEndian32(value);
    return {little.rbegin(), little.rend()};
}

} // namespace

std::string littleEndian16(std::uint32_t value)
{
    return {static_cast<char>(value & 0xFFU), static_cast<char>(value >> 8U & 0xFFU)};
}

std::string littleEndian32(std::uint32_t value)
{
    return littleEndian16(value & 0xFFFFU) + littleEndian16(value >> 16U);
}

std::string drawingOf(std::vector<PreviewEntry> const& entries, std::string const& version)
{
    std::size_t const listEnd = entryAt(entries.size());
    std::string list;
    std::string pictures;
    for (PreviewEntry const& entry : entries) {
        list += static_cast<char>(entry.code);
        list += littleEndian32(static_cast<std::uint32_t>(listEnd + pictures.size()));
        list += littleEndian32(static_cast<std::uint32_t>(entry.bytes.size()));
        pictures += entry.bytes;
    }
    std::string drawing = "AC" + version + std::string(7, '\0') + littleEndian32(kPreviewAt);
    drawing.resize(kPreviewAt, '\x55');
    drawing += std::string("\x1F\x25\x6D\x07\xD4\x36\x28\x28\x9D\x57\xCA\x3F\x9D\x44\x10\x2B", 16);
    drawing += littleEndian32(static_cast<std::uint32_t>(1 + list.size() + pictures.size()));
    drawing += static_cast<char>(entries.size());
    return drawing + list + pictures + std::string(32, '\x55');
}

std::string with32(std::string bytes, std::size_t at, std::uint32_t value)
{
    return bytes.replace(at, 4, littleEndian32(value));
}

std::string bitmapHeader(BitmapFields const& fields)
{
    if (fields.headerSize == 12) {
        return littleEndian32(12) + littleEndian16(fields.width) + littleEndian16(fields.height) +
               littleEndian16(fields.planes) + littleEndian16(fields.bits);
    }
    std::string header = littleEndian32(fields.headerSize) + littleEndian32(fields.width) +
                         littleEndian32(fields.height) + littleEndian16(fields.planes) + littleEndian16(fields.bits) +
                         littleEndian32(fields.compression) + std::string(12, '\0') + littleEndian32(fields.colors);
    header.resize(fields.headerSize);
    return header;
}

std::string pngHeader(std::uint32_t width, std::uint32_t height)
{
    return std::string("\x89PNG\r\n\x1A\n\0\0\0\x0DIHDR", 16) + bigEndian32(width) + bigEndian32(height) +
           std::string("\x08\x02\0\0\0\0\0\0\0", 9);
}

} // namespace support
