#include "host/pictures/comparison.h"

#include "tests/pictures/drawn_image.h"

#include <algorithm>

namespace tav {

namespace {

constexpr std::uint32_t kGap = 8;

// Removed, added, recolored.
std::string figuresOf(Comparison const& comparison)
{
    return std::to_string(comparison.removed) + " " + std::to_string(comparison.added) + " " +
           std::to_string(comparison.recolored);
}

Image partOf(Image const& image, std::uint32_t left, std::uint32_t width)
{
    Image part(width, image.height());
    for (std::uint32_t y = 0; y < part.height(); ++y) {
        std::copy_n(image.row(y) + left, width, part.row(y));
    }
    return part;
}

TEST(Comparison, ShowsBothVersionsAndWhatDiffers)
{
    Image const before = drawn({"......", ".#.r..", "......"});
    Image const after = drawn({"......", ".#..b.", "......"});
    Comparison const comparison = compare(before, after);
    EXPECT_EQ(figuresOf(comparison), "1 1 0");
    Image const& picture = comparison.picture;
    ASSERT_EQ(picture.width(), 3 * 6 + 2 * kGap);
    ASSERT_EQ(picture.height(), 3U);
    EXPECT_TRUE(partOf(picture, 0, 6) == before);
    EXPECT_TRUE(partOf(picture, 6 + kGap, 6) == after);
    EXPECT_TRUE(partOf(picture, 6, kGap) == Image(kGap, 3, Color{128, 128, 128}));

    Image differences(6, 3, Color{255, 255, 255});
    differences.row(1)[1] = kUnchangedColor;
    differences.row(1)[3] = kRemovedColor;
    differences.row(1)[4] = kAddedColor;
    EXPECT_TRUE(partOf(picture, 2 * (6 + kGap), 6) == differences);
}

TEST(Comparison, FindsNothingInOnePictureTwice)
{
    Image const image = drawn({".#r", "gb.", "..."});
    EXPECT_EQ(figuresOf(compare(image, image)), "0 0 0");
}

TEST(Comparison, FindsNothingWhenOnlyTheGroundIsAnother)
{
    EXPECT_EQ(figuresOf(compare(drawn({"...", ".r.", "..."}), drawn({"###", "#r#", "###"}))), "0 0 0");
}

TEST(Comparison, FindsLinesOfAnotherColor)
{
    Comparison const comparison = compare(drawn({"...", ".r.", "..."}), drawn({"...", ".b.", "..."}));
    EXPECT_EQ(figuresOf(comparison), "0 0 1");
    EXPECT_TRUE(comparison.picture.row(1)[2 * (3 + kGap) + 1] == kRecoloredColor);
}

TEST(Comparison, MakesTheLargerPictureSmaller)
{
    Image const small = drawn({"....", ".##.", ".##.", "...."});
    Image const large =
        drawn({"........", "........", "..####..", "..####..", "..####..", "..####..", "........", "........"});
    Comparison const comparison = compare(large, small);
    EXPECT_EQ(figuresOf(comparison), "0 0 0");
    EXPECT_EQ(comparison.picture.height(), 4U);
}

TEST(Comparison, SetsPicturesOfOtherProportionsIntoTheMiddle)
{
    Image const wide = drawn(std::vector<std::string>(4, "###........."));
    std::vector<std::string> rows(12, "....");
    std::fill_n(rows.begin(), 3, "####");
    Comparison const comparison = compare(wide, drawn(rows));
    EXPECT_TRUE(partOf(comparison.picture, 0, 4) == drawn({"....", "#...", "....", "...."}));
    EXPECT_TRUE(partOf(comparison.picture, 4 + kGap, 4) == drawn({".#..", "....", "....", "...."}));
}

TEST(Comparison, NeverGrowsBeyondAScreenOrThree)
{
    Comparison const comparison = compare(Image(3000, 2000), Image(3000, 2000));
    EXPECT_EQ(comparison.picture.width(), 3 * 1024 + 2 * kGap);
    EXPECT_EQ(comparison.picture.height(), 682U);
}

} // namespace

} // namespace tav
