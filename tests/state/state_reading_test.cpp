#include "tests/state/golden.h"
#include "tests/state/states.h"
#include "tests/support/rows.h"

#include <gmock/gmock.h>
#include <string>

namespace {

using namespace states;
using testing::ElementsAre;
using testing::IsEmpty;

struct Row {
    char const* name;
    std::string document;
    std::string outcome;
};

void PrintTo(Row const& row, std::ostream* out)
{
    *out << row.document;
}

/// A document of HEAD on "master" and `members`.
std::string withHead(std::string const& members)
{
    return R"({"head": {"reference": "master"}, )" + members + "}";
}

std::string staged(std::string const& elements)
{
    return withHead(R"("staged_files": [)" + elements + "]");
}

std::string renames(std::string const& elements)
{
    return withHead(R"("renames": [)" + elements + "]");
}

std::string indexed(std::string const& elements)
{
    return withHead(R"("index": [)" + elements + "]");
}

std::string noObject(std::string const& found, std::string const& container)
{
    return "error: Encounterd 'object', found '" + found + ". While parsing json " + container + ".'";
}

std::string const kNoHead = "error: State does not contain HEAD.";
std::string const kNoBranch = "error: HEAD does not point to a branch";
std::string const kOddChange = "error: Unsupported file change enum: ";
std::string const kGoodIndexEntry = R"({"data": {"last_checked": 1, "modified": false}, "path": "a"})";

class StateReading : public testing::TestWithParam<Row> {
protected:
    void expectOutcome() const
    {
        Repository const repository(GetParam().document);
        EXPECT_EQ(repository.loaded(), GetParam().outcome);
        EXPECT_EQ(repository.stateFile(), GetParam().document);
        EXPECT_THAT(repository.list(), ElementsAre(".tav/", ".tav/tav.state"));
        EXPECT_THAT(repository.calls(), IsEmpty());
    }
};

TEST_P(StateReading, ComesTo)
{
    expectOutcome();
}

INSTANTIATE_TEST_SUITE_P(
    OfHead, StateReading,
    testing::Values(
        Row{"Fresh", R"({"head": {"reference": "master"}})", "HEAD master\n"},
        Row{"NamelessBranch", R"({"head": {"reference": ""}})", "HEAD \n"},
        Row{"OtherBranch", R"({"head": {"reference": "b\u00fcro/dach"}})", "HEAD b\xC3\xBCro/dach\n"},
        Row{"EmptyDocument", "{}", kNoHead},
        Row{"OtherMembersOnly", R"({"index": [], "HEAD": {"reference": "master"}})", kNoHead},
        Row{"HeadIsLookedForFirst", R"({"staged_files": 5, "renames": 5, "index": 5})", kNoHead},
        Row{"EmptyHead", R"({"head": {}})", kNoBranch},
        Row{"BranchIsLookedForBeforeCommit", R"({"head": {"commit": 17, "Reference": "master"}})", kNoBranch},
        Row{"BranchIsReadBeforeCommit", R"({"head": {"commit": 17, "reference": 5}})",
            mismatch("string", "int", "reference")},
        Row{"HeadIsReadBeforeTheLists", R"({"head": {"reference": 5}, "staged_files": 5})",
            mismatch("string", "int", "reference")},
        Row{"LastOfTwoHeads", R"({"head": {"reference": "a"}, "head": {"reference": "b"}})", "HEAD b\n"},
        Row{"UnknownMembersAreIgnored",
            R"({"head": {"reference": "a", "tag": [1], "references": {}}, "staged_references": 5, "Index": 5})",
            "HEAD a\n"}),
    support::rowName);

// The number is looked up as "head", though it is written as "commit".
INSTANTIATE_TEST_SUITE_P(
    OfHeadCommit, StateReading,
    testing::Values(
        Row{"CommitAloneIsRefused", R"({"head": {"commit": 17, "reference": "a"}})", missing("head")},
        Row{"CommitOfAnyKindIsRefused", R"({"head": {"commit": null, "reference": "a"}})", missing("head")},
        Row{"HeadAloneIsIgnored", R"({"head": {"head": 5, "reference": "a"}})", "HEAD a\n"},
        Row{"HeadOfAnyKindAloneIsIgnored", R"({"head": {"head": "x", "reference": "a"}})", "HEAD a\n"},
        Row{"HeadBesideCommitIsTheNumber", R"({"head": {"commit": 17, "head": 5, "reference": "a"}})", "HEAD a 5\n"},
        Row{"CommitIsNotLookedAt", R"({"head": {"commit": "x", "head": 0, "reference": "a"}})", "HEAD a 0\n"},
        Row{"LargestNumber", R"({"head": {"commit": 1, "head": 18446744073709551615, "reference": "a"}})",
            "HEAD a 18446744073709551615\n"},
        Row{"TooLargeNumberIsTheLargest",
            R"({"head": {"commit": 1, "head": 99999999999999999999999999, "reference": "a"}})",
            "HEAD a 18446744073709551615\n"},
        Row{"NegativeNumberGivesItsBits", R"({"head": {"commit": 1, "head": -1, "reference": "a"}})",
            "HEAD a 18446744073709551615\n"},
        Row{"HeadMustBeAnInteger", R"({"head": {"commit": 1, "head": 5.0, "reference": "a"}})",
            mismatch("int", "real", "head")},
        Row{"ErrorComesBeforeThoseOfTheLists", R"({"head": {"commit": 17, "reference": "a"}, "staged_files": 5})",
            missing("head")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OfStagedFiles, StateReading,
    testing::Values(
        Row{"None", staged(""), "HEAD master\n"},
        Row{"EachChange", staged(R"({"file_change": "added", "path": "a"}, {"file_change": "modified", "path": "b"},
                      {"file_change": "removed", "path": "c"})"),
            "HEAD master\nstaged added a\nstaged modified b\nstaged removed c\n"},
        Row{"OrderStaysAndNothingIsMerged",
            staged(R"({"file_change": "added", "path": "z"}, {"file_change": "added", "path": "a"},
                      {"file_change": "removed", "path": "z"}, {"file_change": "added", "path": "z"})"),
            "HEAD master\nstaged added z\nstaged added a\nstaged removed z\nstaged added z\n"},
        Row{"PathWithoutCharacters", staged(R"({"file_change": "added", "path": ""})"), "HEAD master\nstaged added \n"},
        Row{"UnknownMembersAreIgnored", staged(R"({"file_change": "added", "path": "a", "hash": 5})"),
            "HEAD master\nstaged added a\n"},
        Row{"ElementIsNoObject", staged(R"({"file_change": "added", "path": "a"}, 5)"), noObject("int", "vector")},
        Row{"ChangeIsMissing", staged(R"({"path": "a"})"), missing("file_change")},
        Row{"PathIsMissing", staged(R"({"file_change": "added"})"), missing("path")},
        Row{"ChangeIsReadBeforePath", staged("{}"), missing("file_change")},
        Row{"UnknownChange", staged(R"({"file_change": "renamed", "path": "a"})"), kOddChange + "renamed"},
        Row{"ChangeInAnotherCase", staged(R"({"file_change": "Added", "path": "a"})"), kOddChange + "Added"},
        Row{"ChangeWithoutCharacters", staged(R"({"file_change": "", "path": "a"})"), kOddChange},
        Row{"ChangeThatLooksLikeAFormat", staged(R"({"file_change": "%ls%n", "path": "a"})"), kOddChange + "%ls%n"},
        Row{"UnknownChangeWithoutPath", staged(R"({"file_change": "renamed"})"), kOddChange + "renamed"},
        Row{"UnknownChangeWithAnOddPath", staged(R"({"file_change": "renamed", "path": 5})"), kOddChange + "renamed"},
        Row{"FirstFailingElementCounts",
            staged(R"({"file_change": "added", "path": "a"}, {"file_change": "x", "path": "b"}, {"path": "c"}, 5)"),
            kOddChange + "x"},
        Row{"AreReadBeforeRenamesAndIndex",
            R"({"head": {"reference": "master"}, "index": 5, "renames": 5, "staged_files": [5]})",
            noObject("int", "vector")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OfRenames, StateReading,
    testing::Values(
        Row{"None", renames(""), "HEAD master\n"},
        Row{"Several", renames(R"({"new": "b", "previous": "a"}, {"new": "a", "previous": "b"})"),
            "HEAD master\nrename b -> a\nrename a -> b\n"},
        Row{"FirstOfTwoWithOnePathIsKept", renames(R"({"new": "b", "previous": "first"}, {"new": "a", "previous": "x"},
                       {"new": "b", "previous": "second"})"),
            "HEAD master\nrename x -> a\nrename first -> b\n"},
        Row{"RepeatedOneMustBeWholeToo", renames(R"({"new": "b", "previous": "first"}, {"new": "b"})"),
            missing("previous")},
        Row{"UnknownMembersAreIgnored", renames(R"({"new": "b", "previous": "a", "path": 5})"),
            "HEAD master\nrename a -> b\n"},
        Row{"ElementIsNoObject", renames(R"({"new": "b", "previous": "a"}, [])"), noObject("array", "map")},
        Row{"NewPathIsMissing", renames(R"({"previous": "a"})"), missing("new")},
        Row{"PreviousPathIsMissing", renames(R"({"new": "b"})"), missing("previous")},
        Row{"NewPathIsReadFirst", renames("{}"), missing("new")},
        Row{"AreReadBeforeTheIndex", R"({"head": {"reference": "master"}, "index": [5], "renames": [true]})",
            noObject("bool", "map")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OfTheIndex, StateReading,
    testing::Values(
        Row{"None", indexed(""), "HEAD master\n"},
        Row{"Several", indexed(R"({"data": {"last_checked": 2, "modified": true}, "path": "b"},
                       {"data": {"last_checked": 0, "modified": false}, "path": "a"})"),
            "HEAD master\nindex a 0\nindex b 2 modified\n"},
        Row{"FirstOfTwoWithOnePathIsKept", indexed(R"({"data": {"last_checked": 1, "modified": true}, "path": "a"},
                       {"data": {"last_checked": 2, "modified": false}, "path": "a"})"),
            "HEAD master\nindex a 1 modified\n"},
        Row{"RepeatedOneMustBeWholeToo", indexed(kGoodIndexEntry + R"(, {"data": {"last_checked": 2}, "path": "a"})"),
            missing("modified")},
        Row{"LargestSignedNumber",
            indexed(R"({"data": {"last_checked": 9223372036854775807, "modified": false}, "path": "a"})"),
            "HEAD master\nindex a 9223372036854775807\n"},
        Row{"LargestNumber",
            indexed(R"({"data": {"last_checked": 18446744073709551615, "modified": false}, "path": "a"})"),
            "HEAD master\nindex a 18446744073709551615\n"},
        Row{"TooLargeNumberIsTheLargest",
            indexed(R"({"data": {"last_checked": 18446744073709551616, "modified": false}, "path": "a"})"),
            "HEAD master\nindex a 18446744073709551615\n"},
        Row{"NegativeNumberGivesItsBits", indexed(R"({"data": {"last_checked": -1, "modified": false}, "path": "a"})"),
            "HEAD master\nindex a 18446744073709551615\n"},
        Row{"TooSmallNumberIsTheSmallest",
            indexed(R"({"data": {"last_checked": -99999999999999999999, "modified": false}, "path": "a"})"),
            "HEAD master\nindex a 9223372036854775808\n"},
        Row{"WholeRealIsNoInteger", indexed(R"({"data": {"last_checked": 1e3, "modified": false}, "path": "a"})"),
            mismatch("int", "real", "last_checked")},
        Row{"UnknownMembersAreIgnored",
            indexed(R"({"data": {"last_checked": 1, "modified": false, "hash": 5}, "path": "a", "size": 5})"),
            "HEAD master\nindex a 1\n"},
        Row{"MembersInAnotherOrder",
            indexed(kGoodIndexEntry + R"(, {"path": "c", "data": {"modified": true, "last_checked": 3}},
                {"data": {"modified": true, "last_checked": 2}, "path": "b"})"),
            "HEAD master\nindex a 1\nindex b 2 modified\nindex c 3 modified\n"},
        Row{"LastOfTwoMembersOfOneNameCounts",
            indexed(R"({"data": {"last_checked": 1, "last_checked": 2, "modified": false}, "path": "a", "path": "b"},
                {"data": 5, "data": {"last_checked": 3, "modified": false}, "path": "c"})"),
            "HEAD master\nindex b 2\nindex c 3\n"},
        Row{"CommasMayFollow", indexed(R"({"data": {"last_checked": 1, "modified": false,}, "path": "a",},)"),
            "HEAD master\nindex a 1\n"},
        Row{"CommaMayFollowThePath", indexed(R"({"data": {"last_checked": 1, "modified": false}, "path": "a",})"),
            "HEAD master\nindex a 1\n"},
        Row{"MemberBehindThePathIsIgnored",
            indexed(R"({"data": {"last_checked": 1, "modified": false}, "path": "a", "size": 5})"),
            "HEAD master\nindex a 1\n"},
        Row{"RecordMustEndWithItsOwnBracket",
            indexed(R"({"data": {"last_checked": 1, "modified": false}, "path": "a"])"), kNoJson},
        Row{"DataMustEndWithItsOwnBracket", indexed(R"({"data": {"last_checked": 1, "modified": false], "path": "a"})"),
            kNoJson},
        Row{"NamesMayBeEscaped", indexed(R"({"d\u0061ta": {"last_checked": 1, "modified": false}, "path": "\u0061"})"),
            "HEAD master\nindex a 1\n"},
        Row{"LastOfTwoIndexesCounts", withHead(R"("index": [)" + kGoodIndexEntry + R"(, 5], "index": [{"data":
                {"last_checked": 7, "modified": false}, "path": "z"}])"),
            "HEAD master\nindex z 7\n"},
        Row{"LastOfTwoIndexesMayBeEmpty", withHead(R"("index": [)" + kGoodIndexEntry + R"(], "index": [])"),
            "HEAD master\n"},
        Row{"ArrayBehindItDoesNotReplaceIt", withHead(R"("index": [)" + kGoodIndexEntry + R"(], "more": [1, {}])"),
            "HEAD master\nindex a 1\n"},
        Row{"FirstOfTwoFaultsIsTold", indexed(R"({"data": {}}, 5)"), missing("path")},
        Row{"FaultBeforeAGoodRecordCounts", indexed(R"({"data": {}}, )" + kGoodIndexEntry), missing("path")},
        Row{"PathIsNoString", indexed(R"({"data": {"last_checked": 1, "modified": false}, "path": 5})"),
            mismatch("string", "int", "path")},
        Row{"OtherNameForData", indexed(R"({"date": {"last_checked": 1, "modified": false}, "path": "a"})"),
            missing("data")},
        Row{"OtherNameForTheTime", indexed(R"({"data": {"last_changed": 1, "modified": false}, "path": "a"})"),
            missing("last_checked")},
        Row{"OtherNameForTheMark", indexed(R"({"data": {"last_checked": 1, "modifies": false}, "path": "a"})"),
            missing("modified")},
        Row{"OtherNameForThePath", indexed(R"({"data": {"last_checked": 1, "modified": false}, "name": "a"})"),
            missing("path")},
        Row{"OtherNamesForAll", indexed(R"({"info": {"number": 1, "flag": false}, "name": "a"})"), missing("data")},
        Row{"ElementIsNoObject", indexed(kGoodIndexEntry + ", null"), noObject("null", "map")},
        Row{"DataIsMissing", indexed(R"({"path": "a"})"), missing("data")},
        Row{"PathIsMissing", indexed(R"({"data": {"last_checked": 1, "modified": false}})"), missing("path")},
        Row{"TimeIsMissing", indexed(R"({"data": {"modified": false}, "path": "a"})"), missing("last_checked")},
        Row{"MarkIsMissing", indexed(R"({"data": {"last_checked": 1}, "path": "a"})"), missing("modified")},
        Row{"DataIsTakenBeforePath", indexed("{}"), missing("data")},
        Row{"PathIsReadBeforeTime", indexed(R"({"data": {}})"), missing("path")},
        Row{"TimeIsReadBeforeMark", indexed(R"({"data": {}, "path": "a"})"), missing("last_checked")}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OfTheWholeText, StateReading,
    testing::Values(
        Row{"Nothing", "", kNoJson}, Row{"Blanks", " \n\t", kNoJson}, Row{"NoJson", "head = master", kNoJson},
        Row{"Array", "[]", mismatch("object", "array", "")},
        Row{"String", "\"head\"", mismatch("object", "string", "")},
        Row{"Bool", "true", mismatch("object", "bool", "")}, Row{"Integer", "17", mismatch("object", "int", "")},
        Row{"Real", "1.5", mismatch("object", "real", "")}, Row{"Null", "null", mismatch("object", "null", "")},
        Row{"TextBehindTheDocumentIsIgnored", R"({"head": {"reference": "a"}} {"head": 5)", "HEAD a\n"},
        Row{"ByteOrderMarkIsSkipped", "\xEF\xBB\xBF{\"head\": {\"reference\": \"a\"}}", "HEAD a\n"},
        Row{"CarriageReturnsAreBlanks", "{\r\n\"head\": {\r\n\"reference\": \"a\"}\r\n}\r\n", "HEAD a\n"},
        Row{"Utf16IsNoText", std::string("\xFF\xFE{\0}\0", 6), kNoJson},
        Row{"NulEndsTheText", std::string("{\0\"head\": {\"reference\": \"a\"}}", 29), kNoJson},
        Row{"BytesThatAreNotUtf8AreKept", "{\"head\": {\"reference\": \"\xFF\x80\"}}", "HEAD \xFF\x80\n"},
        Row{"CommasBeforeBracketsAreAccepted",
            R"({"head": {"reference": "a",}, "renames": [{"new": "b", "previous": "a",},],})",
            "HEAD a\nrename a -> b\n"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OfWholeDocuments, StateReading,
    testing::Values(
        Row{"OfAllParts",
            R"({"staged_files": [{"path": "plans/ground.dwg", "file_change": "modified"},
                                 {"path": "plans/roof-new.dwg", "file_change": "added"}],
                "renames": [{"previous": "plans/roof.dwg", "new": "plans/roof-new.dwg"}],
                "index": [{"path": "plans/ground.dwg", "data": {"modified": false, "last_checked": 1700000000}},
                          {"path": "plans/roof-new.dwg", "data": {"modified": true, "last_checked": 1700000500}}],
                "head": {"reference": "feature"}})",
            "HEAD feature\n"
            "staged modified plans/ground.dwg\n"
            "staged added plans/roof-new.dwg\n"
            "rename plans/roof.dwg -> plans/roof-new.dwg\n"
            "index plans/ground.dwg 1700000000\n"
            "index plans/roof-new.dwg 1700000500 modified\n"},
        Row{"OfAllPartsWithACommit", golden("full.json"), missing("head")}),
    support::rowName);

/// A member of the document and the type that it must have; in `document` stands $ for its value.
struct Member {
    char const* name;
    char const* key;
    char const* type;
    std::string document;
};

void PrintTo(Member const& member, std::ostream* out)
{
    *out << member.document;
}

class StateMember : public testing::TestWithParam<Member> {};

INSTANTIATE_TEST_SUITE_P(
    All, StateMember,
    testing::Values(
        Member{"Head", "head", "object", R"({"head": $})"},
        Member{"Reference", "reference", "string", R"({"head": {"reference": $}})"},
        Member{"HeadCommit", "head", "int", R"({"head": {"commit": 1, "head": $, "reference": "a"}})"},
        Member{"StagedFiles", "staged_files", "array", withHead(R"("staged_files": $)")},
        Member{"FileChange", "file_change", "string", staged(R"({"file_change": $, "path": 5})")},
        Member{"StagedPath", "path", "string", staged(R"({"file_change": "added", "path": $})")},
        Member{"Renames", "renames", "array", withHead(R"("renames": $)")},
        Member{"NewPath", "new", "string", renames(R"({"new": $, "previous": 5})")},
        Member{"PreviousPath", "previous", "string", renames(R"({"new": "b", "previous": $})")},
        Member{"Index", "index", "array", withHead(R"("index": $)")},
        Member{"Data", "data", "object", indexed(R"({"data": $, "path": 5})")},
        Member{"IndexPath", "path", "string", indexed(R"({"data": {"last_checked": "x", "modified": 5}, "path": $})")},
        Member{
            "LastChecked", "last_checked", "int",
            indexed(R"({"data": {"last_checked": $, "modified": 5}, "path": "a"})")},
        Member{
            "Modified", "modified", "bool", indexed(R"({"data": {"last_checked": 1, "modified": $}, "path": "a"})")}),
    support::rowName);

TEST_P(StateMember, IsRefusedInAnyOtherType)
{
    constexpr std::pair<char const*, char const*> kSamples[] = {
        {"object", "{}"}, {"array", "[]"}, {"string", "\"text\""}, {"bool", "true"},
        {"int", "1"},     {"real", "1.5"}, {"null", "null"}};
    int refused = 0;
    for (auto const& [type, text] : kSamples) {
        if (type == std::string(GetParam().type)) {
            continue;
        }
        std::string document = GetParam().document;
        Repository const repository(document.replace(document.find('$'), 1, text));
        EXPECT_EQ(repository.loaded(), mismatch(GetParam().type, type, GetParam().key));
        ++refused;
    }
    EXPECT_EQ(refused, 6);
}

class ListElement : public testing::TestWithParam<Member> {};

INSTANTIATE_TEST_SUITE_P(
    All, ListElement,
    testing::Values(
        Member{"StagedFile", "", "vector", staged("$")}, Member{"Rename", "", "map", renames("$")},
        Member{"IndexEntry", "", "map", indexed("$")}),
    support::rowName);

TEST_P(ListElement, IsRefusedUnlessItIsAnObject)
{
    constexpr std::pair<char const*, char const*> kSamples[] = {
        {"array", "[]"}, {"string", "\"text\""}, {"bool", "true"}, {"int", "1"}, {"real", "1.5"}, {"null", "null"}};
    for (auto const& [type, text] : kSamples) {
        std::string document = GetParam().document;
        Repository const repository(document.replace(document.find('$'), 1, text));
        EXPECT_EQ(repository.loaded(), noObject(type, GetParam().type));
    }
}

TEST(StateFileThatCannotBeRead, IsNamedAsItIs)
{
    support::TempFolder const folder;
    support::RecordingIo const io;
    folder.makeFolder("100%ls%n/.tav/tav.state");
    EXPECT_EQ(
        inWords(Cache::get(common::RootPath(folder.widePathTo("100%ls%n")), io)),
        "error: Could not read file '" + folder.pathTo("100%ls%n/.tav/tav.state") + "': Is a directory");
}

} // namespace
