#include "host/pictures/scaling.h"

#include <algorithm>
#include <cassert>

namespace tav {

namespace {

// The pixels of the old row or column that the pixel `at` of the new one covers, partly covered ones included.
struct Range {
    Range(std::uint32_t at, std::uint32_t oldSize, std::uint32_t newSize)
        : begin(static_cast<std::uint32_t>(std::uint64_t(at) * oldSize / newSize))
        , end(static_cast<std::uint32_t>((std::uint64_t(at + 1) * oldSize + newSize - 1) / newSize))
    {
    }

    std::uint32_t begin;
    std::uint32_t end;
};

Color average(Image const& image, Range const& columns, Range const& rows)
{
    std::array<std::uint64_t, 3> sum = {};
    std::uint64_t count = 0;
    for (std::uint32_t y = rows.begin; y < rows.end; ++y) {
        for (std::uint32_t x = columns.begin; x < columns.end; ++x) {
            ++count;
            Color const& pixel = image.row(y)[x];
            for (std::size_t i = 0; i < pixel.size(); ++i) {
                sum[i] += pixel[i];
            }
        }
    }
    assert(count != 0);
    auto const mean = [&](std::size_t i) { return static_cast<std::uint8_t>((sum[i] + count / 2) / count); };
    return {mean(0), mean(1), mean(2)};
}

Image scaled(Image const& image, std::uint32_t width, std::uint32_t height)
{
    Image result(width, height);
    for (std::uint32_t y = 0; y < height; ++y) {
        Range const rows(y, image.height(), height);
        for (std::uint32_t x = 0; x < width; ++x) {
            result.row(y)[x] = average(image, Range(x, image.width(), width), rows);
        }
    }
    return result;
}

std::uint32_t inProportion(std::uint32_t size, std::uint32_t numerator, std::uint32_t denominator)
{
    auto const result = static_cast<std::uint32_t>(std::uint64_t(size) * numerator / denominator);
    return std::max(result, 1U);
}

} // namespace

Image scaledToFit(Image image, std::uint32_t maxWidth, std::uint32_t maxHeight)
{
    std::uint32_t const width = image.width();
    std::uint32_t const height = image.height();
    if (width <= maxWidth && height <= maxHeight) {
        return image;
    }
    bool const isWide = std::uint64_t(width) * maxHeight > std::uint64_t(height) * maxWidth;
    return isWide ? scaled(image, maxWidth, inProportion(height, maxWidth, width))
                  : scaled(image, inProportion(width, maxHeight, height), maxHeight);
}

} // namespace tav
