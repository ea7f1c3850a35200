// Documents whose long arrays are read element by element, and documents that are written piece by piece.
#include "tests/json/documents.h"
#include "json/json_parser.h"

#include <gmock/gmock.h>
#include <sstream>
#include <utility>
#include <vector>

namespace {

using namespace documents;
using kutils::json::write_string;
using kutils::json::detail::Element_sink;
using kutils::json::detail::Token_kind;
using testing::ElementsAre;

/// Wants the array "list". Takes `{"n":NUMBER}` from its tokens and all else as values, and notes both.
class Notes final : public Element_sink {
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
    OdString const characters(text.data(), text.size());
    result.isRead = kutils::json::detail::read_string(result.document, characters, result.sink);
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
    std::wstring const text = LR"({"list":[1:{"more":[5]})";
    Notes sink;
    kutils::json::detail::Parser<Value, wchar_t const*> parser(text.data(), text.data() + text.size(), &sink);
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

TEST(JsonPieces, MakeATextHoweverLongItWasExpectedToBe)
{
    for (std::size_t const expected : {std::size_t{1} << 45, std::size_t{1} << 62, ~std::size_t{0}}) {
        EXPECT_EQ(kutils::json::detail::write_pieces(expected, false, [](Generator& out) { out.value(true); }), L"true")
            << expected;
    }
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
