// How text is cut into tokens.
#include "tests/json/documents.h"
#include "tests/support/rows.h"
#include "json/json_parser.h"

#include <cstdint>
#include <cstring>
#include <gtest/gtest.h>
#include <sstream>

namespace {

using namespace documents;
using kutils::json::detail::Token_kind;
using Scanner = kutils::json::detail::Scanner<std::wstring, wchar_t const*>;
using Token = kutils::json::detail::Token<std::wstring>;

std::string nameOf(Token_kind kind)
{
    static char const* const names[] = {"[",     "]",      "{",        "}",    ":",      ",",   "null",   "true",
                                        "false", "signed", "unsigned", "real", "string", "end", "invalid"};
    return names[static_cast<int>(kind)];
}

std::string show(Token const& token)
{
    std::ostringstream shown;
    shown << nameOf(token.kind);
    if (token.kind == Token_kind::signed_integer) {
        shown << ' ' << static_cast<std::int64_t>(token.number);
    } else if (token.kind == Token_kind::unsigned_integer) {
        shown << ' ' << token.number;
    } else if (token.kind == Token_kind::real) {
        double real = 0;
        std::memcpy(&real, &token.number, sizeof real);
        shown << ' ' << real;
    } else if (token.kind == Token_kind::string) {
        shown << " <" << OdString(token.text.data(), token.text.size()).ansi_str() << '>';
    }
    return shown.str();
}

/// All tokens of a text up to the first that ends it or is invalid.
std::string tokensOf(std::wstring const& text)
{
    Scanner scanner(text.data(), text.data() + text.size());
    std::string all;
    for (;;) {
        Token const& token = scanner.nextToken();
        all += (all.empty() ? "" : "; ") + show(token);
        if (token.kind >= Token_kind::end) {
            return all;
        }
    }
}

TEST(JsonScanner, KindsHaveTheirNumbers)
{
    EXPECT_EQ(static_cast<int>(Token_kind::open_array), 0);
    EXPECT_EQ(static_cast<int>(Token_kind::close_array), 1);
    EXPECT_EQ(static_cast<int>(Token_kind::open_object), 2);
    EXPECT_EQ(static_cast<int>(Token_kind::close_object), 3);
    EXPECT_EQ(static_cast<int>(Token_kind::colon), 4);
    EXPECT_EQ(static_cast<int>(Token_kind::comma), 5);
    EXPECT_EQ(static_cast<int>(Token_kind::null_value), 6);
    EXPECT_EQ(static_cast<int>(Token_kind::true_value), 7);
    EXPECT_EQ(static_cast<int>(Token_kind::false_value), 8);
    EXPECT_EQ(static_cast<int>(Token_kind::signed_integer), 9);
    EXPECT_EQ(static_cast<int>(Token_kind::unsigned_integer), 10);
    EXPECT_EQ(static_cast<int>(Token_kind::real), 11);
    EXPECT_EQ(static_cast<int>(Token_kind::string), 12);
    EXPECT_EQ(static_cast<int>(Token_kind::end), 13);
    EXPECT_EQ(static_cast<int>(Token_kind::invalid), 14);
}

TEST(JsonScanner, TokenIsTheEndBeforeTheFirstIsRead)
{
    EXPECT_EQ(Token().kind, Token_kind::end);
}

struct Row {
    char const* name;
    std::wstring text;
    char const* tokens;
};

class JsonScannerOn : public testing::TestWithParam<Row> {};

TEST_P(JsonScannerOn, CutsTheTextIntoTokens)
{
    EXPECT_EQ(tokensOf(GetParam().text), GetParam().tokens);
}

std::wstring withNul(wchar_t const* before, wchar_t const* after)
{
    return std::wstring(before) + L'\0' + after;
}

INSTANTIATE_TEST_SUITE_P(
    Tokens, JsonScannerOn,
    testing::Values(
        Row{"Nothing", L"", "end"}, Row{"Blanks", L"\t\n\v\f\r ", "end"}, Row{"Brackets", L"[]{}", "[; ]; {; }; end"},
        Row{"ColonAndComma", L":,", ":; ,; end"}, Row{"Null", L"null", "null; end"}, Row{"True", L"true", "true; end"},
        Row{"False", L"false", "false; end"}, Row{"String", L"\"plan\"", "string <plan>; end"},
        Row{"Negative", L"-7", "signed -7; end"}, Row{"Positive", L"7", "unsigned 7; end"},
        Row{"Real", L"2.5", "real 2.5; end"}, Row{"BlanksBetween", L" \t[\n\v\f\r 1 , ", "[; unsigned 1; ,; end"},
        Row{"KeywordsWithoutDelimiter", L"truefalsenull1", "true; false; null; unsigned 1; end"},
        Row{"LetterBehindKeyword", L"truex", "true; invalid"}, Row{"WrongLetter", L"nall", "invalid"},
        Row{"WrongLastLetter", L"falsx", "invalid"}, Row{"MissingLetters", L"tru", "invalid"},
        Row{"CapitalLetter", L"True", "invalid"}, Row{"NulInsideKeyword", withNul(L"tr", L"ue"), "invalid"},
        Row{"OtherWord", L"plan", "invalid"}, Row{"Plus", L"+1", "invalid"}, Row{"Point", L".5", "invalid"},
        Row{"Apostrophe", L"'a'", "invalid"}, Row{"CharacterAboveTheBrace", L"~", "invalid"},
        Row{"Delete", L"\x7F", "invalid"}, Row{"NonAscii", L"\x00E4", "invalid"},
        Row{"NoBreakSpace", L"\x00A0", "invalid"}, Row{"NextLine", L"\x0085", "invalid"},
        Row{"LineSeparator", L"\x2028", "invalid"}, Row{"ByteOrderMark", L"\xFEFF[]", "invalid"},
        Row{"BeyondTheBasicPlane", L"\x1F600", "invalid"}, Row{"NulFirst", withNul(L"", L"1"), "end"},
        Row{"NulBehindABlank", withNul(L"[ ", L"1"), "[; end"},
        Row{"NulBehindAKeyword", withNul(L"true", L"1"), "true; end"},
        Row{"NulBehindAString", withNul(L"\"a\"", L"1"), "string <a>; end"}),
    support::rowName);

TEST(JsonScanner, RefusesEveryOtherControlCharacter)
{
    for (wchar_t c = 1; c < 32; ++c) {
        bool const isBlank = c >= 9 && c <= 13;
        EXPECT_EQ(tokensOf(std::wstring(1, c)), isBlank ? "end" : "invalid") << "character " << static_cast<int>(c);
    }
}

TEST(JsonScanner, RefusesEveryOtherPrintableCharacter)
{
    std::wstring const starters = L" [{}]:,\"-0123456789";
    for (wchar_t c = 32; c < 127; ++c) {
        if (starters.find(c) == std::wstring::npos) {
            EXPECT_EQ(tokensOf(std::wstring(1, c)), "invalid") << "character " << static_cast<int>(c);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(
    Strings, JsonScannerOn,
    testing::Values(
        Row{"Empty", L"\"\"", "string <>; end"}, Row{"EscapedQuote", LR"("\"")", "string <\">; end"},
        Row{"EscapedBackslash", LR"("\\")", "string <\\>; end"}, Row{"EscapedSlash", LR"("\/")", "string </>; end"},
        Row{"Backspace", LR"("\b")", "string <\b>; end"}, Row{"FormFeed", LR"("\f")", "string <\f>; end"},
        Row{"LineFeed", LR"("\n")", "string <\n>; end"}, Row{"CarriageReturn", LR"("\r")", "string <\r>; end"},
        Row{"Tab", LR"("\t")", "string <\t>; end"}, Row{"LowerCaseHex", LR"("\u00e9")", "string <\xC3\xA9>; end"},
        Row{"UpperCaseHex", LR"("\u00E9")", "string <\xC3\xA9>; end"},
        Row{"AllHexDigits", LR"("\u0123\u4567\u89aB\uCdEf")",
            "string <\xC4\xA3\xE4\x95\xA7\xE8\xA6\xAB\xEC\xB7\xAF>; end"},
        Row{"FiveHexDigits", LR"("\u00411")", "string <A1>; end"},
        Row{"EscapesBetweenText", LR"("a\tb\\c\u0064")", "string <a\tb\\cd>; end"},
        Row{"ControlCharacters", L"\"\x01\n\t\"", "string <\x01\n\t>; end"},
        Row{"NonAsciiText", L"\"\x00E4\x1F600\"", "string <\xC3\xA4\xF0\x9F\x98\x80>; end"},
        Row{"BlanksInside", L"\" a \"", "string < a >; end"}, Row{"BracketsInside", L"\"[{,\"", "string <[{,>; end"},
        Row{"TwoStrings", L"\"a\"\"b\"", "string <a>; string <b>; end"}, Row{"UnknownEscape", LR"("\x")", "invalid"},
        Row{"UpperCaseEscape", LR"("\N")", "invalid"}, Row{"EscapedApostrophe", LR"("\'")", "invalid"},
        Row{"EscapedDigit", LR"("\0")", "invalid"}, Row{"EscapedNul", withNul(L"\"\\", L"\""), "invalid"},
        Row{"HexDigitTooHigh", LR"("\u00g0")", "invalid"}, Row{"HexBelowZeroDigit", LR"("\u00/0")", "invalid"},
        Row{"HexBehindNine", LR"("\u00:0")", "invalid"}, Row{"HexBeforeUpperA", LR"("\u00@0")", "invalid"},
        Row{"HexBeforeLowerA", LR"("\u00`0")", "invalid"},
        Row{"HexDigitsOfOtherScripts", L"\"\\u000\x0661\"", "invalid"},
        Row{"TooFewHexDigits", LR"("\u00e")", "invalid"}, Row{"NulAsHexDigit", withNul(L"\"\\u00", L"41\""), "invalid"},
        Row{"NoClosingQuote", L"\"plan", "invalid"}, Row{"OnlyTheOpeningQuote", L"\"", "invalid"},
        Row{"EndBehindABackslash", L"\"plan\\", "invalid"}, Row{"EndInsideHexDigits", L"\"\\u00", "invalid"},
        Row{"OnlyAnEscapedQuoteAtTheEnd", LR"("plan\")", "invalid"}),
    support::rowName);

TEST(JsonScanner, KeepsANulInsideAString)
{
    std::wstring const text = withNul(L"\"a", L"b\"");
    Scanner scanner(text.data(), text.data() + text.size());
    EXPECT_EQ(scanner.nextToken().text, std::wstring(L"a\0b", 3));
}

TEST(JsonScanner, ReadsAnEscapedNulIntoAString)
{
    std::wstring const text = LR"("a\u0000b")";
    Scanner scanner(text.data(), text.data() + text.size());
    EXPECT_EQ(scanner.nextToken().text, std::wstring(L"a\0b", 3));
}

TEST(JsonScanner, DoesNotCombineSurrogates)
{
    std::wstring const text = LR"("\ud83d\ude00")";
    Scanner scanner(text.data(), text.data() + text.size());
    EXPECT_EQ(scanner.nextToken().text, L"\xD83D\xDE00");
}

TEST(JsonScanner, ReadsAgainFromAPositionThatItWasAt)
{
    std::wstring const text = L"{\"a\":1}";
    Scanner scanner(text.data(), text.data() + text.size());
    scanner.nextToken();
    auto const behindBrace = scanner.position();
    EXPECT_EQ(scanner.nextToken().text, L"a");
    scanner.nextToken();
    scanner.moveTo(behindBrace);
    EXPECT_EQ(scanner.nextToken().text, L"a");
}

TEST(JsonScanner, PutsTheCharacterBackThatEndsATokenBadly)
{
    for (std::wstring const text : {L"\"\\x]", L"\"\\u0x]", L"trux]", L"-x]", L"1ex]", L"1e+x]"}) {
        Scanner scanner(text.data(), text.data() + text.size());
        EXPECT_EQ(scanner.nextToken().kind, Token_kind::invalid);
        EXPECT_EQ(std::wstring(scanner.position()), L"x]");
    }
}

TEST(JsonScanner, StaysAtTheEnd)
{
    std::wstring const text = L"1";
    Scanner scanner(text.data(), text.data() + text.size());
    EXPECT_EQ(show(scanner.nextToken()), "unsigned 1");
    EXPECT_EQ(show(scanner.nextToken()), "end");
    EXPECT_EQ(show(scanner.nextToken()), "end");
}

// Each state of a number, and what follows it.
INSTANTIATE_TEST_SUITE_P(
    NumberBehindMinus, JsonScannerOn,
    testing::Values(
        Row{"Zero", L"-0", "unsigned 0; end"}, Row{"Digit", L"-5", "signed -5; end"}, Row{"Point", L"-.5", "invalid"},
        Row{"Exponent", L"-e5", "invalid"}, Row{"UpperCaseExponent", L"-E5", "invalid"}, Row{"Plus", L"-+5", "invalid"},
        Row{"Minus", L"--5", "invalid"}, Row{"Else", L"-x", "invalid"}, Row{"Blank", L"- 5", "invalid"},
        Row{"End", L"-", "invalid"}, Row{"Nul", withNul(L"-", L"5"), "invalid"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    NumberBehindLeadingZero, JsonScannerOn,
    testing::Values(
        Row{"Zero", L"00", "unsigned 0; unsigned 0; end"}, Row{"Digit", L"07", "unsigned 0; unsigned 7; end"},
        Row{"Point", L"0.5", "real 0.5; end"}, Row{"Exponent", L"0e5", "real 0; end"},
        Row{"UpperCaseExponent", L"0E5", "real 0; end"}, Row{"Plus", L"0+5", "unsigned 0; invalid"},
        Row{"Minus", L"0-5", "unsigned 0; signed -5; end"}, Row{"Else", L"0x5", "unsigned 0; invalid"},
        Row{"Bracket", L"0]", "unsigned 0; ]; end"}, Row{"End", L"0", "unsigned 0; end"},
        Row{"Nul", withNul(L"0", L"5"), "unsigned 0; unsigned 5; end"},
        Row{"DigitBehindMinusZero", L"-07", "unsigned 0; unsigned 7; end"},
        Row{"PointBehindMinusZero", L"-0.5", "real -0.5; end"}, Row{"ExponentBehindMinusZero", L"-0e1", "real -0; end"},
        Row{"PlusBehindMinusZero", L"-0+5", "unsigned 0; invalid"},
        Row{"ElseBehindMinusZero", L"-0]", "unsigned 0; ]; end"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    NumberInPositiveDigits, JsonScannerOn,
    testing::Values(
        Row{"Digits", L"1029384756", "unsigned 1029384756; end"}, Row{"Point", L"10.5", "real 10.5; end"},
        Row{"Exponent", L"10e2", "real 1000; end"}, Row{"UpperCaseExponent", L"10E2", "real 1000; end"},
        Row{"Plus", L"10+5", "unsigned 10; invalid"}, Row{"Minus", L"10-5", "unsigned 10; signed -5; end"},
        Row{"Else", L"10,", "unsigned 10; ,; end"}, Row{"Letter", L"10x", "unsigned 10; invalid"},
        Row{"Blank", L"10 5", "unsigned 10; unsigned 5; end"},
        Row{"Nul", withNul(L"10", L"5"), "unsigned 10; unsigned 5; end"},
        Row{"NulAndEnd", withNul(L"10", L""), "unsigned 10; end"},
        Row{"TwoNuls", withNul(L"10", L"") + withNul(L"", L"5"), "unsigned 10; end"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    NumberInNegativeDigits, JsonScannerOn,
    testing::Values(
        Row{"Digits", L"-1029384756", "signed -1029384756; end"}, Row{"Point", L"-10.5", "real -10.5; end"},
        Row{"Exponent", L"-10e2", "real -1000; end"}, Row{"UpperCaseExponent", L"-10E2", "real -1000; end"},
        Row{"Plus", L"-10+5", "signed -10; invalid"}, Row{"Minus", L"-10-5", "signed -10; signed -5; end"},
        Row{"Else", L"-10}", "signed -10; }; end"}, Row{"End", L"-10", "signed -10; end"},
        Row{"Nul", withNul(L"-10", L"5"), "signed -10; unsigned 5; end"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    NumberInFraction, JsonScannerOn,
    testing::Values(
        Row{"Digits", L"1.25", "real 1.25; end"}, Row{"NoDigits", L"7.", "real 7; end"},
        Row{"NoDigitsBehindZero", L"0.", "real 0; end"}, Row{"NoDigitsBehindMinus", L"-7.", "real -7; end"},
        Row{"Point", L"1.2.3", "real 1.2; invalid"}, Row{"TwoPoints", L"1..", "real 1; invalid"},
        Row{"Exponent", L"1.5e2", "real 150; end"}, Row{"ExponentWithoutDigits", L"1.e2", "real 100; end"},
        Row{"UpperCaseExponent", L"1.5E2", "real 150; end"}, Row{"Plus", L"1.5+2", "real 1.5; invalid"},
        Row{"Minus", L"1.5-2", "real 1.5; signed -2; end"}, Row{"Else", L"1.5]", "real 1.5; ]; end"},
        Row{"Letter", L"1.x", "real 1; invalid"}, Row{"Nul", withNul(L"1.5", L"2"), "real 1.5; unsigned 2; end"},
        Row{"NulBehindThePoint", withNul(L"1.", L"2"), "real 1; unsigned 2; end"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    NumberBehindExponentMark, JsonScannerOn,
    testing::Values(
        Row{"Digit", L"7e0", "real 7; end"}, Row{"Point", L"7e.5", "invalid"}, Row{"Exponent", L"7ee5", "invalid"},
        Row{"UpperCaseExponent", L"7eE5", "invalid"}, Row{"Plus", L"7e+1", "real 70; end"},
        Row{"Minus", L"7e-1", "real 0.7; end"}, Row{"Else", L"7ex", "invalid"}, Row{"Bracket", L"7e]", "invalid"},
        Row{"End", L"1e", "invalid"}, Row{"Nul", withNul(L"1e", L"5"), "invalid"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    NumberBehindExponentSign, JsonScannerOn,
    testing::Values(
        Row{"Digit", L"7E+1", "real 70; end"}, Row{"Zeroes", L"7e-001", "real 0.7; end"},
        Row{"Point", L"7e+.5", "invalid"}, Row{"Exponent", L"7e+e5", "invalid"},
        Row{"UpperCaseExponent", L"7e-E5", "invalid"}, Row{"Plus", L"7e++5", "invalid"},
        Row{"Minus", L"7e+-5", "invalid"}, Row{"Else", L"7e-x", "invalid"}, Row{"End", L"7e+", "invalid"},
        Row{"Nul", withNul(L"7e+", L"5"), "invalid"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    NumberInExponentDigits, JsonScannerOn,
    testing::Values(
        Row{"Digits", L"1e010", "real 1e+10; end"}, Row{"Point", L"1e2.5", "real 100; invalid"},
        Row{"Exponent", L"1e2e3", "real 100; invalid"}, Row{"UpperCaseExponent", L"1e2E3", "real 100; invalid"},
        Row{"Plus", L"1e2+3", "real 100; invalid"}, Row{"Minus", L"1e2-3", "real 100; signed -3; end"},
        Row{"Else", L"1e2,", "real 100; ,; end"}, Row{"Nul", withNul(L"1e2", L"3"), "real 100; unsigned 3; end"}),
    support::rowName);

TEST(JsonScanner, ReadsOnFromACharacterThatItIsGiven)
{
    std::wstring const digits = L"23.5]";
    EXPECT_EQ(show(Scanner(digits.data(), digits.data() + 4).readNumber(L'1')), "real 123.5");
    std::wstring const text = L"plan\"]";
    EXPECT_EQ(show(Scanner(text.data(), text.data() + text.size()).readString()), "string <plan>");
    std::wstring const words = L"ruealseull";
    Scanner scanner(words.data(), words.data() + words.size());
    EXPECT_EQ(show(scanner.readTrue()), "true");
    EXPECT_EQ(show(scanner.readFalse()), "false");
    EXPECT_EQ(show(scanner.readNull()), "null");
}

} // namespace
