#include "host/pictures/sixel.h"

#include <algorithm>
#include <set>
#include <vector>

namespace tav {

namespace {

constexpr std::uint32_t kBand = 6;
constexpr unsigned kLevels = 6; ///< of red, green and blue

unsigned levelOf(std::uint8_t part)
{
    return (part * (kLevels - 1) + 127U) / 255U;
}

unsigned numberOf(Color const& color)
{
    return (levelOf(color[0]) * kLevels + levelOf(color[1])) * kLevels + levelOf(color[2]);
}

// Parts of colors are in percent.
std::string definitionOf(unsigned number)
{
    auto const percent = [](unsigned level) { return std::to_string(level % kLevels * 100 / (kLevels - 1)); };
    return "#" + std::to_string(number) + ";2;" + percent(number / kLevels / kLevels) + ";" +
           percent(number / kLevels) + ";" + percent(number);
}

class Band {
public:
    Band(Image const& image, std::uint32_t top)
        : width_(image.width())
        , height_(std::min(kBand, image.height() - top))
        , numbers_(std::size_t(width_) * height_)
    {
        std::transform(image.row(top), image.row(top) + numbers_.size(), numbers_.begin(), numberOf);
    }

    std::set<unsigned> colors() const { return {numbers_.begin(), numbers_.end()}; }

    // The pixels of one color, from left to right.
    std::string text(unsigned color) const
    {
        std::string result = "#" + std::to_string(color);
        for (std::uint32_t x = 0; x < width_;) {
            char const sixel = sixelAt(x, color);
            std::uint32_t const begin = x;
            while (x < width_ && sixelAt(x, color) == sixel) {
                ++x;
            }
            result += repeated(sixel, x - begin);
        }
        return result;
    }

private:
    char sixelAt(std::uint32_t x, unsigned color) const
    {
        unsigned bits = 0;
        for (std::uint32_t y = 0; y < height_; ++y) {
            bits |= numbers_[std::size_t(y) * width_ + x] == color ? 1U << y : 0U;
        }
        return static_cast<char>('?' + bits);
    }

    static std::string repeated(char sixel, std::uint32_t count)
    {
        return count > 3 ? "!" + std::to_string(count) + sixel : std::string(count, sixel);
    }

    std::uint32_t width_;
    std::uint32_t height_;
    std::vector<unsigned> numbers_;
};

} // namespace

std::string sixelText(Image const& image)
{
    std::set<unsigned> defined;
    std::string definitions;
    std::string bands;
    for (std::uint32_t top = 0; top < image.height(); top += kBand) {
        Band const band(image, top);
        for (unsigned const color : band.colors()) {
            definitions += defined.insert(color).second ? definitionOf(color) : "";
            bands += band.text(color) + "$";
        }
        bands.back() = '-'; // The end of the band, in place of the way back to its begin.
    }
    return "\x1BPq\"1;1;" + std::to_string(image.width()) + ";" + std::to_string(image.height()) + definitions + bands +
           "\x1B\\";
}

} // namespace tav
