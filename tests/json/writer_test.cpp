// What values are written as, character by character. Tests start in the "C" locale.
#include "tests/json/documents.h"
#include "tests/support/allocations.h"
#include "tests/support/rows.h"

#include <cfloat>
#include <climits>
#include <cmath>
#include <cstdint>
#include <fstream>
#include <gmock/gmock.h>
#include <iterator>
#include <limits>
#include <sstream>
#include <stdexcept>
#include <utility>

namespace {

using namespace documents;
using kutils::json::write_string;
using kutils::json::detail::add_esc_char;
using kutils::json::detail::add_esc_chars;
using kutils::json::detail::non_printable_to_string;
using support::worksWithBlocksOf;
using Generator = kutils::json::detail::Generator<Value, std::wostringstream>;

std::wstring golden(char const* name)
{
    std::ifstream file(std::string(MU_GOLDEN_JSON "/") + name, std::ios::binary);
    EXPECT_TRUE(file) << "no document " << name;
    std::string const bytes(std::istreambuf_iterator<char>(file), {});
    return OdString(bytes.data(), bytes.size(), CP_UTF_8).c_str();
}

struct Row {
    char const* name;
    Value value;
    std::wstring compact;
    std::wstring pretty;
};

class JsonWriter : public testing::TestWithParam<Row> {};

TEST_P(JsonWriter, WritesCompactLayout)
{
    EXPECT_EQ(write_string(GetParam().value, false), GetParam().compact);
}

TEST_P(JsonWriter, WritesPrettyLayout)
{
    EXPECT_EQ(write_string(GetParam().value, true), GetParam().pretty);
}

Row scalar(char const* name, Value const& value, wchar_t const* text)
{
    return {name, value, text, text};
}

constexpr double kInfinity = std::numeric_limits<double>::infinity();

INSTANTIATE_TEST_SUITE_P(
    Scalars, JsonWriter,
    testing::Values(
        scalar("Null", Value(), L"null"), scalar("True", true, L"true"), scalar("False", false, L"false"),
        scalar("Zero", 0, L"0"), scalar("Signed", -7, L"-7"),
        scalar("SmallestSigned", std::int64_t{INT64_MIN}, L"-9223372036854775808"),
        scalar("LargestSigned", std::int64_t{INT64_MAX}, L"9223372036854775807"),
        scalar("LargestUnsigned", std::uint64_t{UINT64_MAX}, L"18446744073709551615"),
        scalar("WholeReal", 2.0, L"2.0000000000000000"), scalar("OneAndAHalf", 1.5, L"1.5000000000000000"),
        scalar("Tenth", 0.1, L"0.1000000000000000"), scalar("ThirdRoundedDown", 1 / 3.0, L"0.3333333333333333"),
        scalar("TwoThirdsRoundedUp", 2 / 3.0, L"0.6666666666666666"),
        scalar("NegativeReal", -2.25, L"-2.2500000000000000"), scalar("ZeroReal", 0.0, L"0.0000000000000000"),
        scalar("MinusZero", -0.0, L"-0.0000000000000000"), scalar("LastPlace", 1e-16, L"0.0000000000000001"),
        scalar("HalfOfTheLastPlace", 4e-17, L"0.0000000000000000"),
        scalar("RoundedIntoTheLastPlace", 6e-17, L"0.0000000000000001"),
        scalar("Stamp", 1700000000.125, L"1700000000.1250000000000000"),
        scalar("BeyondExactIntegers", 1e23, L"99999999999999991611392.0000000000000000"),
        scalar("SmallestDenormal", 5e-324, L"0.0000000000000000"), scalar("Infinity", kInfinity, L"inf"),
        scalar("MinusInfinity", -kInfinity, L"-inf"), scalar("Nan", std::copysign(NAN, 1.0), L"nan"),
        scalar("MinusNan", std::copysign(NAN, -1.0), L"-nan"), scalar("EmptyString", L"", L"\"\""),
        scalar("String", L"a/b", L"\"a/b\"")),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    Containers, JsonWriter,
    testing::Values(
        Row{"EmptyArray", Array(), L"[]", L"[\n]"}, Row{"EmptyObject", Object(), L"{}", L"{\n}"},
        Row{"Array", Array{1, true, Value()}, L"[1,true,null]", L"[\n    1,\n    true,\n    null\n]"},
        Row{"ArrayOfOne", Array{1}, L"[1]", L"[\n    1\n]"},
        Row{"Object", Object{{L"a", 1}, {L"b", Array{true, Value()}}}, L"{\"a\":1,\"b\":[true,null]}",
            L"{\n    \"a\" : 1,\n    \"b\" : [\n        true,\n        null\n    ]\n}"},
        Row{"EmptyArrayInObject", Object{{L"a", Array()}}, L"{\"a\":[]}", L"{\n    \"a\" : [\n    ]\n}"},
        Row{"EmptyObjectInArray", Array{Object(), 1}, L"[{},1]", L"[\n    {\n    },\n    1\n]"},
        Row{"ArraysInArrays", Array{Value(Array{Value(Array{1})})}, L"[[[1]]]",
            L"[\n    [\n        [\n            1\n        ]\n    ]\n]"},
        Row{"MembersByKey", Object{{L"b", 1}, {L"B", 2}, {L"", 3}, {L"\x00E4", 4}},
            L"{\"\":3,\"B\":2,\"b\":1,\"\\u00E4\":4}",
            L"{\n    \"\" : 3,\n    \"B\" : 2,\n    \"b\" : 1,\n    \"\\u00E4\" : 4\n}"},
        Row{"Projects", Object{{L"projects_map", Array{Object{{L"name", L"A"}}}}},
            L"{\"projects_map\":[{\"name\":\"A\"}]}",
            L"{\n    \"projects_map\" : [\n        {\n            \"name\" : \"A\"\n        }\n    ]\n}"}),
    support::rowName);

TEST(JsonWriterOf, LargestRealInFull)
{
    EXPECT_EQ(
        write_string(DBL_MAX, false),
        L"1797693134862315708145274237317043567980705675258449965989174768031572607800285387605895586327668781"
        L"7154045895351438246423432132688946418276846754670353751698604991057655128207624549009038932894407586"
        L"8508455133942304583236903222948165808559332123348274797826204144723168738177180919299881250404026184"
        L"124858368.0000000000000000");
}

TEST(JsonWriterOf, RealsAreWrittenAsTheStreamsOfTheLanguageDo)
{
    for (double const real : {1e308, -1e308, 123456789.987654321, 1e-5, 0.5, 1e15, 1e16, 1e17, 3.141592653589793}) {
        std::wostringstream stream;
        stream.imbue(std::locale::classic());
        stream.precision(16);
        stream << std::fixed << real;
        EXPECT_EQ(write_string(real, false), stream.str());
    }
}

struct EscapeRow {
    char const* name;
    std::wstring text;
    std::wstring escaped;
};

class JsonEscapes : public testing::TestWithParam<EscapeRow> {};

INSTANTIATE_TEST_SUITE_P(
    Texts, JsonEscapes,
    testing::Values(
        EscapeRow{"Nothing", L"", L""}, EscapeRow{"Plain", L"Plan 1.dwg", L"Plan 1.dwg"},
        EscapeRow{"Backspace", L"\b", L"\\b"}, EscapeRow{"Tab", L"\t", L"\\t"}, EscapeRow{"LineFeed", L"\n", L"\\n"},
        EscapeRow{"FormFeed", L"\f", L"\\f"}, EscapeRow{"CarriageReturn", L"\r", L"\\r"},
        EscapeRow{"Quote", L"\"", L"\\\""}, EscapeRow{"Backslash", L"\\", L"\\\\"}, EscapeRow{"Slash", L"/", L"/"},
        EscapeRow{"Apostrophe", L"'", L"'"}, EscapeRow{"Nul", std::wstring(1, L'\0'), L"\\u0000"},
        EscapeRow{"Control", L"\x01", L"\\u0001"}, EscapeRow{"VerticalTab", L"\v", L"\\u000B"},
        EscapeRow{"UnitSeparator", L"\x1F", L"\\u001F"}, EscapeRow{"Space", L" ", L" "}, EscapeRow{"Tilde", L"~", L"~"},
        EscapeRow{"Delete", L"\x7F", L"\\u007F"}, EscapeRow{"FirstBeyondAscii", L"\x80", L"\\u0080"},
        EscapeRow{"Umlaut", L"\x00E9", L"\\u00E9"}, EscapeRow{"Surrogate", L"\xDC80", L"\\uDC80"},
        EscapeRow{"LastOfTheBasicPlane", L"\xFFFF", L"\\uFFFF"},
        EscapeRow{"BeyondTheBasicPlane", L"\x1F600", L"\\uF600"}, EscapeRow{"LastCharacter", L"\x10FFFF", L"\\uFFFF"},
        EscapeRow{"NegativeCharacter", std::wstring(1, static_cast<wchar_t>(-2)), L"\\uFFFE"},
        EscapeRow{"PlainAroundEscapes", L"a\nb\x00E4\"c", L"a\\nb\\u00E4\\\"c"},
        EscapeRow{"EscapesAtBothEnds", L"\tab\t", L"\\tab\\t"}),
    support::rowName);

TEST_P(JsonEscapes, AreAppliedToStrings)
{
    EXPECT_EQ(write_string(GetParam().text, false), L"\"" + GetParam().escaped + L"\"");
}

TEST_P(JsonEscapes, AreAppliedToKeys)
{
    Value const value = Object{{GetParam().text, 1}};
    EXPECT_EQ(write_string(value, false), L"{\"" + GetParam().escaped + L"\":1}");
    EXPECT_EQ(write_string(value, true), L"{\n    \"" + GetParam().escaped + L"\" : 1\n}");
}

TEST_P(JsonEscapes, AreAppliedByAddEscChars)
{
    EXPECT_EQ(add_esc_chars(GetParam().text), GetParam().escaped);
}

TEST(JsonEscape, EveryAsciiCharacterIsWrittenByItsRule)
{
    for (wchar_t c = 0; c < 128; ++c) {
        std::wstring expected(1, c);
        std::size_t const letter = std::wstring(L"\b\t\n\f\r\"\\").find(c);
        if (letter != std::wstring::npos) {
            expected = std::wstring(L"\\") + L"btnfr\"\\"[letter];
        } else if (c < 32 || c == 127) {
            wchar_t digits[8];
            std::swprintf(digits, 8, L"\\u%04X", static_cast<unsigned>(c));
            expected = digits;
        }
        EXPECT_EQ(add_esc_chars(std::wstring(1, c)), expected) << "character " << static_cast<int>(c);
    }
}

TEST(JsonEscape, SevenCharactersHaveTheirOwn)
{
    std::wstring text = L"x";
    for (wchar_t const c : std::wstring(L"\b\t\n\f\r\"\\")) {
        EXPECT_TRUE(add_esc_char(c, text));
    }
    EXPECT_EQ(text, LR"(x\b\t\n\f\r\"\\)");
    for (wchar_t const c : std::wstring(L"/a \v\x01\x00E4")) {
        EXPECT_FALSE(add_esc_char(c, text)) << "character " << static_cast<int>(c);
    }
    EXPECT_EQ(text, LR"(x\b\t\n\f\r\"\\)");
}

TEST(JsonEscape, NonPrintableCharactersKeepTheirLow16Bits)
{
    EXPECT_EQ(non_printable_to_string(0), L"\\u0000");
    EXPECT_EQ(non_printable_to_string(0x0B), L"\\u000B");
    EXPECT_EQ(non_printable_to_string(0xABCD), L"\\uABCD");
    EXPECT_EQ(non_printable_to_string(0x1F600), L"\\uF600");
    EXPECT_EQ(non_printable_to_string(0xFFFFFFFF), L"\\uFFFF");
}

TEST(JsonWriterOf, LongTextsComeOutWhole)
{
    for (std::size_t const length : {4094U, 4095U, 4096U, 4097U, 10'000U}) {
        std::wstring const text(length, L'x');
        EXPECT_EQ(write_string(Array{text, text}, false), L"[\"" + text + L"\",\"" + text + L"\"]");
        std::wstring const feeds(length, L'\n');
        EXPECT_EQ(write_string(feeds, false), L"\"" + repeat(L"\\n", length) + L"\"");
    }
}

TEST(JsonWriterOf, NumbersAreWholeWhereverTheyFall)
{
    for (std::size_t length = 4000; length < 4100; ++length) {
        std::wstring const text(length, L'x');
        EXPECT_EQ(
            write_string(Array{text, std::int64_t{INT64_MIN}, 0.5, true}, false),
            L"[\"" + text + L"\",-9223372036854775808,0.5000000000000000,true]");
    }
}

TEST(JsonWriterOf, PrettyLayoutFourSpacesPerLevel)
{
    constexpr std::size_t depth = 1'500;
    std::wstring expected;
    for (std::size_t level = 0; level < depth; ++level) {
        expected += std::wstring(4 * level, L' ') + L"[\n";
    }
    for (std::size_t level = depth; level-- > 0;) {
        expected += std::wstring(4 * level, L' ') + (level > 0 ? L"]\n" : L"]");
    }
    EXPECT_EQ(write_string(read(repeat(L"[", depth) + repeat(L"]", depth)), true), expected);
}

TEST(JsonWriterOf, TextsBeyondThirtyTwoMebibytesAreWhole)
{
    std::wstring const text = repeat(L"0123456789abcdef", 1'000'000);
    EXPECT_EQ(write_string(Array{text, 1}, true), L"[\n    \"" + text + L"\",\n    1\n]");
}

// How long the text of a long array becomes is told from every eighth of these elements.
TEST(JsonWriterOf, LongArraysAreWholeWhereverTheirLongElementsStand)
{
    constexpr std::size_t kSize = 8192;
    for (bool const isLongInTheSample : {false, true}) {
        Array array(kSize);
        std::wstring expected;
        for (std::size_t i = 0; i < kSize; ++i) {
            std::wstring const text((i % 8 == 0) == isLongInTheSample ? 1000 : 1, L'x');
            array[i] = text;
            expected += (i > 0 ? L",\"" : L"[\"") + text + L"\"";
        }
        EXPECT_EQ(write_string(array, false), expected + L"]") << isLongInTheSample;
    }
}

// Once took time that doubled with each level.
TEST(JsonWriterOf, NestedLongArraysTakeTimeLikeTheirText)
{
    constexpr std::size_t kDepth = 60;
    std::wstring const rest = repeat(L",0", 2047) + L"]";
    Value value = 0;
    for (std::size_t level = 0; level < kDepth; ++level) {
        Array array(2048, Value(0));
        array[0] = std::move(value);
        value = std::move(array);
    }
    EXPECT_EQ(write_string(value, false), repeat(L"[", kDepth) + L"0" + repeat(rest, kDepth));
}

// Every 64th element counts for the estimate: it expects a gigabyte where 18 MB come.
TEST(JsonWriterOf, ATextThatFitsIsWrittenWhenMuchMoreIsExpected)
{
    Array array(65'536, Value(0));
    for (std::size_t i = 0; i < array.size(); i += 64) {
        array[i] = std::wstring(4'000, L'x');
    }
    std::wstring text;
    EXPECT_TRUE(worksWithBlocksOf(std::size_t{64} << 20, [&] { text = write_string(array, false); }));
    std::wstring const item = L",\"" + std::wstring(4'000, L'x') + L"\"" + repeat(L",0", 63);
    EXPECT_EQ(text, L"[" + repeat(item, 1024).substr(1) + L"]");
}

Value stateDocument()
{
    Object const entry = {
        {L"data", Object{{L"last_checked", std::uint64_t{1700000000123456789}}, {L"modified", false}}},
        {L"path", L"Grundri\x00DF/Erdgescho\x00DF.dwg"}};
    Object const other = {
        {L"data", Object{{L"last_checked", std::int64_t{-62135596800}}, {L"modified", true}}},
        {L"path", L"a \"b\" \\ c\t\x7F.dwg"}};
    return Object{
        {L"head", Object{{L"reference", L"master"}}},
        {L"index", Array{entry, other}},
        {L"renamed_files", Array()},
        {L"scale", Array{0.1, -1e21, 1e-9, 1234.5}},
        {L"staged_files", Array{Array{Object()}, Value(), L""}}};
}

TEST(JsonWriterOf, StateDocumentIsAsItAlwaysWas)
{
    EXPECT_EQ(write_string(stateDocument(), true), golden("state_pretty.json"));
    EXPECT_EQ(write_string(stateDocument(), false), golden("state_compact.json"));
}

TEST(JsonWriterOf, StateDocumentReadsBackTheSame)
{
    EXPECT_EQ(read(golden("state_compact.json")), read(golden("state_pretty.json")));
    EXPECT_EQ(read(golden("state_pretty.json")).get_object().at(L"index"), stateDocument().get_object().at(L"index"));
}

TEST(JsonGenerator, WritesEachKindOfText)
{
    std::wostringstream stream;
    Generator generator(stream, false);
    generator.output(Value(Array{1, L"a"}));
    generator.output(std::wstring(L"b\n"));
    generator.output(true);
    generator.output(false);
    generator.output(Object::value_type(L"key", Object{{L"c", Value()}}));
    EXPECT_EQ(stream.str(), L"[1,\"a\"]\"b\\n\"truefalse\"key\":{\"c\":null}");
}

TEST(JsonGenerator, WritesAMemberInThePrettyLayout)
{
    std::wostringstream stream;
    Generator(stream, true).output(Object::value_type(L"key", Array{1}));
    EXPECT_EQ(stream.str(), L"\"key\" : [\n    1\n]");
}

TEST(JsonGenerator, WritesAContainerBetweenTheGivenBrackets)
{
    std::wostringstream stream;
    Generator generator(stream, true);
    generator.output_array_or_obj(Array{1, Array()}, L'(', L')');
    generator.output_array_or_obj(Object{{L"a", 1}}, L'<', L'>');
    EXPECT_EQ(stream.str(), L"(\n    1,\n    [\n    ]\n)<\n    \"a\" : 1\n>");
}

TEST(JsonGenerator, WritesNothingElseToItsStream)
{
    std::wostringstream stream;
    stream << std::showpos << std::hex;
    Generator(stream, false).output(Value(Array{10, 1.5}));
    EXPECT_EQ(stream.str(), L"[10,1.5000000000000000]");
    stream << 16;
    EXPECT_EQ(stream.str(), L"[10,1.5000000000000000]10");
}

} // namespace
