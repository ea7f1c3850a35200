// What is written reads back equal.
#include "tests/json/documents.h"

#include <cstdint>
#include <gtest/gtest.h>
#include <random>

namespace {

using namespace documents;
using kutils::json::write_string;

/// Makes values of every kind at random, the same ones in each run.
class ValueMaker {
public:
    explicit ValueMaker(unsigned seed) : random_(seed) {}

    Value value(int depth)
    {
        switch (upTo(depth > 0 ? 7 : 5)) {
        case 0: return Value();
        case 1: return upTo(1) == 1;
        case 2: return static_cast<std::int64_t>(random_());
        case 3: return random_();
        case 4: return static_cast<double>(static_cast<std::int64_t>(random_() % 2'000'000) - 1'000'000) / 1024;
        case 5: return text();
        case 6: return array(depth - 1);
        default: return object(depth - 1);
        }
    }

private:
    Array array(int depth)
    {
        Array array;
        for (std::uint64_t i = upTo(5); i > 0; --i) {
            array.push_back(value(depth));
        }
        return array;
    }

    Object object(int depth)
    {
        Object object;
        for (std::uint64_t i = upTo(5); i > 0; --i) {
            object[text()] = value(depth);
        }
        return object;
    }

    std::wstring text()
    {
        std::wstring text;
        for (std::uint64_t i = upTo(10); i > 0; --i) {
            text += static_cast<wchar_t>(upTo(3) == 0 ? upTo(0xFFFF) : upTo(127));
        }
        return text;
    }

    std::uint64_t upTo(std::uint64_t limit) { return random_() % (limit + 1); }

    std::mt19937_64 random_;
};

class JsonRoundTrip : public testing::TestWithParam<bool> {};

INSTANTIATE_TEST_SUITE_P(Layouts, JsonRoundTrip, testing::Bool(), [](auto const& row) {
    return row.param ? "Pretty" : "Compact";
});

TEST_P(JsonRoundTrip, AnyValueReadsBackEqual)
{
    ValueMaker maker(1);
    for (int i = 0; i < 3'000; ++i) {
        Value const value = maker.value(4);
        std::wstring const text = write_string(value, GetParam());
        EXPECT_EQ(read(text), value);
        EXPECT_EQ(write_string(read(text), GetParam()), text);
    }
}

TEST_P(JsonRoundTrip, EveryCharacterOfTheBasicPlaneReadsBackInStringsAndKeys)
{
    std::wstring all;
    for (int c = 0; c <= 0xFFFF; ++c) {
        all += static_cast<wchar_t>(c);
    }
    Value const value = Object{{all, all}};
    EXPECT_TRUE(read(write_string(value, GetParam())) == value) << "the text is too long to show";
}

TEST_P(JsonRoundTrip, SmallSignedIntegersComeBackUnsignedAndEqual)
{
    Value const value = read(write_string(Array{5, -5}, GetParam()));
    EXPECT_EQ(value, Value(Array{5, -5}));
    EXPECT_TRUE(value.get_array()[0].is_uint64());
    EXPECT_FALSE(value.get_array()[1].is_uint64());
}

TEST_P(JsonRoundTrip, RealsKeepTheirSixteenDecimals)
{
    EXPECT_EQ(read(write_string(0.1, GetParam())), Value(0.1));
    EXPECT_EQ(read(write_string(1e-17, GetParam())), Value(0.0));
    EXPECT_EQ(read(write_string(1e300, GetParam())), Value(1e300));
    EXPECT_EQ(read(write_string(2.0, GetParam())).type(), Value_type::real);
}

} // namespace
