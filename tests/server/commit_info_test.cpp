#include "tests/server/outcome.h"
#include "tests/server/test_clock.h"
#include "tests/server/translations.h"
#include "tests/support/rows.h"
#include "tests/support/utf8.h"

#include <cstdlib>
#include <ctime>
#include <memory>
#include <regex>
#include <type_traits>

namespace {

using namespace common;
using namespace server;

static_assert(std::is_aggregate_v<CommitInfo>);

constexpr std::int64_t kMoment = 1709647629123; // 2024-03-05T14:07:09.123Z

RepoFile renamed(wchar_t const* path, wchar_t const* previousPath)
{
    return RepoFile(path, L"tf:plan#2", std::make_unique<BaseFile>(previousPath));
}

class WrittenCommit : public testing::Test {
protected:
    static std::string commitOf(std::vector<RepoFile> const& files, std::vector<OdString> const& parents = {})
    {
        return pretty(serializeCommit(files, L"ann", L"why", L"abc", parents));
    }

    static std::string filesOf(std::vector<RepoFile> const& files)
    {
        return pretty(serializeCommit(files, L"", L"", L"", {}).at(L"files"));
    }

    TestClock clock{kMoment};
};

TEST(WrittenAnnotation, HoldsThreeTexts)
{
    EXPECT_EQ(pretty(serializeAnnotation(L"ann", L"2024-03-05", L"a \"b\"\nc")), R"({
    "author" : "ann",
    "date" : "2024-03-05",
    "message" : "a \"b\"\nc"
})");
}

TEST(WrittenAnnotation, IsRefusedByTheReader)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeAnnotation(serializeAnnotation(L"ann", L"2024-03-05T14:07:09Z", L"why")); }),
        mismatch("real", "string", "date"));
}

TEST_F(WrittenCommit, HoldsItsMembersInAscendingOrder)
{
    EXPECT_EQ(commitOf({renamed(L"plan.dwg", L"draft.dwg"), RepoFile(L"b.txt", L"po1")}, {L"q", L"p"}), R"({
    "annotation" : {
        "author" : "ann",
        "date" : "2024-03-05T14:07:09Z",
        "message" : "why"
    },
    "files" : [
        {
            "path" : "plan.dwg",
            "previousPath" : "draft.dwg",
            "storagePath" : "tf:plan#2"
        },
        {
            "path" : "b.txt",
            "storagePath" : "po1"
        }
    ],
    "hash" : "abc",
    "parentsHashes" : [
        "q",
        "p"
    ]
})");
}

TEST_F(WrittenCommit, HoldsEmptyArraysForNoFilesAndNoParents)
{
    Object const commit = serializeCommit({}, L"", L"", L"", {});
    EXPECT_EQ(commit.at(L"files"), Value(Array()));
    EXPECT_EQ(commit.at(L"parentsHashes"), Value(Array()));
    EXPECT_EQ(commit.size(), 4U);
}

struct PreviousRow {
    char const* name;
    wchar_t const* previousPath;
    bool isWritten;
};

class WrittenPreviousPath
    : public WrittenCommit
    , public testing::WithParamInterface<PreviousRow> {};

INSTANTIATE_TEST_SUITE_P(
    Paths, WrittenPreviousPath,
    testing::Values(
        PreviousRow{"Another", L"draft.dwg", true}, PreviousRow{"TheSame", L"plan.dwg", false},
        PreviousRow{"Empty", L"", false}, PreviousRow{"InOtherCase", L"Plan.dwg", true},
        PreviousRow{"InAnotherFolder", L"./plan.dwg", true}, PreviousRow{"Longer", L"plan.dwg ", true}),
    support::rowName);

TEST_P(WrittenPreviousPath, IsThereOnlyWhenItDiffers)
{
    Object const commit = serializeCommit({renamed(L"plan.dwg", GetParam().previousPath)}, L"", L"", L"", {});
    Object const& file = commit.at(L"files").get_array().at(0).get_object();
    ASSERT_EQ(file.count(L"previousPath") > 0, GetParam().isWritten);
    if (GetParam().isWritten) {
        EXPECT_EQ(file.at(L"previousPath"), Value(GetParam().previousPath));
    }
    EXPECT_EQ(file.at(L"path"), Value(L"plan.dwg"));
    EXPECT_EQ(file.at(L"storagePath"), Value(L"tf:plan#2"));
}

TEST_F(WrittenCommit, LeavesThePreviousPathOutWithoutPreviousVersion)
{
    std::string const plain = filesOf({RepoFile(L"plan.dwg", L"po1")});
    EXPECT_EQ(filesOf({RepoFile(L"plan.dwg", L"po1", nullptr)}), plain);
    EXPECT_EQ(plain, "[\n    {\n        \"path\" : \"plan.dwg\",\n        \"storagePath\" : \"po1\"\n    }\n]");
}

TEST_F(WrittenCommit, KeepsTextsWholeWithTheirNuls)
{
    OdString const text(L"a\0b", 3);
    Object const commit = serializeCommit({RepoFile(text, text)}, text, text, text, {text});
    Value const expected = std::wstring(L"a\0b", 3);
    EXPECT_EQ(commit.at(L"hash"), expected);
    EXPECT_EQ(commit.at(L"annotation").get_object().at(L"author"), expected);
    EXPECT_EQ(commit.at(L"annotation").get_object().at(L"message"), expected);
    EXPECT_EQ(commit.at(L"parentsHashes").get_array().at(0), expected);
    EXPECT_EQ(commit.at(L"files").get_array().at(0).get_object().at(L"path"), expected);
    EXPECT_EQ(commit.at(L"files").get_array().at(0).get_object().at(L"storagePath"), expected);
}

struct MomentRow {
    char const* name;
    std::int64_t moment;
    char const* text;
};

class WrittenDate : public testing::TestWithParam<MomentRow> {};

INSTANTIATE_TEST_SUITE_P(
    Moments, WrittenDate,
    testing::Values(
        MomentRow{"LastMillisecondOfASecond", 1709647629999, "2024-03-05T14:07:09Z"},
        MomentRow{"Midnight", 1704067200000, "2024-01-01T00:00:00Z"},
        MomentRow{"LastMomentOfAYear", 1704067199999, "2023-12-31T23:59:59Z"},
        MomentRow{"LeapDay", 1709164800000, "2024-02-29T00:00:00Z"}),
    support::rowName);

TEST_P(WrittenDate, IsTheUniversalTimeOfTheMomentOfWriting)
{
    TestClock const clock(GetParam().moment);
    Object const commit = serializeCommit({}, L"", L"", L"", {});
    EXPECT_EQ(commit.at(L"annotation").get_object().at(L"date"), Value(support::fromUtf8(GetParam().text).c_str()));
}

/// The local time is an unusual one as long as this lives.
class FarZone {
public:
    FarZone()
    {
        setenv("TZ", "XXX-9:30", 1);
        tzset();
    }
    FarZone(FarZone const&) = delete;
    FarZone& operator=(FarZone const&) = delete;
    ~FarZone()
    {
        unsetenv("TZ");
        tzset();
    }
};

TEST_F(WrittenCommit, DoesNotFollowTheLocalTime)
{
    FarZone const zone;
    Object const commit = serializeCommit({}, L"", L"", L"", {});
    EXPECT_EQ(commit.at(L"annotation").get_object().at(L"date"), Value(L"2024-03-05T14:07:09Z"));
}

std::int64_t secondsOf(std::string const& date)
{
    std::tm parts{};
    EXPECT_NE(strptime(date.c_str(), "%Y-%m-%dT%H:%M:%SZ", &parts), nullptr) << date;
    return timegm(&parts);
}

TEST(WrittenDateByTheRealClock, LiesBetweenBeforeAndAfter)
{
    std::int64_t const before = std::time(nullptr) - 1; // time() may lag behind by a tick.
    Object const commit = serializeCommit({}, L"", L"", L"", {});
    std::string const date = outcomeOf(
        [&] { return Expected<OdString>(getStringValue(commit.at(L"annotation").get_object().at(L"date"))); });
    std::int64_t const after = std::time(nullptr) + 1;
    EXPECT_TRUE(std::regex_match(date, std::regex(R"(\d{4}-\d\d-\d\dT\d\d:\d\d:\d\dZ)"))) << date;
    EXPECT_GE(secondsOf(date), before);
    EXPECT_LE(secondsOf(date), after);
}

class WrittenCommitInfo : public WrittenCommit {
protected:
    static CommitInfo someInfo()
    {
        return {
            {RepoFile(L"plan.dwg", L"tf:plan#2")},
            {Reference(L"main", L"abc", EType::branch, Annotation{L"bob", L"hidden", OdTimeStamp()}),
             Reference(L"v1", L"def", EType::tag)},
            {L"p"},
            L"abc",
            L"ann",
            L"why"};
    }
};

TEST_F(WrittenCommitInfo, IsTheCommitAndItsReferencesWithoutAnnotations)
{
    EXPECT_EQ(pretty(serializeCommitInfo(someInfo())), R"({
    "commits" : [
        {
            "annotation" : {
                "author" : "ann",
                "date" : "2024-03-05T14:07:09Z",
                "message" : "why"
            },
            "files" : [
                {
                    "path" : "plan.dwg",
                    "storagePath" : "tf:plan#2"
                }
            ],
            "hash" : "abc",
            "parentsHashes" : [
                "p"
            ]
        }
    ],
    "references" : [
        {
            "commitHash" : "abc",
            "name" : "main",
            "refType" : "branch"
        },
        {
            "commitHash" : "def",
            "name" : "v1",
            "refType" : "tag"
        }
    ]
})");
}

TEST_F(WrittenCommitInfo, HoldsOneCommitEvenWhenThereIsNothingInIt)
{
    Value const document = serializeCommitInfo({});
    ASSERT_EQ(document.get_object().size(), 2U);
    EXPECT_EQ(document.get_object().at(L"references"), Value(Array()));
    EXPECT_EQ(document.get_object().at(L"commits"), Value(Array{Value(serializeCommit({}, L"", L"", L"", {}))}));
}

TEST_F(WrittenCommitInfo, NamesATypeOutOfRangeAsUnsupported)
{
    for (int const number : {2, -1, 2147483647}) {
        CommitInfo info;
        info.references.emplace_back(L"main", L"abc", static_cast<EType>(number));
        Object const reference =
            serializeCommitInfo(info).get_object().at(L"references").get_array().at(0).get_object();
        EXPECT_EQ(reference.at(L"refType"), Value(L"Unsupported reftype")) << number;
        EXPECT_EQ(
            outcomeOf([&] { return deserializeReference(reference); }), "error: Unsupported type: Unsupported reftype");
    }
}

TEST_F(WrittenCommitInfo, IsNotTranslated)
{
    std::string const before = pretty(serializeCommitInfo(someInfo()));
    Translations const translations({"branch", "tag", "Unsupported reftype", "commits", "%Y-%m-%dT%H:%M:%SZ"});
    EXPECT_EQ(pretty(serializeCommitInfo(someInfo())), before);
}

TEST_F(WrittenCommitInfo, ReferencesAreReadAsTheyWereWritten)
{
    Value const document = serializeCommitInfo(someInfo());
    Array const& references = document.get_object().at(L"references").get_array();
    EXPECT_EQ(inWords(deserializeReference(references.at(0).get_object())), "branch main -> abc");
    EXPECT_EQ(inWords(deserializeReference(references.at(1).get_object())), "tag v1 -> def");
}

} // namespace
