#include "platform/sdk/OdString.h"
#include "tests/support/rows.h"
#include "tests/support/utf8.h"

#include <QString>
#include <array>
#include <gmock/gmock.h>

namespace {

std::wstring charactersOf(OdString const& text)
{
    return {text.c_str(), text.getLength()};
}

std::string bytesOf(std::wstring const& characters)
{
    return OdString(characters.data(), characters.size()).ansi_str();
}

bool survives(std::string const& bytes)
{
    return support::fromUtf8(bytes).ansi_str() == bytes;
}

TEST(OdString, IsEmptyWhenMade)
{
    OdString const text;
    EXPECT_TRUE(text.isEmpty());
    EXPECT_EQ(text.getLength(), 0U);
    EXPECT_STREQ(text.c_str(), L"");
    EXPECT_EQ(text, OdString::kEmpty);
}

TEST(OdString, IsEmptyWhenMadeFromNull)
{
    EXPECT_TRUE(OdString(static_cast<wchar_t const*>(nullptr)).isEmpty());
    EXPECT_TRUE(OdString(static_cast<char const*>(nullptr), CP_UTF_8).isEmpty());
}

TEST(OdString, EndsAtTheFirstNulWithoutALength)
{
    EXPECT_EQ(charactersOf(OdString(L"ab\0c")), L"ab");
    EXPECT_EQ(charactersOf(OdString("ab\0c", CP_UTF_8)), L"ab");
}

TEST(OdString, HoldsNulsWithALength)
{
    std::wstring const expected(L"ab\0c", 4);
    EXPECT_EQ(charactersOf(OdString(L"ab\0c", 4)), expected);
    EXPECT_EQ(charactersOf(OdString("ab\0c", 4, CP_UTF_8)), expected);
    EXPECT_EQ(OdString(L"ab\0c", 4).ansi_str(), std::string("ab\0c", 4));
}

TEST(OdString, CountsCharactersNotBytes)
{
    OdString const text("\xE2\x82\xAC\xF0\x9F\x98\x80x", CP_UTF_8);
    EXPECT_EQ(text.getLength(), 3U);
    EXPECT_EQ(text.getAt(0), L'\u20AC');
    EXPECT_EQ(text.getAt(1), L'\U0001F600');
    EXPECT_EQ(text.getAt(2), L'x');
    EXPECT_EQ(text.c_str()[3], L'\0');
}

TEST(OdString, CopiesAreIndependent)
{
    OdString const original = L"plan";
    OdString copy = original;
    copy += L"s";
    EXPECT_EQ(charactersOf(original), L"plan");
    EXPECT_EQ(charactersOf(copy), L"plans");
}

TEST(OdString, PartsAreClamped)
{
    OdString const text = L"abc";
    constexpr std::size_t kHuge = static_cast<std::size_t>(-1);
    EXPECT_EQ(charactersOf(text.left(0)), L"");
    EXPECT_EQ(charactersOf(text.left(2)), L"ab");
    EXPECT_EQ(charactersOf(text.left(3)), L"abc");
    EXPECT_EQ(charactersOf(text.left(kHuge)), L"abc");
    EXPECT_EQ(charactersOf(text.right(0)), L"");
    EXPECT_EQ(charactersOf(text.right(2)), L"bc");
    EXPECT_EQ(charactersOf(text.right(kHuge)), L"abc");
    EXPECT_EQ(charactersOf(text.mid(0)), L"abc");
    EXPECT_EQ(charactersOf(text.mid(2)), L"c");
    EXPECT_EQ(charactersOf(text.mid(3)), L"");
    EXPECT_EQ(charactersOf(text.mid(kHuge)), L"");
    EXPECT_EQ(charactersOf(text.mid(1, 1)), L"b");
    EXPECT_EQ(charactersOf(text.mid(1, kHuge)), L"bc");
    EXPECT_EQ(charactersOf(text.mid(kHuge, kHuge)), L"");
}

TEST(OdString, IsOrderedByCodeUnit)
{
    std::array<OdString, 7> const ascending{L"", L"B", L"a", OdString(L"a\0", 2), L"b", L"\uFFFD", L"\U00010000"};
    for (std::size_t i = 0; i < ascending.size(); ++i) {
        for (std::size_t j = 0; j < ascending.size(); ++j) {
            OdString const& a = ascending[i];
            OdString const& b = ascending[j];
            SCOPED_TRACE(a.ansi_str() + " and " + b.ansi_str());
            EXPECT_EQ(a.compare(b) < 0, i < j);
            EXPECT_EQ(a.compare(b) == 0, i == j);
            EXPECT_EQ(a == b, i == j);
            EXPECT_EQ(a != b, i != j);
            EXPECT_EQ(a < b, i < j);
            EXPECT_EQ(a > b, i > j);
            EXPECT_EQ(a <= b, i <= j);
            EXPECT_EQ(a >= b, i >= j);
        }
    }
}

TEST(OdString, FoldsNeitherCaseNorComposedForms)
{
    EXPECT_NE(OdString(L"Plan"), OdString(L"plan"));
    EXPECT_NE(OdString(L"\u00E4"), OdString(L"a\u0308"));
}

TEST(OdString, IsJoinedFromTextsAndCharacters)
{
    OdString text = L"a";
    text += OdString(L"b");
    text += L"c";
    text += L'd';
    text += static_cast<wchar_t const*>(nullptr);
    EXPECT_EQ(charactersOf(text), L"abcd");
    EXPECT_EQ(charactersOf(text + OdString(L"e") + L"f" + L'g'), L"abcdefg");
}

TEST(OdString, CanBeJoinedToItself)
{
    OdString text = L"plan";
    text += text;
    text += text.c_str();
    EXPECT_EQ(charactersOf(text), L"planplanplanplan");
}

TEST(OdString, FormatReplacesTheText)
{
    OdString text = L"before";
    OdString const& result = text.format(L"%ls-%d-%c-%%", L"plan", 7, 'x');
    EXPECT_EQ(&result, &text);
    EXPECT_EQ(charactersOf(text), L"plan-7-x-%");
}

TEST(OdString, FormatHasNoLimitOnTheLength)
{
    std::wstring const argument(3'000'000, L'\u20AC');
    OdString text;
    text.format(L"<%ls>", argument.c_str());
    EXPECT_EQ(charactersOf(text), L"<" + argument + L">");
}

TEST(OdString, FormatTakesItsOwnTextAsAnArgument)
{
    OdString text = L"plan";
    text.format(L"%ls/%ls", text.c_str(), text.c_str());
    EXPECT_EQ(charactersOf(text), L"plan/plan");
}

TEST(OdString, FormatTakesEveryCharacter)
{
    std::wstring const argument = {L'\xDC80', L'\xDCFF', L'\xD800', L'\xFFFF', L'\x10FFFF', L'\x1'};
    OdString text;
    text.format(L"%ls", argument.c_str());
    EXPECT_EQ(charactersOf(text), argument);
}

TEST(OdString, FormatKeepsNulsThatWereFilledIn)
{
    OdString text;
    text.format(L"a%cb", 0);
    EXPECT_EQ(charactersOf(text), std::wstring(L"a\0b", 3));
}

TEST(OdString, FormatThatIsRefusedStandsAsItIs)
{
    OdString text = L"before";
    text.format(L"%2147483648d", 1); // wider than any text can be
    EXPECT_EQ(charactersOf(text), L"%2147483648d");
}

struct Reading {
    char const* name;
    std::string bytes;
    std::wstring characters;
};

void PrintTo(Reading const& row, std::ostream* out)
{
    *out << row.name;
}

class OdStringReading : public testing::TestWithParam<Reading> {};

TEST_P(OdStringReading, GivesTheseCharacters)
{
    EXPECT_EQ(charactersOf(support::fromUtf8(GetParam().bytes)), GetParam().characters);
}

TEST_P(OdStringReading, GivesTheSameCharactersAmongOthers)
{
    std::wstring const expected = L"plan \u00E4" + GetParam().characters + L" of the house";
    EXPECT_EQ(charactersOf(support::fromUtf8("plan \xC3\xA4" + GetParam().bytes + " of the house")), expected);
}

TEST_P(OdStringReading, CanBeTurnedBack)
{
    EXPECT_EQ(support::fromUtf8(GetParam().bytes).ansi_str(), GetParam().bytes);
}

INSTANTIATE_TEST_SUITE_P(
    Valid, OdStringReading,
    testing::Values(
        Reading{"Nothing", "", L""}, Reading{"Ascii", "plan.dwg", L"plan.dwg"}, Reading{"Delete", "\x7F", L"\x7F"},
        Reading{"FirstOfTwoBytes", "\xC2\x80", L"\x80"}, Reading{"LastOfTwoBytes", "\xDF\xBF", L"\x7FF"},
        Reading{"FirstOfThreeBytes", "\xE0\xA0\x80", L"\x800"},
        Reading{"BeforeTheSurrogates", "\xED\x9F\xBF", L"\xD7FF"},
        Reading{"AfterTheSurrogates", "\xEE\x80\x80", L"\xE000"},
        Reading{"LastOfThreeBytes", "\xEF\xBF\xBF", L"\xFFFF"},
        Reading{"FirstOfFourBytes", "\xF0\x90\x80\x80", L"\x10000"},
        Reading{"LastOfFourBytes", "\xF4\x8F\xBF\xBF", L"\x10FFFF"},
        Reading{"ByteOrderMark", "\xEF\xBB\xBFx", L"\xFEFFx"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    Invalid, OdStringReading,
    testing::Values(
        Reading{"StrayContinuation", "\x80", L"\xDC80"},
        Reading{"ContinuationAfterASequence", "\xC3\xA4\xA4", L"\xE4\xDCA4"},
        Reading{"OverlongOfTwoBytes", "\xC0\x80", L"\xDCC0\xDC80"},
        Reading{"OverlongLastOfTwoBytes", "\xC1\xBF", L"\xDCC1\xDCBF"},
        Reading{"OverlongOfThreeBytes", "\xE0\x9F\xBF", L"\xDCE0\xDC9F\xDCBF"},
        Reading{"OverlongOfFourBytes", "\xF0\x8F\xBF\xBF", L"\xDCF0\xDC8F\xDCBF\xDCBF"},
        Reading{"FirstSurrogate", "\xED\xA0\x80", L"\xDCED\xDCA0\xDC80"},
        Reading{"SurrogateThatWouldHoldAByte", "\xED\xB2\x80", L"\xDCED\xDCB2\xDC80"},
        Reading{"LastSurrogate", "\xED\xBF\xBF", L"\xDCED\xDCBF\xDCBF"},
        Reading{"SurrogatePair", "\xED\xA0\x80\xED\xB0\x80", L"\xDCED\xDCA0\xDC80\xDCED\xDCB0\xDC80"},
        Reading{"BeyondTheLastCharacter", "\xF4\x90\x80\x80", L"\xDCF4\xDC90\xDC80\xDC80"},
        Reading{"LeadF5", "\xF5\x80\x80\x80", L"\xDCF5\xDC80\xDC80\xDC80"},
        Reading{"FiveBytes", "\xF8\x88\x80\x80\x80", L"\xDCF8\xDC88\xDC80\xDC80\xDC80"},
        Reading{"LeadFE", "\xFE", L"\xDCFE"}, Reading{"LeadFF", "\xFF", L"\xDCFF"},
        Reading{"TruncatedAfterOneOfTwo", "\xC3", L"\xDCC3"},
        Reading{"TruncatedAfterTwoOfThree", "\xE2\x82", L"\xDCE2\xDC82"},
        Reading{"TruncatedAfterThreeOfFour", "\xF0\x9F\x98", L"\xDCF0\xDC9F\xDC98"},
        Reading{"BrokenByAscii", "\xE2\x82x", L"\xDCE2\xDC82x"},
        Reading{"BrokenByAnotherSequence", "\xE2\x82\xC3\xA4", L"\xDCE2\xDC82\xE4"},
        Reading{"BrokenByALead", "\xF0\xF0\x9F\x98\x80", L"\xDCF0\x1F600"},
        Reading{
            "Latin1",
            "Stra\xDF"
            "e",
            L"Stra\xDCDF"
            L"e"}),
    support::rowName);

TEST(OdString, EveryCharacterSurvivesTheWayToBytesAndBack)
{
    for (uint value = 0; value <= 0x10FFFF; ++value) {
        if (value >= 0xD800 && value <= 0xDFFF) {
            continue;
        }
        auto const character = static_cast<wchar_t>(value);
        std::string const bytes = bytesOf({L'a', character});
        std::array<uint, 2> const characters{'a', value};
        ASSERT_EQ(bytes, QString::fromUcs4(characters.data(), 2).toStdString()) << std::hex << value;
        ASSERT_EQ(charactersOf(support::fromUtf8(bytes)), (std::wstring{L'a', character})) << std::hex << value;
    }
}

TEST(OdString, EveryPairOfBytesSurvivesTheWayToTextAndBack)
{
    for (int first = 0; first < 256; ++first) {
        for (int second = 0; second < 256; ++second) {
            std::string const bytes{static_cast<char>(first), static_cast<char>(second)};
            ASSERT_TRUE(survives(bytes)) << std::hex << first << ' ' << second;
        }
    }
}

// The bytes on both sides of each border at which their meaning changes.
TEST(OdString, EverySequenceOfBorderBytesSurvivesTheWayToTextAndBack)
{
    std::string const borders(
        "\x00\x7F\x80\x8F\x90\x9F\xA0\xBF\xC0\xC1\xC2\xDF\xE0\xE1\xEC\xED\xEE\xEF\xF0\xF1\xF3\xF4"
        "\xF5\xFF",
        24);
    std::string bytes(4, '\0');
    for (std::size_t n = 0; n < 24U * 24 * 24 * 24; ++n) {
        std::size_t rest = n;
        for (char& byte : bytes) {
            byte = borders[rest % borders.size()];
            rest /= borders.size();
        }
        ASSERT_TRUE(survives(bytes)) << n;
    }
}

TEST(OdString, ConvertsLongTextsWhateverStandsAtTheEdgesOfItsBlocks)
{
    std::string const bytes = "\xE2\x82\xAC\xF0\x9F\x98\x80\xFF\xC3\xA4\xF0\x9F";
    std::wstring const characters = L"\x20AC\x1F600\xDCFF\xE4\xDCF0\xDC9F";
    for (std::size_t before = 0; before < 2100; ++before) {
        std::string const longBytes = std::string(before, 'a') + bytes + std::string(20, 'z');
        OdString const text = support::fromUtf8(longBytes);
        ASSERT_EQ(charactersOf(text), std::wstring(before, L'a') + characters + std::wstring(20, L'z')) << before;
        ASSERT_EQ(text.ansi_str(), longBytes) << before;
    }
}

struct Writing {
    char const* name;
    std::wstring characters;
    std::string bytes;
};

void PrintTo(Writing const& row, std::ostream* out)
{
    *out << row.name;
}

class OdStringWriting : public testing::TestWithParam<Writing> {};

TEST_P(OdStringWriting, GivesTheseBytes)
{
    EXPECT_EQ(bytesOf(GetParam().characters), GetParam().bytes);
}

INSTANTIATE_TEST_SUITE_P(
    Characters, OdStringWriting,
    testing::Values(
        Writing{"FirstHeldByte", L"\xDC80", "\x80"}, Writing{"LastHeldByte", L"\xDCFF", "\xFF"},
        Writing{"FirstSurrogate", L"\xD800", "\xED\xA0\x80"}, Writing{"LastHighSurrogate", L"\xDBFF", "\xED\xAF\xBF"},
        Writing{"FirstLowSurrogate", L"\xDC00", "\xED\xB0\x80"},
        Writing{"SurrogateBeforeTheHeldBytes", L"\xDC7F", "\xED\xB1\xBF"},
        Writing{"SurrogateAfterTheHeldBytes", L"\xDD00", "\xED\xB4\x80"},
        Writing{"LastSurrogate", L"\xDFFF", "\xED\xBF\xBF"},
        Writing{"BeyondTheLastCharacter", {static_cast<wchar_t>(0x110000)}, "\xEF\xBF\xBD"},
        Writing{"GreatestWideCharacter", {static_cast<wchar_t>(0x7FFFFFFF)}, "\xEF\xBF\xBD"},
        Writing{"NegativeWideCharacter", {static_cast<wchar_t>(-1)}, "\xEF\xBF\xBD"}),
    support::rowName);

} // namespace
