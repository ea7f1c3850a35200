#include "host/storage/record.h"

#include <gmock/gmock.h>

#include <functional>

namespace {

using tav::Record;

Record delta()
{
    Record record;
    record.digest.fill(0xab);
    record.base.fill(0xcd);
    record.length = 0x0102030405060708;
    record.framesLength = 0x1112131415161718;
    return record;
}

TEST(RecordHeader, HasTheBytesThatTheFormatSays)
{
    std::string const expected = std::string("\x54\x2a\x4d\x18\x60\0\0\0tavrev1\x1a", 16) +
                                 "\x08\x07\x06\x05\x04\x03\x02\x01\x18\x17\x16\x15\x14\x13\x12\x11" +
                                 std::string(32, '\xab') + std::string(32, '\xcd');
    std::string const header = tav::headerOf(delta());
    EXPECT_EQ(header.size(), tav::kHeaderLength);
    EXPECT_EQ(header.substr(0, 96), expected);
}

TEST(RecordHeader, ReadsBackAsItWasWritten)
{
    auto const record = tav::parseHeader(tav::headerOf(delta()));
    ASSERT_TRUE(record.has_value());
    EXPECT_EQ(record->digest, delta().digest);
    EXPECT_EQ(record->base, delta().base);
    EXPECT_EQ(record->length, delta().length);
    EXPECT_EQ(record->framesLength, delta().framesLength);
    EXPECT_EQ(record->segmentLog, delta().segmentLog);
    EXPECT_FALSE(record->isWhole());
}

TEST(RecordHeader, IsRefusedWithAnyBitFlippedOrAnyByteMissing)
{
    std::string const header = tav::headerOf(delta());
    for (std::size_t bit = 0; bit < 8 * header.size(); ++bit) {
        std::string flipped = header;
        flipped[bit / 8] = static_cast<char>(flipped[bit / 8] ^ (1 << bit % 8));
        EXPECT_FALSE(tav::parseHeader(flipped).has_value()) << "bit " << bit;
    }
    for (std::size_t length = 0; length < header.size(); ++length) {
        EXPECT_FALSE(tav::parseHeader(header.substr(0, length)).has_value()) << "length " << length;
    }
    EXPECT_FALSE(tav::parseHeader(header + "x").has_value());
}

TEST(RecordHeader, IsRefusedWithNumbersThatCannotBeTrue)
{
    auto const isRefused = [](std::function<void(Record&)> const& change) {
        Record record = delta();
        change(record);
        return !tav::parseHeader(tav::headerOf(record)).has_value();
    };
    EXPECT_TRUE(isRefused([](Record& record) { record.segmentLog = 11; }));
    EXPECT_FALSE(isRefused([](Record& record) { record.segmentLog = 12; }));
    EXPECT_TRUE(isRefused([](Record& record) { record.segmentLog = 27; }));
    EXPECT_TRUE(isRefused([](Record& record) { record.length = 0; }));
    EXPECT_TRUE(isRefused([](Record& record) { record.framesLength = 0; }));
    EXPECT_TRUE(isRefused([](Record& record) { record.length = record.framesLength = 0; }));
}

TEST(DigestFromHex, TakesLowerCaseDigitsOnly)
{
    std::string const hex = "0123456789abcdeffedcba98765432100123456789abcdeffedcba9876543210";
    ASSERT_TRUE(tav::digestFromHex(hex).has_value());
    EXPECT_EQ(tav::hexOf(*tav::digestFromHex(hex)), hex);
    EXPECT_FALSE(tav::digestFromHex(hex.substr(1)).has_value());
    EXPECT_FALSE(tav::digestFromHex(hex + "a").has_value());
    for (std::size_t place = 0; place < hex.size(); ++place) {
        for (char const c : {'A', 'g', '/', ':', '\0', '\xff'}) {
            std::string other = hex;
            other[place] = c;
            EXPECT_FALSE(tav::digestFromHex(other).has_value()) << other;
        }
    }
}

} // namespace
