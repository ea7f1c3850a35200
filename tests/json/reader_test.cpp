// What documents become, and which are refused.
#include "tests/json/documents.h"
#include "tests/support/rows.h"
#include "json/json_parser.h"

#include <cstdint>
#include <gtest/gtest.h>

namespace {

using namespace documents;
using Parser = kutils::json::detail::Parser<Value, wchar_t const*>;

std::uint64_t operator""_u(unsigned long long number)
{
    return number;
}

struct AcceptedRow {
    char const* name;
    std::wstring text;
    Value value;
};

class JsonReaderAccepts : public testing::TestWithParam<AcceptedRow> {};

TEST_P(JsonReaderAccepts, TheText)
{
    Value value;
    ASSERT_TRUE(reads(GetParam().text, value));
    EXPECT_EQ(value, GetParam().value);
}

std::wstring withNul(wchar_t const* before, wchar_t const* after)
{
    return std::wstring(before) + L'\0' + after;
}

INSTANTIATE_TEST_SUITE_P(
    Values, JsonReaderAccepts,
    testing::Values(
        AcceptedRow{"Null", L"null", Value()}, AcceptedRow{"True", L"true", true},
        AcceptedRow{"False", L"false", false}, AcceptedRow{"Unsigned", L"7", 7_u}, AcceptedRow{"Signed", L"-7", -7},
        AcceptedRow{"Real", L"7.0", 7.0}, AcceptedRow{"RealByExponent", L"7e0", 7.0},
        AcceptedRow{"RealWithoutFraction", L"7.", 7.0}, AcceptedRow{"String", L"\"plan\"", L"plan"},
        AcceptedRow{"EscapedCharacter", LR"("\u00e9")", L"\x00E9"}, AcceptedRow{"BlanksBefore", L" \t\r\n\v\f7", 7_u},
        AcceptedRow{"EmptyArray", L"[]", Array()}, AcceptedRow{"EmptyArrayWithBlanks", L"[ \n]", Array()},
        AcceptedRow{"OneElement", L"[1]", Array{1}},
        AcceptedRow{"Elements", L"[1, \"a\" ,null]", Array{1, L"a", Value()}},
        AcceptedRow{"TrailingCommaInArray", L"[1,]", Array{1}},
        AcceptedRow{"TrailingCommaBehindSeveral", L"[1,2, ]", Array{1, 2}},
        AcceptedRow{"NestedArrays", L"[[],[[1],2]]", Array{Array(), Array{Array{1}, 2}}},
        AcceptedRow{"EmptyObject", L"{}", Object()}, AcceptedRow{"EmptyObjectWithBlanks", L"{ \n}", Object()},
        AcceptedRow{"OneMember", L"{\"a\":1}", Object{{L"a", 1}}},
        AcceptedRow{"Members", L"{\"b\" : 1 , \"a\" : [ ] }", Object{{L"a", Array()}, {L"b", 1}}},
        AcceptedRow{"TrailingCommaInObject", L"{\"a\":1,}", Object{{L"a", 1}}},
        AcceptedRow{"EmptyKey", L"{\"\":1}", Object{{L"", 1}}},
        AcceptedRow{"EscapedKey", LR"({"\u0061\n":1})", Object{{L"a\n", 1}}},
        AcceptedRow{"LastOfTwoMembersWithOneKey", L"{\"a\":1,\"a\":2}", Object{{L"a", 2}}},
        AcceptedRow{
            "LastOfTwoContainersWithOneKey", L"{\"a\":[1,[2]],\"b\":0,\"a\":{}}", Object{{L"a", Object()}, {L"b", 0}}},
        AcceptedRow{"LastMemberIsNull", L"{\"a\":[1],\"a\":null}", Object{{L"a", Value()}}},
        AcceptedRow{
            "NestedObjects", L"{\"a\":{\"b\":{\"c\":{}}}}", Object{{L"a", Object{{L"b", Object{{L"c", Object()}}}}}}},
        AcceptedRow{
            "ContainersBehindContainers", L"{\"a\":[{}],\"b\":{\"c\":[]}}",
            Object{{L"a", Array{Object()}}, {L"b", Object{{L"c", Array()}}}}},
        AcceptedRow{"ControlCharacterInString", L"\"\x01\"", L"\x01"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    TextBehindTheValue, JsonReaderAccepts,
    testing::Values(
        AcceptedRow{"Words", L"{\"a\":1} trailing", Object{{L"a", 1}}}, AcceptedRow{"AnotherValue", L"[] []", Array()},
        AcceptedRow{"ClosingBracket", L"[]]", Array()}, AcceptedRow{"Comma", L"1,", 1_u},
        AcceptedRow{"UnfinishedString", L"true\"", true}, AcceptedRow{"Letters", L"truex", true},
        AcceptedRow{"DigitBehindZero", L"07", 0_u}, AcceptedRow{"Nul", withNul(L"[]", L"["), Array()}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    NulsBehindNumbers, JsonReaderAccepts,
    testing::Values(
        AcceptedRow{"AtTheEnd", withNul(L"1", L""), 1_u},
        AcceptedRow{"BeforeAComma", withNul(L"[1", L",2]"), Array{1, 2}},
        AcceptedRow{"BeforeABracket", withNul(L"[1", L"]"), Array{1}},
        AcceptedRow{"BehindZero", withNul(L"[0", L",2]"), Array{0, 2}},
        AcceptedRow{"BehindANegative", withNul(L"[-1", L",2]"), Array{-1, 2}},
        AcceptedRow{"BehindAFraction", withNul(L"[1.", L",2]"), Array{1.0, 2}},
        AcceptedRow{"BehindAnExponent", withNul(L"[1e2", L",2]"), Array{100.0, 2}},
        AcceptedRow{"InAnObject", withNul(L"{\"a\":1", L",\"b\":2}"), Object{{L"a", 1}, {L"b", 2}}}),
    support::rowName);

struct RefusedRow {
    char const* name;
    std::wstring text;
};

class JsonReaderRefuses : public testing::TestWithParam<RefusedRow> {};

TEST_P(JsonReaderRefuses, TheTextAndLeavesTheValueAsItWas)
{
    Value null;
    EXPECT_FALSE(reads(GetParam().text, null));
    EXPECT_EQ(null, Value());
    Value kept = Array{L"before"};
    EXPECT_FALSE(reads(GetParam().text, kept));
    EXPECT_EQ(kept, Value(Array{L"before"}));
}

INSTANTIATE_TEST_SUITE_P(
    Texts, JsonReaderRefuses,
    testing::Values(
        RefusedRow{"Nothing", L""}, RefusedRow{"Blanks", L"   "}, RefusedRow{"Nul", withNul(L"", L"1")},
        RefusedRow{"Comma", L","}, RefusedRow{"Colon", L":"}, RefusedRow{"ClosingBracket", L"]"},
        RefusedRow{"ClosingBrace", L"}"}, RefusedRow{"Word", L"plan"}, RefusedRow{"Minus", L"-"},
        RefusedRow{"ExponentWithoutDigits", L"1e"}, RefusedRow{"ControlCharacter", L"\x01"},
        RefusedRow{"ControlCharacterInArray", L"[\x01]"}, RefusedRow{"UnknownEscape", LR"("\x")"},
        RefusedRow{"OnlyACommaInArray", L"[,]"}, RefusedRow{"CommaFirstInArray", L"[,1]"},
        RefusedRow{"TwoCommasInArray", L"[1,,2]"}, RefusedRow{"TwoTrailingCommasInArray", L"[1,,]"},
        RefusedRow{"NoCommaInArray", L"[1 2]"}, RefusedRow{"DigitBehindZeroInArray", L"[07]"},
        RefusedRow{"ColonInArray", L"[1:2]"}, RefusedRow{"BraceEndsArray", L"[1}"}, RefusedRow{"BraceInArray", L"[}"},
        RefusedRow{"OpenArray", L"[1"}, RefusedRow{"OpenArrayBehindComma", L"[1,"},
        RefusedRow{"InvalidElement", L"[truex]"}, RefusedRow{"OnlyACommaInObject", L"{,}"},
        RefusedRow{"NumberAsKey", L"{1:2}"}, RefusedRow{"WordAsKey", L"{a:1}"}, RefusedRow{"NullAsKey", L"{null:1}"},
        RefusedRow{"ArrayAsKey", L"{[]:1}"}, RefusedRow{"KeyAlone", L"{\"a\"}"}, RefusedRow{"NoColon", L"{\"a\" 1}"},
        RefusedRow{"CommaForColon", L"{\"a\",1}"}, RefusedRow{"NoMemberValue", L"{\"a\":}"},
        RefusedRow{"CommaForMemberValue", L"{\"a\":,}"}, RefusedRow{"BracketForMemberValue", L"{\"a\":]}"},
        RefusedRow{"TwoColons", L"{\"a\"::1}"}, RefusedRow{"NoCommaInObject", L"{\"a\":1 \"b\":2}"},
        RefusedRow{"TwoCommasInObject", L"{\"a\":1,,\"b\":2}"}, RefusedRow{"TwoTrailingCommasInObject", L"{\"a\":1,,}"},
        RefusedRow{"NumberBehindComma", L"{\"a\":1,2}"}, RefusedRow{"ArrayBehindComma", L"{\"a\":1,[]}"},
        RefusedRow{"BracketEndsObject", L"{\"a\":1]"}, RefusedRow{"BracketInObject", L"{]"},
        RefusedRow{"OpenObject", L"{\"a\":1"}, RefusedRow{"OpenObjectBehindComma", L"{\"a\":1,"},
        RefusedRow{"BracketsCrossed", L"[{]}"},
        RefusedRow{"ErrorDeepInside", L"{\"a\":[1,{\"b\":[true,{\"c\":nul}]}]}"},
        RefusedRow{"SecondOfTwoMembersWithOneKeyIsWrong", L"{\"a\":1,\"a\":x}"},
        RefusedRow{"TwoNulsBehindANumber", withNul(L"[1", L"") + withNul(L"", L",2]")},
        RefusedRow{"NulBehindAKeyword", withNul(L"[true", L",2]")},
        RefusedRow{"NulBehindAString", withNul(L"[\"a\"", L",2]")},
        RefusedRow{"NulBehindAComma", withNul(L"[1,", L"2]")}, RefusedRow{"NulBehindAKey", withNul(L"{\"a\"", L":1}")},
        RefusedRow{"NulBehindAColon", withNul(L"{\"a\":", L"1}")},
        RefusedRow{"NulInsideANumberSplitsIt", withNul(L"[1", L"2]")}, RefusedRow{"OpenString", L"\"plan"},
        RefusedRow{"OpenKey", L"{\"a"}, RefusedRow{"OpenStringThatEndsInNul", withNul(L"\"plan", L"")},
        RefusedRow{"CommentBefore", L"// plan\n1"}, RefusedRow{"ByteOrderMark", L"\xFEFF[]"},
        RefusedRow{
            "NoBreakSpace", L"[1,\x00A0"
                            "2]"}),
    support::rowName);

TEST(JsonReader, IntegersAreUnsignedUnlessTheyHaveAMinusSign)
{
    EXPECT_TRUE(read(L"7").is_uint64());
    EXPECT_TRUE(read(L"0").is_uint64());
    EXPECT_TRUE(read(L"-0").is_uint64());
    EXPECT_FALSE(read(L"-7").is_uint64());
}

TEST(JsonReader, OnlyUnsignedIntegersAreMarkedSo)
{
    Value const value = read(L"[7,-7,7.0,\"7\",true,null,[],{}]");
    for (std::size_t i = 1; i < value.get_array().size(); ++i) {
        EXPECT_FALSE(value.get_array()[i].is_uint64()) << "element " << i;
    }
}

TEST(JsonReader, ReplacesWhatTheValueHeld)
{
    Value value = std::uint64_t{7};
    ASSERT_TRUE(reads(L"-7", value));
    EXPECT_EQ(value, Value(-7));
    EXPECT_FALSE(value.is_uint64());
}

TEST(JsonReader, KeepsANulInsideAString)
{
    EXPECT_EQ(read(withNul(L"[\"a", L"b\"]")).get_array()[0].get_string(), std::wstring(L"a\0b", 3));
    EXPECT_EQ(read(withNul(L"{\"a", L"b\":1}")).get_object().count(std::wstring(L"a\0b", 3)), 1U);
}

TEST(JsonReader, OrdersMembersInWhateverOrderTheyCome)
{
    Value const ordered = Object{{L"a", 1}, {L"b", 2}, {L"c", 3}};
    EXPECT_EQ(read(L"{\"a\":1,\"b\":2,\"c\":3}"), ordered);
    EXPECT_EQ(read(L"{\"c\":3,\"b\":2,\"a\":1}"), ordered);
    EXPECT_EQ(read(L"{\"b\":0,\"c\":3,\"a\":1,\"b\":2}"), ordered);
}

std::wstring const s_richDocument =
    L"{\"head\" : {\"reference\" : \"m\x00E4ster\", \"esc\\u00e4\\n\" : [true, false, null]},\n"
    L" \"index\" : [{\"data\" : {\"last_checked\" : 1700000000000000000, \"modified\" : -12}, \"path\" : \"a\\\\b\"},\n"
    L"              [[], {}, [1.5e-3, 0.25, 0]], ],\n"
    L" \"z\" : \"\\\"end\\\"\" , }";

TEST(JsonReader, RefusesADocumentCutOffAnywhere)
{
    ASSERT_TRUE(reads(s_richDocument));
    for (std::size_t length = 0; length < s_richDocument.size(); ++length) {
        EXPECT_FALSE(reads(s_richDocument.substr(0, length))) << "cut at " << length;
    }
}

TEST(JsonReader, RefusesAScalarCutOffAnywhereUnlessANumberIsLeft)
{
    for (std::wstring const text : {L"null", L"true", L"false", L"\"a\\u00e4\\n\"", L"-", L"1e+"}) {
        for (std::size_t length = 0; length < text.size(); ++length) {
            bool const isNumber = length == 1 && text[0] == L'1';
            EXPECT_EQ(reads(text.substr(0, length)), isNumber) << testing::PrintToString(text) << " cut at " << length;
        }
    }
    EXPECT_EQ(read(std::wstring(L"-12.50e+07").substr(0, 3)), Value(-12));
    EXPECT_EQ(read(std::wstring(L"-12.50e+07").substr(0, 4)), Value(-12.0));
    EXPECT_FALSE(reads(std::wstring(L"-12.50e+07").substr(0, 7)));
    EXPECT_FALSE(reads(std::wstring(L"-12.50e+07").substr(0, 8)));
    EXPECT_EQ(read(std::wstring(L"-12.50e+07").substr(0, 9)), Value(-12.5));
}

TEST(JsonReader, RefusesADocumentWithAStrayCharacterAnywhereOutsideStrings)
{
    std::wstring const document = L"{\"\":[1,{\"\":-2.5e3},[],true],\"\":null}";
    for (std::size_t at = 0; at <= document.size(); ++at) {
        std::wstring const broken = document.substr(0, at) + L"?" + document.substr(at);
        bool const isInString = at > 0 && at < document.size() && document[at - 1] == L'"' && document[at] == L'"';
        EXPECT_EQ(reads(broken), isInString || at == document.size()) << "stray character at " << at;
    }
}

TEST(JsonReader, DoesNotLookAtMemoryBehindTheText)
{
    std::wstring const text = L"\"plan\"";
    EXPECT_FALSE(read_string(*std::make_unique<Value>(), OdString(text.data(), 5)));
    std::wstring const number = L"123";
    Value value;
    ASSERT_TRUE(read_string(value, OdString(number.data(), 2)));
    EXPECT_EQ(value, Value(12));
}

TEST(JsonReader, ReadsAStringOfManyCharacters)
{
    std::wstring const longText = repeat(L"a long text, ", 100'000);
    EXPECT_EQ(read(L"\"" + longText + L"\""), Value(longText));
    EXPECT_EQ(read(L"\"" + repeat(L"\\u0041", 100'000) + L"\""), Value(std::wstring(100'000, L'A')));
    EXPECT_FALSE(reads(L"\"" + longText));
}

TEST(JsonReader, ReadsAnArrayOfManyElements)
{
    Value const value = read(L"[" + repeat(L"1,", 1'000'000) + L"]");
    EXPECT_EQ(value, Value(Array(1'000'000, 1)));
}

TEST(JsonParser, MovesTheBeginningBehindTheValue)
{
    std::wstring const text = L" [1,2] {\"a\":3} 45x";
    wchar_t const* at = text.data();
    wchar_t const* const end = at + text.size();
    Value value;
    ASSERT_TRUE(Parser::parse(at, end, value));
    EXPECT_EQ(std::wstring(at), L" {\"a\":3} 45x");
    ASSERT_TRUE(Parser::parse(at, end, value));
    EXPECT_EQ(std::wstring(at), L" 45x");
    ASSERT_TRUE(Parser::parse(at, end, value));
    EXPECT_EQ(std::wstring(at), L"x");
    EXPECT_EQ(value, Value(45));
    EXPECT_FALSE(Parser::parse(at, end, value));
    EXPECT_EQ(value, Value(45));
}

TEST(JsonParser, RefusesAnEmptyRange)
{
    wchar_t const* at = nullptr;
    Value value;
    EXPECT_FALSE(Parser::parse(at, nullptr, value));
}

TEST(JsonParser, ReportsAClosingBracketWhereOneIsAllowed)
{
    std::wstring const text = L"1 ] ]";
    Parser parser(text.data(), text.data() + text.size());
    Value value;
    EXPECT_TRUE(parser.get(value, true));
    EXPECT_FALSE(parser.get(value, true));
    EXPECT_EQ(value, Value(1));
    EXPECT_THROW(parser.get(value, false), Parser::Error);
    EXPECT_EQ(value, Value(1));
}

TEST(JsonParser, AllowsNoClosingBraceInItsPlace)
{
    std::wstring const text = L"}";
    Value value;
    EXPECT_THROW(Parser(text.data(), text.data() + text.size()).get(value, true), Parser::Error);
}

TEST(JsonParser, ReadsOnBehindAnError)
{
    std::wstring const text = L"[[[? 7";
    Parser parser(text.data(), text.data() + text.size());
    Value value;
    EXPECT_THROW(parser.get(value, false), Parser::Error);
    EXPECT_TRUE(parser.get(value, false));
    EXPECT_EQ(value, Value(7));
}

} // namespace
