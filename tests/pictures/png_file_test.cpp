#include "host/pictures/png_file.h"

#include "host/pictures/picture.h"
#include "tests/pictures/drawn_image.h"
#include "tests/support/drawing_bytes.h"

#include <png.h>

namespace tav {

namespace {

constexpr std::uint64_t kManyPixels = 1U << 20U;

// A PNG of one row in a form that `encodePng` does not write.
std::string pngOf(std::vector<std::uint8_t> const& row, png_uint_32 width, png_uint_32 format)
{
    png_image png = {};
    png.version = PNG_IMAGE_VERSION;
    png.width = width;
    png.height = 1;
    png.format = format;
    std::string file(1024, '\0');
    png_alloc_size_t size = file.size();
    EXPECT_NE(png_image_write_to_memory(&png, file.data(), &size, 0, row.data(), 0, nullptr), 0);
    return file.substr(0, size);
}

TEST(PngFile, IsReadAsItWasWritten)
{
    Image const image = drawn({"r.g", "b#."});
    std::string const file = encodePng(image);
    EXPECT_EQ(file.substr(1, 3), "PNG");
    std::optional<Image> const again = decodePng(file, 6);
    ASSERT_TRUE(again.has_value());
    EXPECT_TRUE(*again == image);
}

TEST(PngFile, IsDecodedFromADrawing)
{
    std::string const drawing = support::drawingOf({{6, encodePng(drawn({"r.", "#b"}))}});
    std::optional<Image> const image = decode(preview::find(drawing));
    ASSERT_TRUE(image.has_value());
    EXPECT_TRUE(*image == drawn({"r.", "#b"}));
}

TEST(PngFile, IsWhiteWhereItIsTransparent)
{
    std::optional<Image> const image = decodePng(pngOf({255, 0, 0, 255, 0, 0, 0, 0}, 2, PNG_FORMAT_RGBA), 2);
    ASSERT_TRUE(image.has_value());
    EXPECT_TRUE(*image == drawn({"r."}));
}

TEST(PngFile, MayBeGray)
{
    std::optional<Image> const image = decodePng(pngOf({0, 255}, 2, PNG_FORMAT_GRAY), 2);
    ASSERT_TRUE(image.has_value());
    EXPECT_TRUE(*image == drawn({"#."}));
}

TEST(PngFile, IsRefusedWithMorePixelsThanAllowed)
{
    EXPECT_FALSE(decodePng(encodePng(drawn({"...", "..."})), 5).has_value());
}

TEST(PngFile, IsRefusedWhenItClaimsGigabytes)
{
    std::string file = encodePng(drawn({"."}));
    file.replace(0, 33, support::pngHeader(0x7FFF'FFFF, 0x7FFF'FFFF));
    EXPECT_FALSE(decodePng(file, kManyPixels).has_value());
}

TEST(PngFile, IsRefusedWhenCutOffAnywhere)
{
    std::string const file = encodePng(drawn({"r.g", "b#."}));
    std::size_t const endOfPixels = file.find("IEND") - 8;
    for (std::size_t length = 0; length < endOfPixels; ++length) {
        EXPECT_FALSE(decodePng(file.substr(0, length), kManyPixels).has_value()) << length;
    }
}

TEST(PngFile, IsRefusedWhenItsPixelsAreDamaged)
{
    std::string const file = encodePng(drawn({"r.g", "b#."}));
    for (std::size_t at = file.find("IDAT"); at < file.find("IEND") - 4; ++at) {
        std::string damaged = file;
        damaged[at] = static_cast<char>(damaged[at] ^ 0x20);
        EXPECT_FALSE(decodePng(damaged, kManyPixels).has_value()) << at;
    }
}

} // namespace

} // namespace tav
