#include "tests/server/outcome.h"
#include "tests/server/translations.h"
#include "tests/support/rows.h"

#include <cmath>
#include <limits>
#include <memory>
#include <type_traits>
#include <utility>

namespace {

using namespace common;
using namespace server;

static_assert(std::is_base_of_v<MetaInfo, ParentInfo>);
static_assert(std::is_same_v<ReceivedFile, Versions<VersionedFile, std::shared_ptr<File>>>);
static_assert(std::is_copy_constructible_v<Commit> && std::is_nothrow_move_constructible_v<Commit>);

std::string missingMember(std::string const& what, std::string const& key)
{
    return "error: Could not parse " + what + ", missing \"" + key + "\"";
}

Commit someCommit()
{
    std::vector<ReceivedFile> files;
    files.emplace_back(VersionedFile{L"plan.dwg", L"tf:plan#1"});
    return {Annotation{L"ann", L"why", OdTimeStamp()}, std::move(files), {L"p", L"q"}, L"abc", 7};
}

TEST(Commit, IsCopiedWhole)
{
    Commit const commit = someCommit();
    std::vector<Commit> const copies(2, commit);
    EXPECT_EQ(inWords(copies[1]), inWords(commit));
    EXPECT_EQ(inWords(commit.files), "[plan.dwg in tf:plan#1]");
    EXPECT_EQ(inWords(commit.parents), "[p, q]");
}

TEST(Commit, TakesItsFilesOver)
{
    std::vector<ReceivedFile> files;
    files.emplace_back(VersionedFile{L"plan.dwg", L"tf:plan#1"});
    ReceivedFile const* const place = files.data();
    Commit commit(Annotation(), std::move(files), {}, L"", 0);
    EXPECT_EQ(commit.files.data(), place);
    Commit const moved = std::move(commit);
    EXPECT_EQ(moved.files.data(), place);
}

TEST(ParentInfo, KeepsTheHashesAsMetaInformation)
{
    std::unique_ptr<MetaInfo> const info = std::make_unique<ParentInfo>(std::vector<OdString>{L"p", L"q"});
    auto const* const parents = dynamic_cast<ParentInfo const*>(info.get());
    ASSERT_NE(parents, nullptr);
    EXPECT_EQ(inWords(parents->parents), "[p, q]");
}

std::string const kAnnotation = R"({"author": "ann", "date": 1.0, "message": "why"})";

std::string annotated(std::string const& date)
{
    return R"({"author": "ann", "date": )" + date + "}";
}

class AnnotationReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, AnnotationReader,
    testing::Values(
        Row{"Complete", kAnnotation, "ann said 'why' at 1"},
        Row{"WithoutMessage", annotated("2.0"), "ann said '' at 2"},
        Row{"UnknownMembers", R"({"author": "ann", "date": 1.0, "Message": 1, "email": null})", "ann said '' at 1"},
        Row{"LinesInMessage", R"({"author": "", "date": 1.0, "message": "a\nb\u0000c"})",
            std::string(" said 'a\nb\0c' at 1", 18)}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    MissingMembers, AnnotationReader,
    testing::Values(
        Row{"All", "{}", missingMember("annotation", "author")},
        Row{"Author", R"({"date": 1.0})", missingMember("annotation", "author")},
        Row{"AuthorBesideWrongOnes", R"({"date": 1, "message": 2})", missingMember("annotation", "author")},
        Row{"Date", R"({"author": "ann"})", missingMember("annotation", "date")},
        Row{"DateBesideWrongAuthor", R"({"author": 1})", missingMember("annotation", "date")},
        Row{"DateAfterTheMessageIsRead", R"({"author": "ann", "message": 5})", mismatch("string", "int", "message")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    WrongMembers, AnnotationReader,
    testing::Values(
        Row{"MessageFirst", R"({"author": 1, "date": 1, "message": 1})", mismatch("string", "int", "message")},
        Row{"DateNext", R"({"author": 1, "date": 1})", mismatch("real", "int", "date")},
        Row{"AuthorLast", R"({"author": 1, "date": 1.0})", mismatch("string", "int", "author")},
        Row{"NullMessage", R"({"author": "ann", "date": 1.0, "message": null})",
            mismatch("string", "null", "message")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    Dates, AnnotationReader,
    testing::Values(
        Row{"TruncatedDown", annotated("1.9"), "ann said '' at 1"},
        Row{"TruncatedUp", annotated("-1.9"), "ann said '' at -1"},
        Row{"SmallFraction", annotated("0.9999999"), "ann said '' at 0"},
        Row{"SmallNegativeFraction", annotated("-0.9999999"), "ann said '' at 0"},
        Row{"WithExponent", annotated("17096476e2"), "ann said '' at 1709647600"},
        Row{"EmptyFraction", annotated("5."), "ann said '' at 5"},
        Row{"Integer", annotated("1709647629"), mismatch("real", "int", "date")},
        Row{"NegativeInteger", annotated("-1"), mismatch("real", "int", "date")},
        Row{"Text", annotated("\"2024-03-05T14:07:09Z\""), mismatch("real", "string", "date")},
        Row{"Null", annotated("null"), mismatch("real", "null", "date")},
        Row{"LastOneThatFits", annotated("9223372036854774784.0"), "ann said '' at 9223372036854774784"},
        Row{"FirstOneTooLarge", annotated("9223372036854775808.0"), "ann said '' at 9223372036854775807"},
        Row{"Smallest", annotated("-9223372036854775808.0"), "ann said '' at -9223372036854775808"},
        Row{"FirstOneTooSmall", annotated("-9223372036854777856.0"), "ann said '' at -9223372036854775808"},
        Row{"Huge", annotated("1e300"), "ann said '' at 9223372036854775807"},
        Row{"HugeNegative", annotated("-1e300"), "ann said '' at -9223372036854775808"},
        Row{"Infinite", annotated("1e999"), "ann said '' at 9223372036854775807"},
        Row{"InfiniteNegative", annotated("-1e999"), "ann said '' at -9223372036854775808"},
        Row{"Tiny", annotated("1e-999"), "ann said '' at 0"}),
    support::rowName);

TEST_P(AnnotationReader, TakesTheObjectAsItIs)
{
    EXPECT_EQ(outcomeOf([] { return deserializeAnnotation(object(GetParam().document)); }), GetParam().outcome);
}

TEST(AnnotationReader, ThrowsOverEveryMemberOfAnotherType)
{
    expectsTypes(kAnnotation, {{"author", "string"}, {"date", "real"}, {"message", "string"}}, deserializeAnnotation);
}

TEST(AnnotationReader, TakesWhatIsNoNumberForTheBeginningOfTime)
{
    Object document = object(kAnnotation);
    for (double const nan : {std::numeric_limits<double>::quiet_NaN(), -std::numeric_limits<double>::quiet_NaN()}) {
        document[L"date"] = nan;
        EXPECT_EQ(outcomeOf([&] { return deserializeAnnotation(document); }), "ann said 'why' at 0");
    }
}

class ParentHashesReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, ParentHashesReader,
    testing::Values(
        Row{"None", "[]", "[]"}, Row{"InOrder", R"(["b", "a", "", "b"])", "[b, a, , b]"},
        Row{"Object", "[{}]", "error: Could not parse parent hash, object type found."},
        Row{"Array", "[[]]", "error: Could not parse parent hash, array type found."},
        Row{"Bool", "[true]", "error: Could not parse parent hash, bool type found."},
        Row{"Int", "[1]", "error: Could not parse parent hash, int type found."},
        Row{"Real", "[1.0]", "error: Could not parse parent hash, real type found."},
        Row{"Null", "[null]", "error: Could not parse parent hash, null type found."},
        Row{"FirstWrongOne", R"(["a", 1.5, null])", "error: Could not parse parent hash, real type found."}),
    support::rowName);

TEST_P(ParentHashesReader, TakesTheArrayAsItIs)
{
    EXPECT_EQ(outcomeOf([] { return deserializeParentHashes(array(GetParam().document)); }), GetParam().outcome);
}

TEST(ParentHashesReader, SpeaksTheLanguageOfTheUserButNamesTypesInEnglish)
{
    Translations const translations({"Could not parse parent hash, %ls type found.", "int"});
    EXPECT_EQ(
        outcomeOf([] { return deserializeParentHashes(array("[1]")); }),
        "error: {Could not parse parent hash, int type found.}");
}

std::string const kFile = R"({"path": "plan.dwg", "storagePath": "tf:plan#1"})";

std::string renamedFrom(std::string const& previousPath)
{
    return R"({"path": "plan.dwg", "storagePath": "tf:plan#1", "previousPath": )" + previousPath + "}";
}

class ReceivedFileReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, ReceivedFileReader,
    testing::Values(
        Row{"Complete", kFile, "plan.dwg in tf:plan#1"},
        Row{"EmptyTexts", R"({"path": "", "storagePath": ""})", " in "},
        Row{"UnknownMembers", R"({"path": "a", "storagePath": "b", "previouspath": 1, "size": {}})", "a in b"},
        Row{"PreviousPath", renamedFrom("\"draft.dwg\""), "plan.dwg in tf:plan#1"},
        Row{"SamePreviousPath", renamedFrom("\"plan.dwg\""), "plan.dwg in tf:plan#1"},
        Row{"EmptyPreviousPath", renamedFrom("\"\""), "plan.dwg in tf:plan#1"},
        Row{"NullPreviousPath", renamedFrom("null"), "plan.dwg in tf:plan#1"},
        Row{"NumberAsPreviousPath", renamedFrom("1"), mismatch("string", "int", "")},
        Row{"RealAsPreviousPath", renamedFrom("1.5"), mismatch("string", "real", "")},
        Row{"BoolAsPreviousPath", renamedFrom("false"), mismatch("string", "bool", "")},
        Row{"ObjectAsPreviousPath", renamedFrom("{}"), mismatch("string", "object", "")},
        Row{"ArrayAsPreviousPath", renamedFrom("[]"), mismatch("string", "array", "")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    MissingAndWrongMembers, ReceivedFileReader,
    testing::Values(
        Row{"Both", "{}", missingMember("repo file", "storagePath")},
        Row{"StoragePath", R"({"path": "a"})", missingMember("repo file", "storagePath")},
        Row{"Path", R"({"storagePath": "b"})", missingMember("repo file", "path")},
        Row{"PathBesideWrongOnes", R"({"storagePath": 1, "previousPath": 2})", missingMember("repo file", "path")},
        Row{"PathFirst", R"({"path": 1, "storagePath": 2, "previousPath": 3})", mismatch("string", "int", "path")},
        Row{"StoragePathNext", R"({"path": "a", "storagePath": null, "previousPath": 3})",
            mismatch("string", "null", "storagePath")}),
    support::rowName);

TEST_P(ReceivedFileReader, LeavesNoTraceOfPreviousPathsAndParents)
{
    std::vector<OdString> const parents = {L"p", L"q"};
    EXPECT_EQ(outcomeOf([&] { return deserializeRepoFile(object(GetParam().document), parents); }), GetParam().outcome);
    EXPECT_EQ(inWords(parents), "[p, q]");
}

TEST(ReceivedFileReader, ThrowsOverEveryMemberOfAnotherType)
{
    expectsTypes(kFile, {{"path", "string"}, {"storagePath", "string"}}, [](Object const& document) {
        return deserializeRepoFile(document, {});
    });
}

/// A commit of these members; an empty text leaves the member out.
std::string commitOf(
    std::string const& annotation, std::string const& parents, std::string const& files, std::string const& hash,
    std::string const& commitNo)
{
    std::string text;
    std::pair<char const*, std::string> const members[] = {
        {"annotation", annotation},
        {"parentsHashes", parents},
        {"files", files},
        {"hash", hash},
        {"commitNo", commitNo}};
    for (auto const& [key, value] : members) {
        if (!value.empty()) {
            text += (text.empty() ? "\"" : ", \"") + std::string(key) + "\": " + value;
        }
    }
    return "{" + text + "}";
}

std::string const kParents = R"(["p", "q"])";
std::string const kFiles = "[" + kFile + ", " + renamedFrom("\"draft.dwg\"") + "]";
std::string const kHash = "\"abc\"";
std::string const kCommit = commitOf(kAnnotation, kParents, kFiles, kHash, "7");

std::string numbered(std::string const& commitNo)
{
    return commitOf(annotated("1.0"), "", "[]", "\"a\"", commitNo);
}

class CommitReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, CommitReader,
    testing::Values(
        Row{"Complete", kCommit, "7 abc of [p, q]: ann said 'why' at 1 [plan.dwg in tf:plan#1, plan.dwg in tf:plan#1]"},
        Row{"NoParentsMember", commitOf(kAnnotation, "", "[]", kHash, "7"), "7 abc of []: ann said 'why' at 1 []"},
        Row{"NoParents", commitOf(kAnnotation, "[]", "[]", kHash, "7"), "7 abc of []: ann said 'why' at 1 []"},
        Row{"UnknownMembers", commitOf(kAnnotation, "", R"([], "parents": 5, "Hash": null)", kHash, "7"),
            "7 abc of []: ann said 'why' at 1 []"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    Numbers, CommitReader,
    testing::Values(
        Row{"Negative", numbered("-1"), "-1 a of []: ann said '' at 1 []"},
        Row{"Largest", numbered("2147483647"), "2147483647 a of []: ann said '' at 1 []"},
        Row{"LowBits", numbered("4294967297"), "1 a of []: ann said '' at 1 []"},
        Row{"SignBit", numbered("2147483648"), "-2147483648 a of []: ann said '' at 1 []"},
        Row{"Unsigned64", numbered("18446744073709551615"), "-1 a of []: ann said '' at 1 []"},
        Row{"TooLarge", numbered("99999999999999999999999"), "-1 a of []: ann said '' at 1 []"},
        Row{"TooSmall", numbered("-99999999999999999999999"), "0 a of []: ann said '' at 1 []"},
        Row{"Real", numbered("7.0"), mismatch("int", "real", "commitNo")},
        Row{"Infinite", numbered("1e999"), mismatch("int", "real", "commitNo")},
        Row{"Text", numbered("\"7\""), mismatch("int", "string", "commitNo")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    MissingMembers, CommitReader,
    testing::Values(
        Row{"All", "{}", missing("annotation")},
        Row{"Annotation", commitOf("", "[1]", "[{}]", "", ""), missing("annotation")},
        Row{"InAnnotation", commitOf("{}", "[1]", "[{}]", "", ""), missingMember("annotation", "author")},
        Row{"Files", commitOf(kAnnotation, kParents, "", "", ""), missing("files")},
        Row{"InFiles", commitOf(kAnnotation, kParents, "[{}]", "", ""), missingMember("repo file", "storagePath")},
        Row{"HashAndNumber", commitOf(kAnnotation, kParents, kFiles, "", ""), missingMember("commit", "hash")},
        Row{"Hash", commitOf(kAnnotation, kParents, kFiles, "", "7"), missingMember("commit", "hash")},
        Row{"Number", commitOf(kAnnotation, kParents, kFiles, kHash, ""), missingMember("commit", "commitNo")},
        Row{"NumberBesideWrongHash", commitOf(kAnnotation, kParents, kFiles, "1", ""),
            missingMember("commit", "commitNo")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    WrongMembers, CommitReader,
    testing::Values(
        Row{"AnnotationFirst", commitOf("[]", "1", "1", "1", "\"1\""), mismatch("object", "array", "annotation")},
        Row{"InAnnotation", commitOf(annotated("1"), "1", "1", "1", "\"1\""), mismatch("real", "int", "date")},
        Row{"ParentsNext", commitOf(kAnnotation, "1", "1", "1", "\"1\""), mismatch("array", "int", "parentsHashes")},
        Row{"NullParents", commitOf(kAnnotation, "null", kFiles, kHash, "7"),
            mismatch("array", "null", "parentsHashes")},
        Row{"InParents", commitOf(kAnnotation, R"(["p", 1])", "1", "1", "\"1\""),
            "error: Could not parse parent hash, int type found."},
        Row{"FilesNext", commitOf(kAnnotation, kParents, "{}", "1", "\"1\""), mismatch("array", "object", "files")},
        Row{"NoObjectInFiles", commitOf(kAnnotation, kParents, "[" + kFile + ", 5]", "1", "\"1\""), noObject("int")},
        Row{"InFiles", commitOf(kAnnotation, kParents, "[" + renamedFrom("1") + "]", "1", "\"1\""),
            mismatch("string", "int", "")},
        Row{"HashNext", commitOf(kAnnotation, kParents, kFiles, "1", "\"1\""), mismatch("string", "int", "hash")},
        Row{"NumberLast", commitOf(kAnnotation, kParents, kFiles, kHash, "\"1\""),
            mismatch("int", "string", "commitNo")}),
    support::rowName);

TEST_P(CommitReader, TakesTheObjectAsItIs)
{
    EXPECT_EQ(outcomeOf([] { return deserializeCommit(object(GetParam().document)); }), GetParam().outcome);
}

TEST(CommitReader, ThrowsOverEveryMemberOfAnotherType)
{
    expectsTypes(
        kCommit,
        {{"annotation", "object"},
         {"commitNo", "int"},
         {"files", "array"},
         {"hash", "string"},
         {"parentsHashes", "array"}},
        deserializeCommit);
}

class TranslatedCommitReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Messages, TranslatedCommitReader,
    testing::Values(
        Row{"Author", commitOf("{}", "", "", "", ""), "error: {Could not parse annotation, missing \"author\"}"},
        Row{"Date", commitOf(R"({"author": ""})", "", "", "", ""),
            "error: {Could not parse annotation, missing \"date\"}"},
        Row{"StoragePath", commitOf(kAnnotation, "", "[{}]", "", ""),
            "error: {Could not parse repo file, missing \"storagePath\"}"},
        Row{"Path", commitOf(kAnnotation, "", R"([{"storagePath": ""}])", "", ""),
            "error: {Could not parse repo file, missing \"path\"}"},
        Row{"Hash", commitOf(kAnnotation, "", "[]", "", ""), "error: {Could not parse commit, missing \"hash\"}"},
        Row{"Number", commitOf(kAnnotation, "", "[]", kHash, ""),
            "error: {Could not parse commit, missing \"commitNo\"}"},
        Row{"ElementsAreNot", commitOf(kAnnotation, "", "[5]", "", ""), noObject("int")},
        Row{"MissingKeysAreNot", commitOf(kAnnotation, "", "", "", ""), missing("files")}),
    support::rowName);

TEST_P(TranslatedCommitReader, SpeaksTheLanguageOfTheUser)
{
    Translations const translations(
        {"Could not parse %ls, missing \"%ls\"", "annotation", "repo file", "commit", "hash",
         "Encounterd '%ls', found '%ls. While %ls'", "Unable to find json key '%ls'", "parsing json vector."});
    EXPECT_EQ(outcomeOf([] { return deserializeCommit(object(GetParam().document)); }), GetParam().outcome);
}

} // namespace
