/// Pixels.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace tav {

/// Red, green and blue.
using Color = std::array<std::uint8_t, 3>;

/// A picture as rows of pixels, the upper row first.
class Image {
public:
    /// All of one color. At least one pixel wide and high.
    Image(std::uint32_t width, std::uint32_t height, Color color = {})
        : width_(width)
        , height_(height)
        , pixels_(std::size_t(width) * height, color)
    {
    }

    std::uint32_t width() const { return width_; }
    std::uint32_t height() const { return height_; }
    Color* row(std::uint32_t y) { return pixels_.data() + std::size_t(y) * width_; }
    Color const* row(std::uint32_t y) const { return pixels_.data() + std::size_t(y) * width_; }

    /// All pixels, three bytes for each.
    std::uint8_t* bytes() { return pixels_.data()->data(); }
    std::uint8_t const* bytes() const { return pixels_.data()->data(); }

    bool operator==(Image const& other) const { return width_ == other.width_ && pixels_ == other.pixels_; }

private:
    static_assert(sizeof(Color) == 3, "Pixels follow each other without gaps, as PNGs and bitmaps have them.");

    std::uint32_t width_;
    std::uint32_t height_;
    std::vector<Color> pixels_;
};

} // namespace tav
