// Documents whose long arrays are read element by element, and documents that are written piece by piece.
#include "tests/json/documents.h"

#include <gmock/gmock.h>
#include <random>
#include <sstream>
#include <string_view>
#include <utility>
#include <vector>

namespace {

using namespace documents;
using kutils::json::write_string;
using kutils::json::detail::read_bytes;
using kutils::json::detail::Token_kind;
using testing::ElementsAre;

/// Wants the array "list". Takes `{"n":NUMBER}` from its tokens and all else as values, and notes both.
class Notes final : public kutils::json::detail::Element_sink<char const*> {
public:
    std::vector<std::wstring> notes;
    std::vector<std::wstring> offered;

    bool begin(std::wstring const& key) override
    {
        offered.push_back(key);
        if (key == L"list") {
            notes.clear();
        }
        return key == L"list";
    }

    bool take(Tokens& tokens) override
    {
        if (tokens.nextToken().text != L"n" || tokens.nextToken().kind != Token_kind::colon) {
            return false;
        }
        auto const& number = tokens.nextToken();
        std::wstring const note = L"n=" + std::to_wstring(number.number);
        if (number.kind != Token_kind::unsigned_integer || tokens.nextToken().kind != Token_kind::close_object) {
            return false;
        }
        notes.push_back(note);
        return true;
    }

    void take(Value element) override { notes.push_back(write_string(element, false)); }
};

struct Result {
    bool isRead = false;
    Value document;
    Notes sink;
};

Result readInPieces(std::wstring const& text)
{
    Result result;
    result.isRead = read_bytes(result.document, OdString(text.data(), text.size()).ansi_str(), &result.sink);
    return result;
}

TEST(JsonElements, ComeInOrderWhateverTheirShape)
{
    Result const result =
        readInPieces(LR"({"list":[{"n":1},5,{"n":2},{},[],{"n":"x"},{"n":3,"m":[{}]},null,{"n":4},]})");
    EXPECT_TRUE(result.isRead);
    EXPECT_THAT(
        result.sink.notes,
        ElementsAre(L"n=1", L"5", L"n=2", L"{}", L"[]", LR"({"n":"x"})", LR"({"m":[{}],"n":3})", L"null", L"n=4"));
}

TEST(JsonElements, AreNotInTheDocument)
{
    Result const result = readInPieces(LR"({"a":[1],"list":[{"n":1},5],"z":{"list":[2]}})");
    EXPECT_EQ(result.document, read(LR"({"a":[1],"list":[],"z":{"list":[2]}})"));
}

TEST(JsonElements, AreOfferedOfTheMembersOfTheDocumentOnly)
{
    Result const result =
        readInPieces(LR"({"a":[[1],{"list":[2]}],"list":[{"list":[3]}],"o":{"list":[4]},"s":"list"})");
    EXPECT_THAT(result.sink.offered, ElementsAre(L"a", L"list"));
    EXPECT_THAT(result.sink.notes, ElementsAre(LR"({"list":[3]})"));
}

TEST(JsonElements, OfARepeatedMemberBeginAnew)
{
    EXPECT_THAT(readInPieces(LR"({"list":[1,{"n":1}],"list":[2]})").sink.notes, ElementsAre(L"2"));
    EXPECT_THAT(readInPieces(LR"({"list":[1,{"n":1}],"list":[]})").sink.notes, ElementsAre());
}

TEST(JsonElements, AreNotLookedForInAnArray)
{
    Result const result = readInPieces(LR"([{"list":[1]},[{"list":[2]}]])");
    EXPECT_THAT(result.sink.offered, ElementsAre());
    EXPECT_EQ(result.document, read(LR"([{"list":[1]},[{"list":[2]}]])"));
}

TEST(JsonElements, NeedTheSyntaxThatAllDocumentsNeed)
{
    for (wchar_t const* const text :
         {LR"({"list":[,1]})", LR"({"list":[1 2]})", LR"({"list":[{"n":1}{"n":2}]})", LR"({"list":[1,,2]})",
          LR"({"list":[{"n":1},})", LR"({"list":[{"n" 1}]})", LR"({"list":[{"n":1]})", LR"({"list":[1]]})",
          LR"({"list":[tru]})", LR"({"list":[{"n":1}:]})"}) {
        EXPECT_FALSE(readInPieces(text).isRead) << OdString(text).ansi_str();
        EXPECT_FALSE(reads(text)) << OdString(text).ansi_str();
    }
}

TEST(JsonElements, AreForgottenBehindAnError)
{
    std::string const text = R"({"list":[1:{"more":[5]})";
    Notes sink;
    kutils::json::detail::Parser<Value, char const*> parser(text.data(), text.data() + text.size(), &sink);
    Value value;
    EXPECT_THROW(parser.get(value, false), decltype(parser)::Error);
    ASSERT_TRUE(parser.get(value, false));
    EXPECT_EQ(value, read(LR"({"more":[5]})"));
}

TEST(JsonElements, OfADocumentThatIsCutOffAreRefused)
{
    std::wstring const text = LR"({"list":[{"n":1},{"m":[2]},3]})";
    ASSERT_TRUE(readInPieces(text).isRead);
    for (std::size_t length = 0; length < text.size(); ++length) {
        EXPECT_FALSE(readInPieces(text.substr(0, length)).isRead) << length;
    }
}

TEST(JsonBytes, AreDecodedInStrings)
{
    // A sequence that the end of the string or an escape cuts off is held byte by byte, like others that are no UTF-8.
    std::string const bytes = "{\"\xC3\xA4\":\"a\xF0\x9F\x98\x80z\",\"b\":\"\xFF\xC3\",\"c\":\"\xE2\x82\\n\xC3\\t\","
                              "\"d\":\"\xED\xA0\x80\"}";
    Value value;
    ASSERT_TRUE(read_bytes(value, bytes));
    Value const expected = Object{
        {L"\u00e4", L"a\U0001f600z"},
        {L"b", std::wstring{0xDCFF, 0xDCC3}},
        {L"c", std::wstring{0xDCE2, 0xDC82, L'\n', 0xDCC3, L'\t'}},
        {L"d", std::wstring{0xDCED, 0xDCA0, 0xDC80}}};
    EXPECT_EQ(value, expected);
}

TEST(JsonBytes, AreAsciiOutsideOfStrings)
{
    for (char const* const text :
         {"\xC3\xA4", "[\xA0]", "\xC2\xA0[]", "\xE2\x80\x83[]", "[1\xC3\xA4]", "[1,\xEF\xBC\x91]", "{\"a\"\xC2\x85:1}",
          "[tru\xE5]", "[\"\\\xC3\xA4\"]", "[\"\\u00\xEF\xBC\x91\xEF\xBC\x91\"]"}) {
        Value value;
        EXPECT_FALSE(read_bytes(value, text)) << text;
    }
}

TEST(JsonBytes, EndWithTheFirstNulOutsideOfAString)
{
    Value value;
    EXPECT_TRUE(read_bytes(value, std::string_view("[\"a\0b\"]\0]", 9)));
    EXPECT_EQ(value, Value(Array{std::wstring(L"a\0b", 3)}));
    EXPECT_FALSE(read_bytes(value, std::string_view("[1,\0]", 6)));
    EXPECT_FALSE(read_bytes(value, std::string_view()));
}

TEST(JsonBytes, ReadAsTheTextThatTheyStandFor)
{
    std::vector<std::string> const pieces = {
        "{",
        "}",
        "[",
        "]",
        ":",
        ",",
        "\"a\"",
        "\"",
        "\\",
        "\\u00e4",
        "1",
        "-0",
        "1.5",
        "1e3",
        "true",
        "null",
        " ",
        "\n",
        "\xC3",
        "\xA4",
        "\xC3\xA4",
        "\xFF",
        "\xF0\x9F\x98\x80",
        std::string(1, '\0')};
    std::mt19937 random(11);
    int documents = 0;
    for (int round = 0; round < 30'000; ++round) {
        std::string bytes = round % 2 == 0 ? "" : "[\"";
        for (unsigned count = random() % 8; count > 0; --count) {
            bytes += pieces[random() % pieces.size()];
        }
        bytes += round % 2 == 0 ? "" : "\"]";
        Value ofBytes;
        Value ofText;
        bool const isRead = read_bytes(ofBytes, bytes);
        ASSERT_EQ(isRead, kutils::json::read_string(ofText, OdString(bytes.data(), bytes.size(), CP_UTF_8))) << bytes;
        ASSERT_EQ(ofBytes, ofText) << bytes;
        documents += isRead ? 1 : 0;
    }
    EXPECT_GT(documents, 3'000);
}

using Generator = kutils::json::detail::Generator<Value, std::wostringstream>;

std::wstring inPieces(bool pretty)
{
    return kutils::json::detail::write_pieces(0, pretty, [](Generator& out) {
        out.begin_object();
        out.key(L"empty array");
        out.begin_array();
        out.end();
        out.key(L"empty object");
        out.begin_object();
        out.end();
        out.key(L"in\"side");
        out.begin_array();
        out.element();
        out.value(read(LR"({"a":[1,{}],"b":"x"})"));
        out.element();
        out.begin_object();
        out.key(L"number");
        out.value(std::uint64_t{18'446'744'073'709'551'615U});
        out.key(L"true");
        out.value(true);
        out.end();
        out.element();
        out.value(std::wstring_view(L"line\nend"));
        out.end();
        out.key(L"last");
        out.value(Value());
        out.end();
    });
}

TEST(JsonPieces, MakeACompactText)
{
    EXPECT_EQ(
        inPieces(false), LR"({"empty array":[],"empty object":{},"in\"side":[{"a":[1,{}],"b":"x"},)"
                         LR"({"number":18446744073709551615,"true":true},"line\nend"],"last":null})");
}

TEST(JsonPieces, MakeAPrettyText)
{
    EXPECT_EQ(inPieces(true), LR"({
    "empty array" : [
    ],
    "empty object" : {
    },
    "in\"side" : [
        {
            "a" : [
                1,
                {
                }
            ],
            "b" : "x"
        },
        {
            "number" : 18446744073709551615,
            "true" : true
        },
        "line\nend"
    ],
    "last" : null
})");
}

TEST(JsonPieces, GoToTheStreamWhenTheyAreFlushed)
{
    std::wostringstream stream;
    Generator out(stream, false);
    out.begin_array();
    out.element();
    out.value(true);
    out.flush();
    EXPECT_EQ(stream.str(), L"[true");
}

} // namespace
