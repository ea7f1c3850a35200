#include "host/pictures/bitmap_rows.h"

#include <cassert>
#include <string_view>
#include <vector>

namespace tav {

namespace {

std::uint8_t byteAt(std::string_view bytes, std::size_t at)
{
    return static_cast<std::uint8_t>(bytes[at]);
}

std::uint32_t littleEndian(std::string_view bytes, std::size_t at, std::size_t count)
{
    std::uint32_t value = 0;
    for (std::size_t i = count; i-- > 0;) {
        value = value << 8U | byteAt(bytes, at + i);
    }
    return value;
}

Color colorAt(std::string_view bytes, std::size_t at)
{
    return {byteAt(bytes, at + 2), byteAt(bytes, at + 1), byteAt(bytes, at)};
}

// As many entries as the bits can name: those that the bitmap does not have are black.
std::vector<Color> paletteOf(preview::Preview const& bitmap)
{
    preview::BitmapLayout const& layout = bitmap.bitmap;
    std::vector<Color> palette(std::size_t(1) << layout.bitsPerPixel);
    for (std::size_t i = 0; i < layout.colors; ++i) {
        palette[i] = colorAt(bitmap.bytes, layout.palette + i * layout.bytesPerColor);
    }
    return palette;
}

class IndexedPixels {
public:
    explicit IndexedPixels(preview::Preview const& bitmap)
        : palette_(paletteOf(bitmap))
        , bits_(bitmap.bitmap.bitsPerPixel)
    {
    }

    Color operator()(std::string_view row, std::size_t x) const
    {
        std::size_t const bit = x * bits_;
        unsigned const fromRight = static_cast<unsigned>(8 - bits_ - bit % 8);
        return palette_[byteAt(row, bit / 8) >> fromRight & ((1U << bits_) - 1)];
    }

private:
    std::vector<Color> palette_;
    std::size_t bits_;
};

Color trueColor(std::string_view row, std::size_t x)
{
    return colorAt(row, x * 3);
}

class MaskedPixels {
public:
    explicit MaskedPixels(preview::Preview const& bitmap) : bytes_(bitmap.bitmap.bitsPerPixel / 8)
    {
        masks_ = bytes_ == 2 ? Masks{0x7C00, 0x03E0, 0x001F} : Masks{0xFF'0000, 0xFF00, 0xFF};
        for (std::size_t i = 0; bitmap.bitmap.masks != 0 && i < masks_.size(); ++i) {
            masks_[i] = littleEndian(bitmap.bytes, bitmap.bitmap.masks + 4 * i, 4);
        }
    }

    Color operator()(std::string_view row, std::size_t x) const
    {
        std::uint32_t const pixel = littleEndian(row, x * bytes_, bytes_);
        return {part(pixel, masks_[0]), part(pixel, masks_[1]), part(pixel, masks_[2])};
    }

private:
    using Masks = std::array<std::uint32_t, 3>;

    static std::uint8_t part(std::uint32_t pixel, std::uint32_t mask)
    {
        return mask == 0 ? std::uint8_t(0) : static_cast<std::uint8_t>(std::uint64_t(pixel & mask) * 255 / mask);
    }

    std::size_t bytes_;
    Masks masks_;
};

template <class PixelOf>
Image copy(preview::Preview const& bitmap, PixelOf const& pixelOf)
{
    Image image(bitmap.width, bitmap.height);
    for (std::uint32_t y = 0; y < bitmap.height; ++y) {
        std::size_t const begin = bitmap.bitmap.pixels + std::size_t(y) * bitmap.bitmap.bytesPerRow;
        std::string_view const row = bitmap.bytes.substr(begin, bitmap.bitmap.bytesPerRow);
        Color* const target = image.row(bitmap.bitmap.isTopDown ? y : bitmap.height - 1 - y);
        for (std::uint32_t x = 0; x < bitmap.width; ++x) {
            target[x] = pixelOf(row, x);
        }
    }
    return image;
}

} // namespace

std::optional<Image> copyRows(preview::Preview const& bitmap)
{
    assert(bitmap.kind == preview::Kind::bitmap && bitmap.bytes.size() == bitmap.length);
    if (bitmap.bitmap.bytesPerRow == 0) {
        return std::nullopt;
    }
    switch (bitmap.bitmap.bitsPerPixel) {
    case 16:
    case 32: return copy(bitmap, MaskedPixels(bitmap));
    case 24: return copy(bitmap, trueColor);
    default: return copy(bitmap, IndexedPixels(bitmap));
    }
}

} // namespace tav
