#include "host/pictures/comparison.h"

#include "host/pictures/scaling.h"

#include <algorithm>
#include <cstdlib>
#include <map>
#include <utility>

namespace tav {

namespace {

constexpr std::uint32_t kMaxSide = 1024; ///< of one of the three pictures
constexpr std::uint32_t kGap = 8;
constexpr Color kGapColor = {128, 128, 128};
constexpr Color kGroundColor = {255, 255, 255};

// Scaled pictures have paler lines, and PNGs soft edges: smaller differences are not seen.
bool isDifferent(Color const& a, Color const& b)
{
    constexpr int kVisible = 40;
    int distance = 0;
    for (std::size_t i = 0; i < a.size(); ++i) {
        distance = std::max(distance, std::abs(int(a[i]) - int(b[i])));
    }
    return distance > kVisible;
}

Color groundOf(Image const& image)
{
    std::map<Color, std::uint64_t> counts;
    for (std::uint32_t y = 0; y < image.height(); ++y) {
        std::for_each(image.row(y), image.row(y) + image.width(), [&](Color const& pixel) { ++counts[pixel]; });
    }
    auto const isRarer = [](auto const& a, auto const& b) { return a.second < b.second; };
    return std::max_element(counts.begin(), counts.end(), isRarer)->first;
}

void paste(Image const& image, Image& target, std::uint32_t left, std::uint32_t top)
{
    for (std::uint32_t y = 0; y < image.height(); ++y) {
        std::copy_n(image.row(y), image.width(), target.row(top + y) + left);
    }
}

// A picture in the middle of its ground.
struct Sheet {
    Sheet(Image const& picture, std::uint32_t width, std::uint32_t height)
        : ground(groundOf(picture))
        , image(width, height, ground)
    {
        paste(picture, image, (width - picture.width()) / 2, (height - picture.height()) / 2);
    }

    bool isDrawn(std::uint32_t x, std::uint32_t y) const { return isDifferent(image.row(y)[x], ground); }

    Color ground;
    Image image;
};

std::pair<Sheet, Sheet> sheetsOf(Image const& before, Image const& after)
{
    std::uint32_t const width = std::min({before.width(), after.width(), kMaxSide});
    std::uint32_t const height = std::min({before.height(), after.height(), kMaxSide});
    Image const a = scaledToFit(before, width, height);
    Image const b = scaledToFit(after, width, height);
    std::uint32_t const sheetWidth = std::max(a.width(), b.width());
    std::uint32_t const sheetHeight = std::max(a.height(), b.height());
    return {Sheet(a, sheetWidth, sheetHeight), Sheet(b, sheetWidth, sheetHeight)};
}

class Difference {
public:
    Difference(Sheet const& before, Sheet const& after, Comparison& figures)
        : before_(before)
        , after_(after)
        , figures_(figures)
    {
    }

    Color at(std::uint32_t x, std::uint32_t y)
    {
        bool const was = before_.isDrawn(x, y);
        bool const is = after_.isDrawn(x, y);
        if (was != is) {
            ++(was ? figures_.removed : figures_.added);
            return was ? kRemovedColor : kAddedColor;
        }
        if (!is) {
            return kGroundColor;
        }
        bool const isRecolored = isDifferent(before_.image.row(y)[x], after_.image.row(y)[x]);
        figures_.recolored += isRecolored ? 1 : 0;
        return isRecolored ? kRecoloredColor : kUnchangedColor;
    }

private:
    Sheet const& before_;
    Sheet const& after_;
    Comparison& figures_;
};

} // namespace

Comparison compare(Image const& before, Image const& after)
{
    auto const [old, current] = sheetsOf(before, after);
    std::uint32_t const width = old.image.width();
    std::uint32_t const height = old.image.height();
    Comparison result{Image(3 * width + 2 * kGap, height, kGapColor)};
    paste(old.image, result.picture, 0, 0);
    paste(current.image, result.picture, width + kGap, 0);
    Difference difference(old, current, result);
    for (std::uint32_t y = 0; y < height; ++y) {
        for (std::uint32_t x = 0; x < width; ++x) {
            result.picture.row(y)[2 * (width + kGap) + x] = difference.at(x, y);
        }
    }
    return result;
}

} // namespace tav
