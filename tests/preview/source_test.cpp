// Drawings that are read piece by piece.
#include "preview/mu_preview.h"

#include "tests/support/drawing_bytes.h"

#include <algorithm>

namespace {

using preview::Preview;
using preview::Status;

// A drawing of gigabytes of which only the first bytes exist; notes what is read, and fails from the n-th reading on.
class LongDrawing final : public preview::Source {
public:
    LongDrawing(std::string first, std::uint64_t size) : first_(std::move(first)), size_(size) {}

    std::uint64_t size() const override { return size_; }
    bool read(std::uint64_t offset, char* bytes, std::size_t count) override
    {
        EXPECT_LE(offset + count, size_);
        bytesRead += count;
        if (++readings == failsAt) {
            return false;
        }
        std::fill_n(bytes, count, '\0');
        if (offset < first_.size()) {
            first_.copy(bytes, count, offset);
        }
        return true;
    }

    std::size_t bytesRead = 0;
    int readings = 0;
    int failsAt = 0;

private:
    std::string first_;
    std::uint64_t size_;
};

constexpr std::uint64_t kGigabytes = std::uint64_t(8) << 30U;

std::string drawing()
{
    return support::drawingOf({{1, std::string(80, '\0')}, {2, "no bitmap"}, {6, support::pngHeader(320, 200)}});
}

TEST(Source, GivesThePlaceOfThePictureAndNoBytes)
{
    LongDrawing source(drawing(), kGigabytes);
    Preview const found = preview::find(source);
    EXPECT_EQ(found.status, Status::found);
    EXPECT_EQ(found.kind, preview::Kind::png);
    EXPECT_EQ(drawing().substr(found.offset, found.length), support::pngHeader(320, 200));
    EXPECT_EQ(found.width, 320U);
    EXPECT_TRUE(found.bytes.empty());
}

TEST(Source, IsReadInFewSmallPieces)
{
    std::vector<support::PreviewEntry> entries(253, {1, ""});
    entries.push_back({6, std::string(200, '?')});
    entries.push_back({2, std::string(200, '?')});
    LongDrawing source(support::drawingOf(entries), kGigabytes);
    EXPECT_EQ(preview::find(source).status, Status::damaged);
    EXPECT_EQ(source.readings, 5);
    EXPECT_LT(source.bytesRead, 3U * 1024);
}

TEST(Source, IsReadNoFurtherAfterAFailure)
{
    LongDrawing whole(drawing(), kGigabytes);
    ASSERT_EQ(preview::find(whole).status, Status::found);
    ASSERT_EQ(whole.readings, 4);
    for (int failing = 1; failing <= whole.readings; ++failing) {
        LongDrawing source(drawing(), kGigabytes);
        source.failsAt = failing;
        Preview const found = preview::find(source);
        EXPECT_EQ(found.status, Status::unreadable);
        EXPECT_STREQ(found.reason, "The drawing could not be read.");
        EXPECT_EQ(source.readings, failing);
    }
}

TEST(Source, IsAskedForNothingOutsideTheDrawing)
{
    std::string const whole = drawing();
    for (std::size_t length = 0; length <= whole.size(); ++length) {
        LongDrawing source(whole.substr(0, length), length);
        LongDrawing const& seen = source;
        EXPECT_EQ(preview::find(source).status, preview::find(whole.substr(0, length)).status) << seen.size();
    }
}

} // namespace
