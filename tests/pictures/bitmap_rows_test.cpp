// Bitmaps as drawings carry them, to the last pixel.
#include "host/pictures/picture.h"

#include "tests/pictures/drawn_image.h"
#include "tests/support/drawing_bytes.h"

namespace tav {

namespace {

using support::BitmapFields;

BitmapFields fieldsOf(std::uint32_t width, std::uint32_t height, std::uint32_t bits)
{
    BitmapFields fields;
    fields.width = width;
    fields.height = height;
    fields.bits = bits;
    return fields;
}

// `rest` is palette or masks, and rows.
std::optional<Image> decodeBitmap(BitmapFields const& fields, std::string const& rest)
{
    std::string const drawing = support::drawingOf({{2, support::bitmapHeader(fields) + rest}});
    preview::Preview const found = preview::find(drawing);
    EXPECT_STREQ(found.reason, "");
    return decode(found);
}

void expectImage(std::optional<Image> const& image, std::vector<std::string> const& rows)
{
    ASSERT_TRUE(image.has_value());
    EXPECT_TRUE(*image == drawn(rows));
}

// Entries of four bytes: blue, green, red, unused.
std::string const kBlack("\0\0\0\x7F", 4);
std::string const kWhite = "\xFF\xFF\xFF\x7F";
std::string const kRed("\0\0\xFF\x7F", 4);
std::string const kGreen("\0\xFF\0\x7F", 4);

std::string bytes(std::vector<unsigned> const& values)
{
    return {values.begin(), values.end()};
}

TEST(BitmapRows, HaveOneBitForEachPixel)
{
    expectImage(
        decodeBitmap(fieldsOf(10, 2, 1), kBlack + kWhite + bytes({0xAA, 0x40, 9, 9, 0x0F, 0x80, 9, 9})),
        {"####.....#", ".#.#.#.##."});
}

TEST(BitmapRows, HaveFourBitsForEachPixel)
{
    BitmapFields fields = fieldsOf(3, 2, 4);
    fields.colors = 4;
    expectImage(
        decodeBitmap(fields, kBlack + kWhite + kRed + kGreen + bytes({0x01, 0x2F, 9, 9, 0x32, 0x1F, 9, 9})),
        {"gr.", "#.r"});
}

TEST(BitmapRows, HaveEightBitsForEachPixel)
{
    BitmapFields fields = fieldsOf(2, 2, 8);
    fields.colors = 4;
    expectImage(decodeBitmap(fields, kBlack + kWhite + kRed + kGreen + bytes({0, 1, 9, 9, 2, 3, 9, 9})), {"rg", "#."});
}

TEST(BitmapRows, AreBlackWhereThePaletteHasNoColor)
{
    BitmapFields fields = fieldsOf(4, 1, 8);
    fields.colors = 2;
    expectImage(decodeBitmap(fields, kWhite + kRed + bytes({0, 1, 2, 255})), {".r##"});
}

TEST(BitmapRows, HaveFiveBitsForEachColorOfSixteen)
{
    expectImage(decodeBitmap(fieldsOf(4, 1, 16), bytes({0x00, 0x7C, 0xE0, 0x03, 0x1F, 0x80, 0xFF, 0xFF})), {"rgb."});
}

TEST(BitmapRows, HaveTrueColors)
{
    expectImage(decodeBitmap(fieldsOf(1, 2, 24), bytes({0xFF, 0, 0, 9, 0, 0, 0xFF, 9})), {"r", "b"});
}

TEST(BitmapRows, SkipAPaletteBeforeTrueColors)
{
    BitmapFields fields = fieldsOf(1, 1, 24);
    fields.colors = 2;
    expectImage(decodeBitmap(fields, kWhite + kWhite + bytes({0, 0xFF, 0, 9})), {"g"});
}

TEST(BitmapRows, DoNotUseTheFourthByteOfThirtyTwoBits)
{
    expectImage(decodeBitmap(fieldsOf(2, 1, 32), bytes({0, 0, 0xFF, 0, 0xFF, 0, 0, 0x80})), {"rb"});
}

TEST(BitmapRows, HaveTheirColorsWhereTheMasksSay)
{
    BitmapFields fields = fieldsOf(3, 1, 32);
    fields.compression = 3;
    std::string const masks = bytes({0xFF, 0, 0, 0, 0, 0xFF, 0, 0, 0, 0, 0xFF, 0});
    expectImage(decodeBitmap(fields, masks + bytes({0xFF, 0, 0, 0, 0, 0xFF, 0, 0, 0, 0, 0xFF, 0xFF})), {"rgb"});

    fields.bits = 16;
    std::string const shortMasks = bytes({0, 0xF8, 0, 0, 0xE0, 7, 0, 0, 0x1F, 0, 0, 0});
    expectImage(decodeBitmap(fields, shortMasks + bytes({0, 0xF8, 0xE0, 0x07, 0x1F, 0, 9, 9})), {"rgb"});
}

TEST(BitmapRows, AreBlackWithMasksOfNothing)
{
    BitmapFields fields = fieldsOf(1, 1, 32);
    fields.compression = 3;
    expectImage(decodeBitmap(fields, std::string(12, '\0') + "\xFF\xFF\xFF\xFF"), {"#"});
}

TEST(BitmapRows, HaveMasksInsideALongHeader)
{
    std::string header = support::bitmapHeader([] {
        BitmapFields fields = fieldsOf(1, 1, 32);
        fields.headerSize = 108;
        fields.compression = 3;
        return fields;
    }());
    header = support::with32(support::with32(support::with32(header, 40, 0xFF), 44, 0xFF00), 48, 0xFF'0000);
    std::string const drawing = support::drawingOf({{2, header + bytes({0xFF, 0, 0, 0})}});
    expectImage(decode(preview::find(drawing)), {"r"});
}

TEST(BitmapRows, BeginAtTheTopWhenTheHeightIsNegative)
{
    expectImage(decodeBitmap(fieldsOf(1, 0U - 2U, 24), bytes({0xFF, 0, 0, 9, 0, 0, 0xFF, 9})), {"b", "r"});
}

TEST(BitmapRows, HaveColorsOfThreeBytesAfterTheOldHeader)
{
    BitmapFields fields = fieldsOf(2, 1, 1);
    fields.headerSize = 12;
    expectImage(decodeBitmap(fields, bytes({0, 0, 0xFF, 0, 0xFF, 0, 0x40, 0, 0, 0})), {"rg"});
}

TEST(BitmapRows, AreNotReadFromRunLengths)
{
    BitmapFields fields = fieldsOf(2, 1, 8);
    fields.compression = 1;
    EXPECT_FALSE(decodeBitmap(fields, std::string(1024, '\0') + bytes({2, 1, 0, 1})).has_value());
}

TEST(Picture, IsNotDecodedFromAMetafile)
{
    std::string const drawing = support::drawingOf({{3, "a metafile"}});
    EXPECT_FALSE(decode(preview::find(drawing)).has_value());
}

} // namespace

} // namespace tav
