#include "tests/server/outcome.h"
#include "tests/server/translations.h"
#include "tests/support/rows.h"
#include "tests/support/utf8.h"

#include <type_traits>

namespace {

using namespace common;
using namespace server;

static_assert(std::is_aggregate_v<FetchData> && std::is_aggregate_v<CommitNumberPair>);
static_assert(std::is_nothrow_move_constructible_v<FetchData>);

std::string missingMember(std::string const& what, std::string const& key)
{
    return "error: Could not parse " + what + ", missing \"" + key + "\"";
}

std::string const kRepository = R"("repository": {"id": "42", "name": "bridge"})";
std::string const kReferences = R"("references": [{"commitHash": "b", "name": "z", "refType": "tag"},
                                                  {"commitHash": "a", "name": "y", "refType": "branch"}])";
std::string const kCommits =
    R"("commits": [{"annotation": {"author": "ann", "date": 1.0}, "commitNo": 7, "files": [], "hash": "b"},
                   {"annotation": {"author": "bob", "date": 2.0}, "commitNo": 6, "files": [], "hash": "a"}])";

std::string fetch(std::string const& first, std::string const& second = "", std::string const& third = "")
{
    return "{" + first + (second.empty() ? "" : ", " + second) + (third.empty() ? "" : ", " + third) + "}";
}

class FetchReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, FetchReader,
    testing::Values(
        Row{"Repository", fetch(kRepository), "bridge is 42 ''; commits []; references []"},
        Row{"References", fetch(kRepository, kReferences),
            "bridge is 42 ''; commits []; references [tag z -> b, branch y -> a]"},
        Row{"All", fetch(kRepository, kReferences, kCommits),
            "bridge is 42 ''; commits [7 b of []: ann said '' at 1 [], 6 a of []: bob said '' at 2 []]; "
            "references [tag z -> b, branch y -> a]"},
        Row{"EmptyArrays", fetch(kRepository, R"("references": [])", R"("commits": [])"),
            "bridge is 42 ''; commits []; references []"},
        Row{"UnknownMembers", fetch(kRepository, R"("Commits": 5)", R"("reference": null)"),
            "bridge is 42 ''; commits []; references []"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    MissingMembers, FetchReader,
    testing::Values(
        Row{"All", "{}", missingMember("fetch data", "repository")},
        Row{"Repository", fetch(kReferences, kCommits), missingMember("fetch data", "repository")},
        Row{"References", fetch(kRepository, kCommits), missingMember("fetch data", "references")},
        Row{"ReferencesBesideWrongCommits", fetch(kRepository, R"("commits": 5)"),
            missingMember("fetch data", "references")},
        Row{"InRepository", fetch(R"("repository": {})", kCommits), missingMember("repo data", "name")},
        Row{"InReferences", fetch(kRepository, R"("references": [{}])", R"("commits": [{}])"),
            "error: No commitHash found in reference."},
        Row{"InCommits", fetch(kRepository, kReferences, R"("commits": [{"annotation": {}}])"),
            missingMember("annotation", "author")},
        Row{"AnnotationInCommits", fetch(kRepository, kReferences, R"("commits": [{}])"), missing("annotation")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    WrongMembers, FetchReader,
    testing::Values(
        Row{"RepositoryFirst", fetch(R"("repository": [])", R"("references": 1)", R"("commits": 1)"),
            mismatch("object", "array", "repository")},
        Row{"InRepository", fetch(R"("repository": {"id": 1, "name": "x"})", R"("references": 1)"),
            mismatch("string", "int", "id")},
        Row{"ReferencesNext", fetch(kRepository, R"("references": 1)", R"("commits": 1)"),
            mismatch("array", "int", "references")},
        Row{"NullReferences", fetch(kRepository, R"("references": null)"), mismatch("array", "null", "references")},
        Row{"NoObjectInReferences", fetch(kRepository, R"("references": [1])", R"("commits": 1)"), noObject("int")},
        Row{"CommitsLast", fetch(kRepository, kReferences, R"("commits": {})"), mismatch("array", "object", "commits")},
        Row{"NoObjectInCommits", fetch(kRepository, kReferences, R"("commits": [null])"), noObject("null")}),
    support::rowName);

TEST_P(FetchReader, TakesTheObjectAsItIs)
{
    EXPECT_EQ(outcomeOf([] { return deserializeFetchData(object(GetParam().document)); }), GetParam().outcome);
}

TEST(FetchReader, ThrowsOverEveryMemberOfAnotherType)
{
    expectsTypes(
        fetch(kRepository, kReferences, kCommits),
        {{"commits", "array"}, {"references", "array"}, {"repository", "object"}}, deserializeFetchData);
}

std::string const kNumber = R"({"commitNo": 7, "hash": "abc"})";

std::string numbered(std::string const& commitNo)
{
    return R"({"hash": "a", "commitNo": )" + commitNo + "}";
}

class CommitNumberReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, CommitNumberReader,
    testing::Values(
        Row{"Complete", kNumber, "abc is 7"}, Row{"Negative", numbered("-7"), "a is -7"},
        Row{"LowBits", numbered("4294967297"), "a is 1"},
        Row{"Unsigned64", numbered("18446744073709551615"), "a is -1"},
        Row{"TooLarge", numbered("1000000000000000000000000"), "a is -1"},
        Row{"Real", numbered("7.5"), mismatch("int", "real", "commitNo")},
        Row{"Empty", "{}", missingMember("commit number", "hash")},
        Row{"WithoutHash", R"({"commitNo": "7"})", missingMember("commit number", "hash")},
        Row{"WithoutNumber", R"({"hash": 1})", missingMember("commit number", "commitNo")},
        Row{"HashFirst", R"({"hash": 1, "commitNo": ""})", mismatch("string", "int", "hash")}),
    support::rowName);

TEST_P(CommitNumberReader, TakesTheObjectAsItIs)
{
    EXPECT_EQ(outcomeOf([] { return deserializeCommitNumber(object(GetParam().document)); }), GetParam().outcome);
}

TEST(CommitNumberReader, ThrowsOverEveryMemberOfAnotherType)
{
    expectsTypes(kNumber, {{"commitNo", "int"}, {"hash", "string"}}, deserializeCommitNumber);
}

class CommitNumbersReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, CommitNumbersReader,
    testing::Values(
        Row{"None", "[]", "[]"},
        Row{"InOrder", R"([{"commitNo": 2, "hash": "b"}, {"commitNo": 1, "hash": "a"}])", "[b is 2, a is 1]"},
        Row{"FirstError", "[" + kNumber + R"(, {"hash": ""}, 5])", missingMember("commit number", "commitNo")},
        Row{"NoObject", "[" + kNumber + ", true]", noObject("bool")},
        Row{"ThrowingElement", R"([{"commitNo": 1, "hash": 1.5}])", mismatch("string", "real", "hash")}),
    support::rowName);

TEST_P(CommitNumbersReader, TakesTheArrayAsItIs)
{
    EXPECT_EQ(outcomeOf([] { return deserializeCommitNumbers(array(GetParam().document)); }), GetParam().outcome);
}

class InitReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, InitReader,
    testing::Values(
        Row{"Complete", R"({"id": "42"})", "42"}, Row{"EmptyText", R"({"id": ""})", ""},
        Row{"UnknownMembers", R"({"id": "42", "name": 5})", "42"}, Row{"Empty", "{}", missingMember("init data", "id")},
        Row{"InOtherCase", R"({"Id": "42"})", missingMember("init data", "id")}),
    support::rowName);

TEST_P(InitReader, TakesTheObjectAsItIs)
{
    EXPECT_EQ(outcomeOf([] { return deserializeInitData(object(GetParam().document)); }), GetParam().outcome);
}

TEST(InitReader, ThrowsOverAnIdOfAnotherType)
{
    expectsTypes(R"({"id": "42"})", {{"id", "string"}}, deserializeInitData);
}

class ServerVersionReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, ServerVersionReader,
    testing::Values(
        Row{"Complete", R"({"commandVersion": "1.2"})", "1.2"},
        Row{"NotUnderstood", R"({"commandVersion": " x\n"})", " x\n"},
        Row{"UnknownMembers", R"({"commandVersion": "1.2", "version": 3})", "1.2"},
        Row{"TextBehind", R"({"commandVersion": "1.2"} and more)", "1.2"},
        Row{"EmptyObject", "{}", missingMember("server version", "commandVersion")},
        Row{"Number", R"({"commandVersion": 1})", mismatch("string", "int", "commandVersion")},
        Row{"Null", R"({"commandVersion": null})", mismatch("string", "null", "commandVersion")},
        Row{"Array", "[]", mismatch("object", "array", "")}, Row{"String", "\"1.2\"", mismatch("object", "string", "")},
        Row{"Empty", "", mismatch("object", "null", "")}, Row{"NoJson", "{1.2}", mismatch("object", "null", "")}),
    support::rowName);

TEST_P(ServerVersionReader, TakesTheTextAsItIs)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeServerVersion(support::fromUtf8(GetParam().document)); }), GetParam().outcome);
}

TEST(ServerVersionReader, TakesATextThatIsCutOffAnywhereForNull)
{
    std::string const whole = R"({"commandVersion": "1.2"})";
    for (std::size_t length = 0; length < whole.size(); ++length) {
        OdString const text = support::fromUtf8(whole.substr(0, length));
        EXPECT_EQ(outcomeOf([&] { return deserializeServerVersion(text); }), mismatch("object", "null", ""))
            << "cut at " << length;
    }
}

TEST(TranslatedServerReaders, SpeakTheLanguageOfTheUser)
{
    Translations const translations(
        {"Could not parse %ls, missing \"%ls\"", "fetch data", "commit number", "init data", "server version"});
    EXPECT_EQ(
        outcomeOf([] { return deserializeFetchData({}); }),
        "error: {Could not parse fetch data, missing \"repository\"}");
    EXPECT_EQ(
        outcomeOf([] { return deserializeFetchData(object(fetch(kRepository, kCommits))); }),
        "error: {Could not parse fetch data, missing \"references\"}");
    EXPECT_EQ(
        outcomeOf([] { return deserializeCommitNumber({}); }),
        "error: {Could not parse commit number, missing \"hash\"}");
    EXPECT_EQ(
        outcomeOf([] { return deserializeCommitNumber(object(R"({"hash": ""})")); }),
        "error: {Could not parse commit number, missing \"commitNo\"}");
    EXPECT_EQ(outcomeOf([] { return deserializeInitData({}); }), "error: {Could not parse init data, missing \"id\"}");
    EXPECT_EQ(
        outcomeOf([] { return deserializeServerVersion(L"{}"); }),
        "error: {Could not parse server version, missing \"commandVersion\"}");
}

} // namespace
