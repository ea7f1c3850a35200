// Which numbers the texts of numbers become: those of the C library.
#include "tests/json/documents.h"
#include "tests/support/rows.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#include <cwchar>
#include <gtest/gtest.h>
#include <limits>
#include <random>

namespace {

using namespace documents;

std::uint64_t bitsOf(double real)
{
    std::uint64_t bits = 0;
    std::memcpy(&bits, &real, sizeof bits);
    return bits;
}

/// Expects what wcstod makes of the text, to the last bit. Tests start in the "C" locale.
void expectReal(std::wstring const& text)
{
    Value const value = read(text);
    ASSERT_EQ(value.type(), Value_type::real);
    EXPECT_EQ(bitsOf(value.get_real()), bitsOf(std::wcstod(text.c_str(), nullptr)))
        << testing::PrintToString(text.substr(0, 80)) << " of " << text.size() << " characters";
}

struct IntegerRow {
    char const* name;
    std::wstring text;
    std::uint64_t bits;
    bool is_uint64;
};

class JsonInteger : public testing::TestWithParam<IntegerRow> {};

INSTANTIATE_TEST_SUITE_P(
    Texts, JsonInteger,
    testing::Values(
        IntegerRow{"Zero", L"0", 0, true}, IntegerRow{"MinusZero", L"-0", 0, true}, IntegerRow{"Small", L"7", 7, true},
        IntegerRow{"SmallNegative", L"-7", std::uint64_t(-7), false},
        IntegerRow{"LargestSigned", L"9223372036854775807", INT64_MAX, true},
        IntegerRow{"BehindTheLargestSigned", L"9223372036854775808", std::uint64_t{1} << 63, true},
        IntegerRow{"NineteenNines", L"9999999999999999999", 9999999999999999999U, true},
        IntegerRow{"LargestUnsigned", L"18446744073709551615", UINT64_MAX, true},
        IntegerRow{"BehindTheLargestUnsigned", L"18446744073709551616", UINT64_MAX, true},
        IntegerRow{"NextTenBehindTheLargest", L"18446744073709551620", UINT64_MAX, true},
        IntegerRow{"TwentyOneDigits", L"100000000000000000000", UINT64_MAX, true},
        IntegerRow{"WrapsToASmallOne", L"18446744073709551616000000000000000000000", UINT64_MAX, true},
        IntegerRow{"SmallestSigned", L"-9223372036854775808", std::uint64_t{1} << 63, false},
        IntegerRow{"NextToTheSmallestSigned", L"-9223372036854775807", (std::uint64_t{1} << 63) + 1, false},
        IntegerRow{"BelowTheSmallestSigned", L"-9223372036854775809", std::uint64_t{1} << 63, false},
        IntegerRow{"FarBelowTheSmallestSigned", L"-99999999999999999999999", std::uint64_t{1} << 63, false}),
    support::rowName);

TEST_P(JsonInteger, IsTheNearestOfItsKind)
{
    Value const value = read(GetParam().text);
    EXPECT_EQ(value.get_uint64(), GetParam().bits);
    EXPECT_EQ(value.is_uint64(), GetParam().is_uint64);
}

TEST_P(JsonInteger, IsWhatTheCLibraryMakesOfIt)
{
    wchar_t const* const text = GetParam().text.c_str();
    std::uint64_t const number = GetParam().is_uint64 ? std::wcstoull(text, nullptr, 10)
                                                      : static_cast<std::uint64_t>(std::wcstoll(text, nullptr, 10));
    EXPECT_EQ(read(GetParam().text).get_uint64(), number);
}

struct RealRow {
    char const* name;
    std::wstring text;
};

class JsonReal : public testing::TestWithParam<RealRow> {};

std::wstring zeroes(std::size_t count)
{
    return std::wstring(count, L'0');
}

INSTANTIATE_TEST_SUITE_P(
    Texts, JsonReal,
    testing::Values(
        RealRow{"Half", L"0.5"}, RealRow{"Tenth", L"0.1"}, RealRow{"WithoutFraction", L"1."},
        RealRow{"WithoutFractionButExponent", L"1.e2"}, RealRow{"Negative", L"-2.5e-3"}, RealRow{"Zero", L"0.0"},
        RealRow{"MinusZero", L"-0.0"}, RealRow{"ZeroWithLargeExponent", L"0e999999999999999999999"},
        RealRow{"MinusZeroWithExponent", L"-0e5"}, RealRow{"SpelledOutPlus", L"1e+5"},
        RealRow{"LargestDouble", L"1.7976931348623157e308"}, RealRow{"RoundsToTheLargest", L"1.7976931348623158e308"},
        RealRow{"RoundsToInfinity", L"1.797693134862315808e308"}, RealRow{"Infinity", L"1e309"},
        RealRow{"MinusInfinity", L"-1e309"}, RealRow{"FarBeyondInfinity", L"1e999999999999999999999999"},
        RealRow{"SmallestNormal", L"2.2250738585072014e-308"}, RealRow{"Denormal", L"1e-310"},
        RealRow{"LargestDenormal", L"2.2250738585072009e-308"}, RealRow{"SmallestDenormal", L"5e-324"},
        RealRow{"RoundsToTheSmallestDenormal", L"2.4703282292062328e-324"},
        RealRow{"RoundsToZero", L"2.4703282292062327e-324"}, RealRow{"RoundsToMinusZero", L"-1e-400"},
        RealRow{"FarBelowZero", L"1e-999999999999999999999999"}, RealRow{"HalfwayDown", L"9007199254740993.0"},
        RealRow{"HalfwayUp", L"9007199254740995.0"},
        RealRow{"JustAboveHalfway", L"9007199254740993." + zeroes(1000) + L"1"},
        RealRow{"JustAboveHalfwayInDigitsThatAreCutOff", L"9007199254740993" + zeroes(1000) + L"1e-1001"},
        RealRow{"FiftyDigits", L"6631236871469758276785396630275967242439909094328385.0"}),
    support::rowName);

TEST_P(JsonReal, IsTheNearestDouble)
{
    expectReal(GetParam().text);
}

// Not rows: those are made anew for each test of this program.
TEST(JsonNumber, RealsOfAMillionDigitsBecomeTheNearestDouble)
{
    constexpr std::size_t kMillion = 1'000'000;
    expectReal(L"0." + zeroes(kMillion) + L"15e1000001");
    expectReal(L"15" + zeroes(kMillion) + L"e-1000001");
    expectReal(L"1.5" + zeroes(kMillion));
    expectReal(std::wstring(kMillion, L'7') + L".0");
    expectReal(L"0." + std::wstring(kMillion, L'7'));
    expectReal(L"1e" + zeroes(kMillion) + L"2");
    expectReal(std::wstring(kMillion, L'3') + L"e-999999");
}

TEST(JsonNumber, IntegersOfAMillionDigitsBecomeTheLargestOrSmallest)
{
    std::wstring const digits(1'000'000, L'1');
    EXPECT_EQ(read(digits), Value(UINT64_MAX));
    EXPECT_EQ(read(L"-" + digits), Value(std::numeric_limits<std::int64_t>::min()));
}

TEST(JsonNumber, RealsOutOfRangeBecomeInfinityOrZero)
{
    EXPECT_EQ(read(L"1e400").get_real(), std::numeric_limits<double>::infinity());
    EXPECT_EQ(read(L"-1e400").get_real(), -std::numeric_limits<double>::infinity());
    EXPECT_EQ(bitsOf(read(L"1e-400").get_real()), bitsOf(0.0));
    EXPECT_EQ(bitsOf(read(L"-1e-400").get_real()), bitsOf(-0.0));
    EXPECT_EQ(read(L"4.9e-324").get_real(), std::numeric_limits<double>::denorm_min());
}

TEST(JsonNumber, EveryPowerOfTenIsTheNearestDouble)
{
    for (int exponent = -345; exponent <= 320; ++exponent) {
        expectReal(L"1e" + std::to_wstring(exponent));
        expectReal(L"9.999999999999999e" + std::to_wstring(exponent));
    }
}

TEST(JsonNumber, AnyTextOfARealIsTheNearestDouble)
{
    std::mt19937 random(1);
    auto const upTo = [&](unsigned limit) { return std::uniform_int_distribution<unsigned>(0, limit)(random); };
    auto const digits = [&](unsigned count) {
        std::wstring text;
        while (count-- > 0) {
            text += static_cast<wchar_t>(L'0' + upTo(9));
        }
        return text;
    };
    for (int i = 0; i < 20'000; ++i) {
        std::wstring const sign = upTo(1) ? L"-" : L"";
        std::wstring const lead(1, static_cast<wchar_t>(L'1' + upTo(8)));
        expectReal(sign + lead + digits(upTo(25)) + L"." + digits(upTo(25)) + L"e-" + std::to_wstring(upTo(360)));
        expectReal(sign + lead + digits(upTo(25)) + L"e" + std::to_wstring(upTo(310)));
    }
}

TEST(JsonNumber, EveryPlaceWhereDigitsAreCutOffRoundsRight)
{
    // Halfway between two neighbouring doubles; no other such number has more digits than its 768.
    std::wstring const half =
        L"0.4450147717014402519147642514041536040154035526813977478576753526612026656834995141370812682920646108"
        L"4782164986440754321120225206002480547543836695927855394428741579816730655978088636997294650082209345"
        L"4616939395562405743247311393587179131470373640557744498962306030263523273266659389190686273844438061"
        L"6107575389880823487415619645161481977761103235814238004297518803831784302964163849780526625404514642"
        L"3695015437229044481924252633972472775537202836761223314045275532818152963888710721086727474559560291"
        L"8620135732098423503356981704302231953474664667838396644265370703825667756978382676143106568194200775"
        L"7987254481373453326795218299668699662689759353306938183118260379798229042249564761094682019551181352"
        L"19258317189939548603786162277173854562306587467901408672332763671875";
    for (std::size_t length = 20; length <= half.size(); length += 7) {
        expectReal(half.substr(0, length) + L"e-307");
        expectReal(half.substr(0, length) + zeroes(100) + L"1e-307");
    }
    expectReal(half + L"e-307");
    expectReal(half + zeroes(1000) + L"1e-307");
}

} // namespace
