#include "tests/server/outcome.h"
#include "tests/server/translations.h"
#include "tests/support/rows.h"
#include "tests/support/utf8.h"

#include "common/mu_common_json_keys.h"

#include <type_traits>

namespace {

using namespace common;
using namespace server;

static_assert(std::is_same_v<std::underlying_type_t<EType>, std::int32_t>);
static_assert(static_cast<int>(EType::branch) == 0);
static_assert(static_cast<int>(EType::tag) == 1);
static_assert(std::is_aggregate_v<Annotation> && std::is_aggregate_v<RepoData>);
static_assert(std::is_base_of_v<OdError, JsonParseError>);

TEST(Reference, IsUnannotatedUnlessToldOtherwise)
{
    Reference const reference(L"main", L"abc", EType::tag);
    EXPECT_EQ(inWords(reference), "tag main -> abc");
    EXPECT_FALSE(reference.annotation.has_value());
}

TEST(Reference, CopiesItsAnnotation)
{
    boost::optional<Annotation> annotation = Annotation{L"ann", L"why", OdTimeStamp()};
    Reference const reference(L"main", L"abc", EType::branch, annotation);
    annotation->author = L"bob";
    ASSERT_TRUE(reference.annotation.has_value());
    EXPECT_EQ(inWords(reference.annotation->author), "ann");
    EXPECT_EQ(inWords(reference.annotation->message), "why");
}

TEST(Reference, IsCopiedWithItsAnnotation)
{
    Reference const reference(L"main", L"abc", EType::branch, Annotation{L"ann", L"why", OdTimeStamp()});
    std::vector<Reference> const copies(2, reference);
    EXPECT_EQ(inWords(copies[1]), inWords(reference));
}

TEST(Reference, KnowsItsTypesByTheSharedKeys)
{
    EXPECT_EQ(inWords(toType(json::s_ref_branch_type)), "0");
    EXPECT_EQ(inWords(toType(json::s_ref_tag_type)), "1");
    EXPECT_EQ(inWords(json::s_ref_branch_type), "branch");
    EXPECT_EQ(inWords(json::s_ref_tag_type), "tag");
    EXPECT_EQ(inWords(json::s_ref_type), "type");
}

class ReferenceType : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Texts, ReferenceType,
    testing::Values(
        Row{"Branch", "branch", "0"}, Row{"Tag", "tag", "1"},
        Row{"CapitalisedBranch", "Branch", "error: Unsupported type: Branch"},
        Row{"CapitalTag", "TAG", "error: Unsupported type: TAG"},
        Row{"LongerBranch", "branches", "error: Unsupported type: branches"},
        Row{"Blank", "tag ", "error: Unsupported type: tag "}, Row{"Nothing", "", "error: Unsupported type: "},
        Row{"Placeholder", "%ls%n", "error: Unsupported type: %ls%n"},
        Row{"BeyondAscii", "Zweig \u00FC", "error: Unsupported type: Zweig \u00FC"}),
    support::rowName);

TEST_P(ReferenceType, IsToldByItsText)
{
    EXPECT_EQ(inWords(toType(support::fromUtf8(GetParam().document))), GetParam().outcome);
}

std::string const kReference = R"({"commitHash": "abc", "name": "main", "refType": "branch"})";

std::string withAnnotation(std::string const& annotation)
{
    return R"({"commitHash": "abc", "name": "main", "refType": "branch", "annotation": )" + annotation + "}";
}

class ReferenceReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, ReferenceReader,
    testing::Values(
        Row{"Branch", kReference, "branch main -> abc"},
        Row{"Tag", R"({"commitHash": "abc", "name": "v1", "refType": "tag"})", "tag v1 -> abc"},
        Row{"EmptyTexts", R"({"commitHash": "", "name": "", "refType": "tag"})", "tag  -> "},
        Row{"NulInName", R"({"commitHash": "abc", "name": "a\u0000b", "refType": "tag"})",
            std::string("tag a\0b -> abc", 14)},
        Row{"LoneSurrogateInName", R"({"commitHash": "abc", "name": "\ud800", "refType": "tag"})",
            "tag \xED\xA0\x80 -> abc"},
        Row{"UnknownMembers", R"({"commitHash": "abc", "name": "v1", "refType": "tag", "type": 7, "Name": []})",
            "tag v1 -> abc"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    MissingMembers, ReferenceReader,
    testing::Values(
        Row{"AllThree", "{}", "error: No commitHash found in reference."},
        Row{"NameAndType", R"({"commitHash": "abc"})", "error: No name found in reference."},
        Row{"Type", R"({"commitHash": "abc", "name": "v1"})", "error: No reference type found in reference."},
        Row{"Name", R"({"commitHash": "abc", "refType": "tag"})", "error: No name found in reference."},
        Row{"Hash", R"({"name": "v1", "refType": "tag"})", "error: No commitHash found in reference."},
        Row{"HashAndName", R"({"refType": "tag"})", "error: No commitHash found in reference."},
        Row{"TypeUnderAnotherKey", R"({"commitHash": "abc", "name": "v1", "type": "tag"})",
            "error: No reference type found in reference."},
        Row{"HashInOtherCase", R"({"commithash": "abc", "name": "v1", "refType": "tag"})",
            "error: No commitHash found in reference."},
        Row{"TypeBesideWrongOnes", R"({"commitHash": 1, "name": 2})", "error: No reference type found in reference."}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    WrongMembers, ReferenceReader,
    testing::Values(
        Row{"UnknownType", R"({"commitHash": "abc", "name": "v1", "refType": "Branch"})",
            "error: Unsupported type: Branch"},
        Row{"UnknownTypeBesideWrongName", R"({"commitHash": 1, "name": 2, "refType": "x"})",
            "error: Unsupported type: x"},
        Row{"TypeFirst", R"({"commitHash": 1, "name": 2, "refType": 3})", mismatch("string", "int", "refType")},
        Row{"NameNext", R"({"commitHash": 1, "name": null, "refType": "tag"})", mismatch("string", "null", "name")},
        Row{"HashLast", R"({"commitHash": true, "name": "v1", "refType": "tag"})",
            mismatch("string", "bool", "commitHash")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    Annotations, ReferenceReader,
    testing::Values(
        Row{"Complete", withAnnotation(R"({"author": "ann", "date": 1.5, "message": "why"})"), "branch main -> abc"},
        Row{"WithoutAuthor", withAnnotation(R"({"date": 1.5})"), "branch main -> abc"},
        Row{"WithoutDate", withAnnotation(R"({"author": "ann"})"), "branch main -> abc"},
        Row{"Empty", withAnnotation("{}"), "branch main -> abc"},
        Row{"String", withAnnotation(R"("ann")"), "branch main -> abc"},
        Row{"Null", withAnnotation("null"), "branch main -> abc"},
        Row{"Array", withAnnotation(R"([{"date": "now"}])"), "branch main -> abc"},
        Row{"Number", withAnnotation("7"), "branch main -> abc"},
        Row{"Real", withAnnotation("7.5"), "branch main -> abc"},
        Row{"Bool", withAnnotation("true"), "branch main -> abc"},
        Row{"TextDate", withAnnotation(R"({"author": "ann", "date": "2024-03-05"})"),
            mismatch("real", "string", "date")},
        Row{"IntegerDate", withAnnotation(R"({"author": "ann", "date": 5})"), mismatch("real", "int", "date")},
        Row{"TextDateWithoutAuthor", withAnnotation(R"({"date": "now"})"), "branch main -> abc"},
        Row{"WrongMessage", withAnnotation(R"({"author": "ann", "message": 1})"), mismatch("string", "int", "message")},
        Row{"WrongAuthor", withAnnotation(R"({"author": [], "date": 1.5})"), mismatch("string", "array", "author")},
        Row{"WrongBeforeMissingMembers", R"({"annotation": {"author": "ann", "date": false}})",
            mismatch("real", "bool", "date")}),
    support::rowName);

TEST_P(ReferenceReader, TakesTheDocumentAsItIs)
{
    EXPECT_EQ(outcomeOf([] { return deserializeReference(object(GetParam().document)); }), GetParam().outcome);
}

TEST(ReferenceReader, ThrowsOverEveryMemberOfAnotherType)
{
    expectsTypes(
        kReference, {{"commitHash", "string"}, {"name", "string"}, {"refType", "string"}}, deserializeReference);
}

TEST(ReferenceReader, DoesNotChangeTheAnnotationThatItReads)
{
    Object const document = object(withAnnotation(R"({"author": "ann", "date": 1.5})"));
    Object const before = document;
    EXPECT_TRUE(deserializeReference(document).hasValue());
    EXPECT_EQ(Value(document), Value(before));
}

class ReferencesReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, ReferencesReader,
    testing::Values(
        Row{"None", "[]", "[]"}, Row{"One", "[" + kReference + "]", "[branch main -> abc]"},
        Row{"TwoInOrder",
            R"([{"commitHash": "b", "name": "z", "refType": "tag"}, {"commitHash": "a", "name": "y", "refType": "branch"}])",
            "[tag z -> b, branch y -> a]"},
        Row{"TwiceTheSame", "[" + kReference + "," + kReference + "]", "[branch main -> abc, branch main -> abc]"},
        Row{"TextBehind", "[] and more", "[]"}, Row{"Blanks", " \t\r\n[ ] ", "[]"},
        Row{"FirstError", "[" + kReference + R"(, {"commitHash": "abc"}, {}, 5])",
            "error: No name found in reference."},
        Row{"NoObject", "[" + kReference + ", 5]", noObject("int")}, Row{"NestedArray", "[[]]", noObject("array")},
        Row{"NullElement", "[null, {}]", noObject("null")},
        Row{"ThrowingElement", R"([{"annotation": {"author": 1, "date": 1.0}}])", mismatch("string", "int", "author")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OtherTexts, ReferencesReader,
    testing::Values(
        Row{"Object", "{}", mismatch("array", "object", "")}, Row{"Empty", "", mismatch("array", "null", "")},
        Row{"Blanks", "  ", mismatch("array", "null", "")}, Row{"Null", "null", mismatch("array", "null", "")},
        Row{"String", "\"[]\"", mismatch("array", "string", "")}, Row{"Int", "7", mismatch("array", "int", "")},
        Row{"Real", "7.0", mismatch("array", "real", "")}, Row{"Bool", "false", mismatch("array", "bool", "")},
        Row{"NoJson", "references", mismatch("array", "null", "")},
        Row{"LoneComma", "[,]", mismatch("array", "null", "")},
        Row{"Nul", std::string("\0[]", 3), mismatch("array", "null", "")}),
    support::rowName);

TEST_P(ReferencesReader, TakesTheTextAsItIs)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeReferences(support::fromUtf8(GetParam().document)); }), GetParam().outcome);
}

TEST(ReferencesReader, TakesATextThatIsCutOffAnywhereForNull)
{
    std::string const whole = "[" + kReference + ", " + withAnnotation(R"({"author": "ann", "date": 1.5})") + "]";
    for (std::size_t length = 0; length < whole.size(); ++length) {
        OdString const text = support::fromUtf8(whole.substr(0, length));
        EXPECT_EQ(outcomeOf([&] { return deserializeReferences(text); }), mismatch("array", "null", ""))
            << "cut at " << length;
    }
}

std::string const kRepository = R"({"id": "42", "name": "bridge"})";

class RepositoryReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, RepositoryReader,
    testing::Values(
        Row{"Complete", kRepository, "bridge is 42 ''"}, Row{"EmptyTexts", R"({"id": "", "name": ""})", " is  ''"},
        Row{"UnknownMembers", R"({"id": "42", "name": "bridge", "description": "over the river"})", "bridge is 42 ''"},
        Row{"Empty", "{}", "error: Could not parse repo data, missing \"name\""},
        Row{"WithoutName", R"({"id": "42"})", "error: Could not parse repo data, missing \"name\""},
        Row{"WithoutId", R"({"name": "bridge"})", "error: Could not parse repo data, missing \"id\""},
        Row{"WithoutIdBesideWrongName", R"({"name": 1})", "error: Could not parse repo data, missing \"id\""},
        Row{"NameFirst", R"({"id": 1, "name": 1.5})", mismatch("string", "real", "name")},
        Row{"IdLast", R"({"id": 1, "name": "bridge"})", mismatch("string", "int", "id")}),
    support::rowName);

TEST_P(RepositoryReader, TakesTheObjectAsItIs)
{
    EXPECT_EQ(outcomeOf([] { return deserializeRepoData(object(GetParam().document)); }), GetParam().outcome);
}

TEST_P(RepositoryReader, TakesTheTextAsTheObjectInIt)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeRepoData(support::fromUtf8(GetParam().document)); }), GetParam().outcome);
}

TEST(RepositoryReader, ThrowsOverEveryMemberOfAnotherType)
{
    expectsTypes(kRepository, {{"id", "string"}, {"name", "string"}}, [](Object const& document) {
        return deserializeRepoData(document);
    });
}

class RepositoryTextReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    OtherTexts, RepositoryTextReader,
    testing::Values(
        Row{"Array", "[]", mismatch("object", "array", "")}, Row{"Empty", "", mismatch("object", "null", "")},
        Row{"NoJson", "{\"name\"}", mismatch("object", "null", "")}, Row{"Int", "7", mismatch("object", "int", "")}),
    support::rowName);

TEST_P(RepositoryTextReader, ThrowsOverATextThatHoldsNoObject)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeRepoData(support::fromUtf8(GetParam().document)); }), GetParam().outcome);
}

class RepositoriesReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, RepositoriesReader,
    testing::Values(
        Row{"None", "[]", "[]"},
        Row{"TwoInOrder", R"([{"id": "2", "name": "b"}, {"id": "1", "name": "a"}])", "[b is 2 '', a is 1 '']"},
        Row{"FirstError", "[" + kRepository + R"(, {"name": "x"}, {}])",
            "error: Could not parse repo data, missing \"id\""},
        Row{"NoObject", "[" + kRepository + R"(, "x"])", noObject("string")},
        Row{"ThrowingElement", R"([{"id": [], "name": "x"}])", mismatch("string", "array", "id")},
        Row{"Object", "{}", mismatch("array", "object", "")}, Row{"Empty", "", mismatch("array", "null", "")}),
    support::rowName);

TEST_P(RepositoriesReader, TakesTheTextAsItIs)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeRepoDatas(support::fromUtf8(GetParam().document)); }), GetParam().outcome);
}

class TranslatedReferenceReader : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Messages, TranslatedReferenceReader,
    testing::Values(
        Row{"Hash", "{}", "error: {No commitHash found in reference.}"},
        Row{"Name", R"({"commitHash": ""})", "error: {No name found in reference.}"},
        Row{"Type", R"({"commitHash": "", "name": ""})", "error: {No reference type found in reference.}"},
        Row{"UnsupportedTypeIsNot", R"({"commitHash": "", "name": "", "refType": "x"})", "error: Unsupported type: x"},
        Row{"WrongTypeIsNot", R"({"commitHash": "", "name": "", "refType": 1})", mismatch("string", "int", "refType")}),
    support::rowName);

TEST_P(TranslatedReferenceReader, SpeaksTheLanguageOfTheUser)
{
    Translations const translations(
        {"No commitHash found in reference.", "No name found in reference.", "No reference type found in reference.",
         "Unsupported type: %ls", "Error:\tExpected json type '%ls', found '%ls'", "\njson key:\t\"%ls\""});
    EXPECT_EQ(outcomeOf([] { return deserializeReference(object(GetParam().document)); }), GetParam().outcome);
}

TEST(TranslatedRepositoryReader, FillsPlaceholdersAfterTheTranslation)
{
    Translations const translations({"Could not parse %ls, missing \"%ls\"", "repo data", "name"});
    EXPECT_EQ(
        outcomeOf([] { return deserializeRepoData(Object()); }),
        "error: {Could not parse repo data, missing \"name\"}");
}

} // namespace
