// The headers of bitmaps and PNGs: what is taken, where the parts are, and what is wrong with what is refused.
#include "preview/mu_preview.h"

#include "tests/support/drawing_bytes.h"
#include "tests/support/rows.h"

namespace {

using preview::Preview;
using preview::Status;
using support::BitmapFields;
using support::drawingOf;

// A drawing whose bitmap has these fields and then `rest` bytes.
std::string drawingWith(BitmapFields const& fields, std::size_t rest)
{
    return drawingOf({{2, support::bitmapHeader(fields) + std::string(rest, '\x01')}});
}

BitmapFields fieldsOf(std::uint32_t headerSize, std::uint32_t bits, std::uint32_t compression, std::uint32_t colors)
{
    BitmapFields fields;
    fields.headerSize = headerSize;
    fields.width = 5;
    fields.height = 3;
    fields.bits = bits;
    fields.compression = compression;
    fields.colors = colors;
    return fields;
}

struct Layout {
    char const* name;
    BitmapFields fields;
    std::uint32_t masks;
    std::uint32_t palette;
    std::uint32_t pixels;
    std::uint32_t bytesPerRow;
};

class BitmapLayouts : public testing::TestWithParam<Layout> {};

TEST_P(BitmapLayouts, AreKnownFromTheHeader)
{
    Layout const& row = GetParam();
    std::size_t const rest = row.pixels + 3 * (row.bytesPerRow == 0 ? 1 : row.bytesPerRow) - row.fields.headerSize;
    Preview const found = preview::find(drawingWith(row.fields, rest));
    ASSERT_STREQ(found.reason, "");
    EXPECT_EQ(found.width, 5U);
    EXPECT_EQ(found.height, 3U);
    EXPECT_EQ(found.bitmap.bitsPerPixel, row.fields.bits);
    EXPECT_EQ(found.bitmap.compression, row.fields.compression);
    EXPECT_EQ(found.bitmap.masks, row.masks);
    EXPECT_EQ(found.bitmap.palette, row.palette);
    EXPECT_EQ(found.bitmap.pixels, row.pixels);
    EXPECT_EQ(found.bitmap.bytesPerRow, row.bytesPerRow);
    EXPECT_FALSE(found.bitmap.isTopDown);
}

TEST_P(BitmapLayouts, AreRefusedWithoutTheLastByte)
{
    Layout const& row = GetParam();
    std::size_t const rest = row.pixels + 3 * row.bytesPerRow - row.fields.headerSize;
    char const* const reason =
        row.bytesPerRow == 0 ? "The bitmap ends before its pixels." : "The bitmap is shorter than its rows.";
    EXPECT_STREQ(preview::find(drawingWith(row.fields, row.bytesPerRow == 0 ? rest : rest - 1)).reason, reason);
}

INSTANTIATE_TEST_SUITE_P(
    Headers, BitmapLayouts,
    testing::Values(
        Layout{"OneBit", fieldsOf(40, 1, 0, 0), 0, 40, 48, 4}, Layout{"FourBits", fieldsOf(40, 4, 0, 0), 0, 40, 104, 4},
        Layout{"EightBits", fieldsOf(40, 8, 0, 0), 0, 40, 1064, 8},
        Layout{"EightBitsWithFewColors", fieldsOf(40, 8, 0, 7), 0, 40, 68, 8},
        Layout{"SixteenBits", fieldsOf(40, 16, 0, 0), 0, 40, 40, 12},
        Layout{"SixteenBitsWithMasks", fieldsOf(40, 16, 3, 0), 40, 52, 52, 12},
        Layout{"TrueColors", fieldsOf(40, 24, 0, 0), 0, 40, 40, 16},
        Layout{"TrueColorsWithPalette", fieldsOf(40, 24, 0, 256), 0, 40, 1064, 16},
        Layout{"ThirtyTwoBits", fieldsOf(40, 32, 0, 0), 0, 40, 40, 20},
        Layout{"ThirtyTwoBitsWithMasks", fieldsOf(40, 32, 3, 0), 40, 52, 52, 20},
        Layout{"ThirtyTwoBitsWithFourMasks", fieldsOf(40, 32, 6, 0), 40, 56, 56, 20},
        Layout{"MasksInTheHeader", fieldsOf(52, 32, 3, 0), 40, 52, 52, 20},
        Layout{"FourMasksInTheHeader", fieldsOf(56, 32, 3, 0), 40, 56, 56, 20},
        Layout{"FourthVersion", fieldsOf(108, 32, 3, 0), 40, 108, 108, 20},
        Layout{"FifthVersion", fieldsOf(124, 8, 0, 2), 0, 124, 132, 8},
        Layout{"OldHeader", fieldsOf(12, 8, 0, 0), 0, 12, 780, 8},
        Layout{"LongerOldHeader", fieldsOf(64, 24, 0, 0), 0, 64, 64, 16},
        Layout{"RunsOfBytes", fieldsOf(40, 8, 1, 0), 0, 40, 1064, 0},
        Layout{"RunsOfHalfBytes", fieldsOf(40, 4, 2, 0), 0, 40, 104, 0}),
    support::rowName);

TEST(BitmapHeader, SaysThatTheFirstRowIsTheUpperOne)
{
    BitmapFields fields = fieldsOf(40, 24, 0, 0);
    fields.height = 0U - 3U;
    Preview const found = preview::find(drawingWith(fields, 3 * 16));
    ASSERT_STREQ(found.reason, "");
    EXPECT_EQ(found.height, 3U);
    EXPECT_TRUE(found.bitmap.isTopDown);
}

struct Damage {
    char const* name;
    std::uint32_t BitmapFields::*field;
    std::uint32_t value;
    char const* reason;
};

class DamagedBitmap : public testing::TestWithParam<Damage> {};

constexpr char const* kHeader = "The bitmap has a header of unknown size.";
constexpr char const* kForm = "The bitmap has an unknown form of pixels.";
constexpr char const* kSize = "The bitmap has an impossible width or height.";
constexpr char const* kColors = "The bitmap has too many colors.";
constexpr char const* kRows = "The bitmap is shorter than its rows.";

TEST_P(DamagedBitmap, IsRefusedWithTheFieldThatIsWrong)
{
    BitmapFields fields = fieldsOf(40, 8, 0, 0);
    ASSERT_EQ(preview::find(drawingWith(fields, 2000)).status, Status::found);
    fields.*GetParam().field = GetParam().value;
    std::string bitmap = support::bitmapHeader(BitmapFields());
    bitmap.replace(0, 40, support::bitmapHeader(fields), 0, 40);
    Preview const found = preview::find(drawingOf({{2, bitmap + std::string(2000, '\x01')}}));
    EXPECT_EQ(found.status, Status::damaged);
    EXPECT_STREQ(found.reason, GetParam().reason);
}

INSTANTIATE_TEST_SUITE_P(
    Fields, DamagedBitmap,
    testing::Values(
        Damage{"HeaderTooShort", &BitmapFields::headerSize, 41, kHeader},
        Damage{"HeaderTooLong", &BitmapFields::headerSize, 125, kHeader},
        Damage{"NoWidth", &BitmapFields::width, 0, kSize},
        Damage{"NegativeWidth", &BitmapFields::width, 0U - 5U, kSize},
        Damage{"NoHeight", &BitmapFields::height, 0, kSize},
        Damage{"LowestHeight", &BitmapFields::height, 0x8000'0000, kSize},
        Damage{"WidthOfGigabytes", &BitmapFields::width, 0x7FFF'FFFF, kRows},
        Damage{"HeightOfGigabytes", &BitmapFields::height, 0x7FFF'FFFF, kRows},
        Damage{"HeightOfGigabytesUpsideDown", &BitmapFields::height, 0x8000'0001, kRows},
        Damage{"NoPlane", &BitmapFields::planes, 0, "The bitmap does not have one plane."},
        Damage{"TwoPlanes", &BitmapFields::planes, 2, "The bitmap does not have one plane."},
        Damage{"NoBits", &BitmapFields::bits, 0, kForm}, Damage{"TwoBits", &BitmapFields::bits, 2, kForm},
        Damage{"SixtyFourBits", &BitmapFields::bits, 64, kForm},
        Damage{"RunsOfOtherBits", &BitmapFields::compression, 2, kForm},
        Damage{"MasksOfOtherBits", &BitmapFields::compression, 3, kForm},
        Damage{"Jpeg", &BitmapFields::compression, 4, kForm},
        Damage{"UnknownCompression", &BitmapFields::compression, 0xFFFF'FFFF, kForm},
        Damage{"TooManyColors", &BitmapFields::colors, 257, kColors},
        Damage{"GigabytesOfColors", &BitmapFields::colors, 0x4000'0000, kColors}),
    support::rowName);

TEST(BitmapHeader, IsRefusedWithMoreColorsThanTrueColorsHaveHints)
{
    EXPECT_STREQ(preview::find(drawingWith(fieldsOf(40, 24, 0, 257), 2000)).reason, kColors);
}

TEST(BitmapHeader, IsRefusedWithRunsOfPixelsThatHaveNone)
{
    EXPECT_STREQ(preview::find(drawingWith(fieldsOf(40, 24, 1, 0), 2000)).reason, kForm);
    EXPECT_STREQ(preview::find(drawingWith(fieldsOf(40, 4, 1, 0), 2000)).reason, kForm);
}

TEST(BitmapHeader, IsRefusedWithMasksInAHeaderThatHasNone)
{
    EXPECT_STREQ(preview::find(drawingWith(fieldsOf(64, 32, 3, 0), 2000)).reason, kForm);
}

TEST(BitmapHeader, IsRefusedWithRunsUpsideDown)
{
    BitmapFields fields = fieldsOf(40, 8, 1, 0);
    fields.height = 0U - 3U;
    EXPECT_STREQ(
        preview::find(drawingWith(fields, 2000)).reason, "The bitmap has its rows of run lengths upside down.");
}

TEST(BitmapHeader, IsTooLargeWhenRunsClaimGigabytes)
{
    BitmapFields fields = fieldsOf(40, 8, 1, 0);
    fields.width = 0x7FFF'FFFF;
    fields.height = 0x7FFF'FFFF;
    EXPECT_EQ(preview::find(drawingWith(fields, 2000)).status, Status::tooLarge);
}

TEST(BitmapHeader, IsRefusedWhenCutOffAnywhere)
{
    for (std::uint32_t const size : {12U, 40U, 124U}) {
        std::string const header = support::bitmapHeader(fieldsOf(size, 24, 0, 0));
        for (std::size_t length = 1; length < header.size(); ++length) {
            Preview const found = preview::find(drawingOf({{2, header.substr(0, length)}}));
            EXPECT_STREQ(found.reason, length < 4 ? kHeader : "The bitmap ends inside its header.") << length;
        }
    }
}

TEST(PngHeader, IsRefusedWhenCutOffOrDamagedAnywhere)
{
    std::string const header = support::pngHeader(1, 1);
    ASSERT_EQ(preview::find(drawingOf({{6, header}})).status, Status::found);
    for (std::size_t length = 1; length < header.size(); ++length) {
        Preview const found = preview::find(drawingOf({{6, header.substr(0, length)}}));
        EXPECT_STREQ(found.reason, "The PNG does not begin as one.") << length;
    }
    for (std::size_t at = 0; at < 16; ++at) {
        std::string damaged = header;
        damaged[at] = static_cast<char>(damaged[at] ^ 1);
        EXPECT_STREQ(preview::find(drawingOf({{6, damaged}})).reason, "The PNG does not begin as one.") << at;
    }
}

TEST(PngHeader, IsRefusedWithAnImpossibleSize)
{
    for (auto const& [width, height] : {std::pair{0U, 1U}, {1U, 0U}, {0x8000'0000U, 1U}, {1U, 0xFFFF'FFFFU}}) {
        Preview const found = preview::find(drawingOf({{6, support::pngHeader(width, height)}}));
        EXPECT_EQ(found.status, Status::damaged);
        EXPECT_STREQ(found.reason, "The PNG has an impossible width or height.");
    }
}

} // namespace
