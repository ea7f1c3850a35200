#include "host/pictures/scaling.h"

#include "tests/pictures/drawn_image.h"

#include <algorithm>

namespace tav {

namespace {

std::string sizeOf(Image const& image)
{
    return std::to_string(image.width()) + "x" + std::to_string(image.height());
}

std::string scaledSize(std::uint32_t width, std::uint32_t height, std::uint32_t maxWidth, std::uint32_t maxHeight)
{
    return sizeOf(scaledToFit(Image(width, height), maxWidth, maxHeight));
}

TEST(Scaling, KeepsAPictureThatFits)
{
    Image const image = drawn({"r.", "#g"});
    EXPECT_TRUE(scaledToFit(image, 2, 2) == image);
    EXPECT_TRUE(scaledToFit(image, 100, 100) == image);
}

TEST(Scaling, KeepsTheProportions)
{
    EXPECT_EQ(scaledSize(400, 200, 100, 100), "100x50");
    EXPECT_EQ(scaledSize(200, 400, 100, 100), "50x100");
    EXPECT_EQ(scaledSize(100, 200, 100, 50), "25x50");
    EXPECT_EQ(scaledSize(200, 100, 400, 50), "100x50");
}

TEST(Scaling, LeavesAtLeastOnePixel)
{
    EXPECT_EQ(scaledSize(1000, 1, 10, 10), "10x1");
    EXPECT_EQ(scaledSize(1, 1000, 10, 10), "1x10");
}

TEST(Scaling, TakesTheAverageOfThePixelsCovered)
{
    Image const small = scaledToFit(drawn({"#.rr", ".#rr"}), 2, 1);
    EXPECT_TRUE(small.row(0)[0] == (Color{128, 128, 128}));
    EXPECT_TRUE(small.row(0)[1] == (Color{255, 0, 0}));
}

TEST(Scaling, TakesPixelsThatAreCoveredInPart)
{
    EXPECT_TRUE(scaledToFit(drawn({".#."}), 2, 1) == Image(2, 1, Color{128, 128, 128}));
}

TEST(Scaling, LetsNoThinLineVanish)
{
    for (std::uint32_t line = 0; line < 100; ++line) {
        Image image(100, 1, Color{255, 255, 255});
        image.row(0)[line] = {0, 0, 0};
        Image const small = scaledToFit(image, 7, 1);
        bool const isSeen = std::any_of(small.row(0), small.row(0) + 7, [](Color const& c) { return c[0] < 255; });
        EXPECT_TRUE(isSeen) << line;
    }
}

} // namespace

} // namespace tav
