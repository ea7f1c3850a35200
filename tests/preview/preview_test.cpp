// Finding the picture in the bytes of a drawing: which one is taken, and what is wrong with those that are refused.
#include "preview/mu_preview.h"

#include "tests/support/drawing_bytes.h"
#include "tests/support/rows.h"

namespace {

using preview::Kind;
using preview::Preview;
using preview::Status;
using support::BitmapFields;
using support::drawingOf;
using support::entryAt;
using support::kCountAt;
using support::kLengthAt;
using support::kPreviewAt;
using support::with32;

std::string bitmap()
{
    return support::bitmapHeader(BitmapFields()) + std::string(256 * 4, '\x01') + std::string(8, '\x02');
}

std::string png()
{
    return support::pngHeader(320, 200) + "the chunks of the PNG";
}

std::string const kMetafile = "a metafile";
std::string const kHeader(80, '\0');

// The reason, or the kind of what was found.
std::string verdict(std::string const& drawing, preview::Limits const& limits = {})
{
    Preview const found = preview::find(drawing, limits);
    if (found.status != Status::found) {
        return found.reason;
    }
    EXPECT_STREQ(found.reason, "");
    EXPECT_EQ(found.bytes, drawing.substr(found.offset, found.length));
    constexpr char const* kNames[] = {"none", "bitmap", "png", "metafile"};
    return kNames[static_cast<int>(found.kind)];
}

TEST(Preview, GivesTheBitmapOfADrawingWithItsSize)
{
    std::string const drawing = drawingOf({{1, kHeader}, {2, bitmap()}});
    Preview const found = preview::find(drawing);
    EXPECT_EQ(found.status, Status::found);
    EXPECT_EQ(found.kind, Kind::bitmap);
    EXPECT_EQ(found.bytes, bitmap());
    EXPECT_EQ(found.offset, entryAt(2) + kHeader.size());
    EXPECT_EQ(found.length, bitmap().size());
    EXPECT_EQ(found.width, 2U);
    EXPECT_EQ(found.height, 2U);
    EXPECT_EQ(found.bitmap.pixels, 40U + 256 * 4);
}

TEST(Preview, GivesThePngOfADrawingWithItsSize)
{
    std::string const drawing = drawingOf({{1, kHeader}, {6, png()}}, "1027");
    Preview const found = preview::find(drawing);
    EXPECT_EQ(found.status, Status::found);
    EXPECT_EQ(found.kind, Kind::png);
    EXPECT_EQ(found.bytes, png());
    EXPECT_EQ(found.width, 320U);
    EXPECT_EQ(found.height, 200U);
}

TEST(Preview, GivesTheMetafileOfADrawingWithoutASize)
{
    std::string const drawing = drawingOf({{1, kHeader}, {3, kMetafile}});
    Preview const found = preview::find(drawing);
    EXPECT_EQ(found.status, Status::found);
    EXPECT_EQ(found.kind, Kind::metafile);
    EXPECT_EQ(found.bytes, kMetafile);
    EXPECT_EQ(found.width, 0U);
    EXPECT_EQ(found.height, 0U);
}

TEST(Preview, PrefersPngToBitmapAndBitmapToMetafile)
{
    EXPECT_EQ(verdict(drawingOf({{3, kMetafile}, {2, bitmap()}, {6, png()}})), "png");
    EXPECT_EQ(verdict(drawingOf({{3, kMetafile}, {2, bitmap()}})), "bitmap");
}

TEST(Preview, TakesTheNextFormWhenThePreferredOneIsDamaged)
{
    EXPECT_EQ(verdict(drawingOf({{6, "no png"}, {2, bitmap()}})), "bitmap");
    EXPECT_EQ(verdict(drawingOf({{6, "no png"}, {2, "no bitmap"}, {3, kMetafile}})), "metafile");
    EXPECT_EQ(verdict(drawingOf({{2, "no bitmap"}, {6, "no png"}})), "The PNG does not begin as one.");
}

TEST(Preview, TakesTheFirstOfTwoPicturesOfOneKind)
{
    std::string const second = support::pngHeader(9, 9) + "the second";
    EXPECT_EQ(preview::find(drawingOf({{6, png()}, {6, second}})).width, 320U);
}

TEST(Preview, PassesOverEmptyEntriesAndUnknownKinds)
{
    EXPECT_EQ(verdict(drawingOf({{6, ""}, {2, bitmap()}})), "bitmap");
    EXPECT_EQ(verdict(drawingOf({{6, ""}, {6, png()}})), "png");
    EXPECT_EQ(verdict(drawingOf({{4, "?"}, {0, "?"}, {255, "?"}, {6, png()}})), "png");
}

TEST(Preview, IsNotThereInADrawingWithNoMoreThanAHeader)
{
    for (auto const& entries : std::vector<std::vector<support::PreviewEntry>>{{}, {{1, kHeader}}, {{6, ""}}}) {
        Preview const found = preview::find(drawingOf(entries));
        EXPECT_EQ(found.status, Status::none);
        EXPECT_STREQ(found.reason, "The drawing has no preview picture.");
    }
}

TEST(Preview, IsNotThereWhenItsPlaceIsZero)
{
    EXPECT_EQ(verdict(with32(drawingOf({{6, png()}}), 13, 0)), "The drawing has no preview picture.");
}

TEST(Preview, BeginsWithVersionAC1012)
{
    for (std::string const version : {"1000", "1004", "1009", "1011"}) {
        Preview const found = preview::find(drawingOf({{6, png()}}, version));
        EXPECT_EQ(found.status, Status::none);
        EXPECT_STREQ(found.reason, "Drawings of this version have no preview picture.");
    }
    for (std::string const version : {"1012", "1014", "1018", "1024", "1032", "1099"}) {
        EXPECT_EQ(verdict(drawingOf({{6, png()}}, version)), "png") << version;
    }
}

TEST(Preview, IsNotThereInWhatIsNotADrawing)
{
    for (std::string const version : {"1.50", "10x5", "102:", "2015", " 015"}) {
        Preview const found = preview::find(drawingOf({{6, png()}}, version));
        EXPECT_EQ(found.status, Status::none) << version;
        EXPECT_STREQ(found.reason, "The bytes are not a drawing.") << version;
    }
    EXPECT_EQ(verdict(""), "The bytes are not a drawing.");
    EXPECT_EQ(verdict("AC101"), "The bytes are not a drawing.");
}

TEST(Preview, IsRefusedWhenTheDrawingIsCutOffBeforeItsEnd)
{
    for (auto const& [code, bytes] : {support::PreviewEntry{6, png()}, {2, bitmap()}, {3, kMetafile}}) {
        std::string const whole = drawingOf({{1, kHeader}, {code, bytes}});
        std::size_t const end = entryAt(2) + kHeader.size() + bytes.size();
        EXPECT_EQ(preview::find(whole.substr(0, end)).status, Status::found);
        for (std::size_t length = 0; length < end; ++length) {
            Status const expected = length < 6 ? Status::none : Status::damaged;
            EXPECT_EQ(preview::find(whole.substr(0, length)).status, expected) << "cut at " << length;
        }
    }
}

TEST(Preview, IsRefusedWithADamagedMark)
{
    for (std::size_t at = kPreviewAt; at < kLengthAt; ++at) {
        std::string drawing = drawingOf({{6, png()}});
        drawing[at] = static_cast<char>(drawing[at] ^ 1);
        EXPECT_EQ(verdict(drawing), "The preview does not begin with its mark.") << at;
    }
}

struct Damage {
    char const* name;
    std::size_t at;
    std::uint32_t value;
    char const* reason;
};

class DamagedPreview : public testing::TestWithParam<Damage> {};

constexpr char const* kOutside = "The place of the preview is not inside the drawing.";
constexpr char const* kPastEnd = "A picture ends after the end of the drawing.";
constexpr char const* kOnList = "A picture overlaps the list of pictures.";

TEST_P(DamagedPreview, IsRefusedWithTheFieldThatIsWrong)
{
    std::string const drawing = drawingOf({{1, kHeader}, {6, png()}});
    ASSERT_EQ(verdict(drawing), "png");
    Preview const found = preview::find(with32(drawing, GetParam().at, GetParam().value));
    EXPECT_EQ(found.status, Status::damaged);
    EXPECT_STREQ(found.reason, GetParam().reason);
    EXPECT_EQ(found.kind, Kind::none);
    EXPECT_TRUE(found.bytes.empty());
}

INSTANTIATE_TEST_SUITE_P(
    Fields, DamagedPreview,
    testing::Values(
        Damage{"PlaceInsideTheHead", 13, 16, kOutside}, Damage{"PlaceNearTheEnd", 13, 260, kOutside},
        Damage{"PlaceFarOutside", 13, 0xFFFF'FFFF, kOutside},
        Damage{"PlaceOfSomethingElse", 13, 0x41, "The preview does not begin with its mark."},
        Damage{"LengthOfNothing", kLengthAt, 0, "The preview is shorter than its list of pictures."},
        Damage{"LengthWithoutTheList", kLengthAt, 18, "The preview is shorter than its list of pictures."},
        Damage{"LengthOfGigabytes", kLengthAt, 0xFFFF'FFFF, "The preview ends after the end of the drawing."},
        Damage{"NumberOfEntries", kCountAt, 0xFF, "The preview is shorter than its list of pictures."},
        Damage{"PictureOfGigabytes", entryAt(1) + 5, 0xFFFF'FFFF, kPastEnd},
        Damage{"PictureFarOutside", entryAt(1) + 1, 0xFFFF'FFFF, kPastEnd},
        Damage{"PictureOneByteTooFar", entryAt(1) + 1, 0xDA + 1, kPastEnd},
        Damage{"PictureInTheHead", entryAt(1) + 1, 3, kOnList},
        Damage{"PictureOnTheMark", entryAt(1) + 1, 0x40, kOnList},
        Damage{"PictureOnTheLastEntry", entryAt(1) + 1, entryAt(2) - 1, kOnList},
        Damage{"PictureOfSomethingElse", entryAt(1) + 1, entryAt(2), "The PNG does not begin as one."},
        Damage{"PictureOfOneByte", entryAt(1) + 5, 1, "The PNG does not begin as one."}),
    support::rowName);

TEST(Preview, CanBeBeforeItsListToo)
{
    // No program is known to write it this way, but nothing in the form forbids it.
    std::string drawing = drawingOf({{3, kMetafile}});
    drawing = with32(drawing, entryAt(0) + 1, 20);
    EXPECT_EQ(verdict(drawing), "metafile");
    EXPECT_EQ(preview::find(drawing).offset, 20U);
}

TEST(Preview, IsTooLargeBeyondTheLimits)
{
    std::string const drawing = drawingOf({{6, png()}});
    auto const size = static_cast<std::uint64_t>(png().size());
    EXPECT_EQ(verdict(drawing, {64'000, size}), "png");
    EXPECT_EQ(verdict(drawing, {63'999, size}), "The picture has too many pixels.");
    EXPECT_EQ(verdict(drawing, {64'000, size - 1}), "The picture has too many bytes.");
    EXPECT_EQ(preview::find(drawing, {63'999, size}).status, Status::tooLarge);
    EXPECT_EQ(preview::find(drawing, {64'000, size - 1}).status, Status::tooLarge);
}

TEST(Preview, IsTooLargeWhenItClaimsGigabytesOfPixels)
{
    for (auto const& [width, height] :
         {std::pair{65'536U, 65'536U}, {0x7FFF'FFFFU, 1U}, {0x7FFF'FFFFU, 0x7FFF'FFFFU}}) {
        EXPECT_EQ(preview::find(drawingOf({{6, support::pngHeader(width, height)}})).status, Status::tooLarge);
    }
}

} // namespace
