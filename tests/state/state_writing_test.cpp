#include "tests/state/golden.h"
#include "tests/state/states.h"

#include "tests/support/foreign_locale.h"
#include "tests/support/rows.h"
#include "tests/support/utf8.h"

#include <clocale>
#include <gmock/gmock.h>
#include <map>
#include <type_traits>

namespace {

using namespace states;
using testing::ElementsAre;

std::map<OdString, IndexData> const kIndex = {
    {L"plans/ground.dwg", {1700000000, false}}, {L"plans/roof-new.dwg", {1700000500, false}}};
std::map<OdString, OdString> const kRenames = {{L"plans/roof-new.dwg", L"plans/roof.dwg"}};
std::vector<StagedFile> const kStaged = {
    {L"plans/ground.dwg", FileChange::modified}, {L"plans/roof-new.dwg", FileChange::added}};

constexpr auto kMost = std::numeric_limits<std::uint64_t>::max();
constexpr auto kMostSigned = static_cast<std::uint64_t>(std::numeric_limits<std::int64_t>::max());

/// Names that need escapes of every kind, and numbers at the borders.
State oddState()
{
    State state;
    state.head = L"dach/gr\u00FCn";
    state.index = {
        {L"a \"b\" \\ c/\b\t\n\f\r\v\x01\x7F'.dwg", {0, true}},
        {L"\u5E73\u9762\u56F3.dwg", {kMostSigned, false}},
        {support::fromUtf8("\xFF\x80.dwg"), {kMostSigned + 1, false}},
        {L"\U0001F600.dwg", {kMost, true}}};
    state.renames = {{L"\u00E4.dwg", OdString(L"\0.dwg", 5)}, {L"a.dwg", L""}, {L"Z.dwg", L"%ls"}};
    state.stagedFiles = {{L"\u00DF.dwg", FileChange::removed}};
    return state;
}

TEST(State, IsFreshWhenMade)
{
    EXPECT_EQ(inWords(State()), "HEAD master\n");
    EXPECT_EQ(common::s_defaultMaster.ansi_str(), "master");
}

TEST(State, IsAPlainValue)
{
    EXPECT_TRUE(std::is_copy_constructible_v<State>);
    EXPECT_TRUE(std::is_nothrow_move_assignable_v<State>);
    EXPECT_TRUE((std::is_same_v<decltype(State::headCommit), std::optional<std::uint64_t>>));
    EXPECT_TRUE((std::is_same_v<decltype(IndexData::lastChecked), std::uint64_t>));
}

struct Row {
    char const* name;
    State state;
    std::string document;
};

void PrintTo(Row const& row, std::ostream* out)
{
    *out << row.document;
}

constexpr char const* kMasterHead = R"(    "head" : {
        "reference" : "master"
    })";

/// A document of HEAD on "master" and one more member.
std::string withHead(std::string const& member)
{
    return std::string("{\n") + kMasterHead + ",\n" + member + "\n}";
}

std::vector<Row> rows()
{
    State headCommitZero;
    headCommitZero.headCommit = 0;
    State largestHeadCommit;
    largestHeadCommit.headCommit = kMost;
    State namelessBranch;
    namelessBranch.head = L"";
    State allChanges;
    allChanges.stagedFiles = {
        {L"z", FileChange::removed},
        {L"a", FileChange::modified},
        {L"m", FileChange::added},
        {L"z", FileChange::added}};
    State renamed;
    renamed.renames = kRenames;
    State indexed;
    indexed.index = {{L"b", {1, true}}, {L"B", {18446744073709551615U, false}}};
    return {
        {"FreshIsHeadAlone", State(), "{\n    \"head\" : {\n        \"reference\" : \"master\"\n    }\n}"},
        {"BranchWithoutAName", namelessBranch, "{\n    \"head\" : {\n        \"reference\" : \"\"\n    }\n}"},
        {"HeadCommitStandsBeforeReference", headCommitZero,
         "{\n    \"head\" : {\n        \"commit\" : 0,\n        \"reference\" : \"master\"\n    }\n}"},
        {"LargestHeadCommit", largestHeadCommit,
         "{\n    \"head\" : {\n        \"commit\" : 18446744073709551615,\n        \"reference\" : \"master\"\n    "
         "}\n}"},
        {"StagedFilesKeepTheirOrderAndRepeat", allChanges, withHead(R"(    "staged_files" : [
        {
            "file_change" : "removed",
            "path" : "z"
        },
        {
            "file_change" : "modified",
            "path" : "a"
        },
        {
            "file_change" : "added",
            "path" : "m"
        },
        {
            "file_change" : "added",
            "path" : "z"
        }
    ])")},
        {"RenamesAlone", renamed, withHead(R"(    "renames" : [
        {
            "new" : "plans/roof-new.dwg",
            "previous" : "plans/roof.dwg"
        }
    ])")},
        {"IndexAloneInOrderOfPaths", indexed, withHead(R"(    "index" : [
        {
            "data" : {
                "last_checked" : 18446744073709551615,
                "modified" : false
            },
            "path" : "B"
        },
        {
            "data" : {
                "last_checked" : 1,
                "modified" : true
            },
            "path" : "b"
        }
    ])")},
    };
}

class StateWriting : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(Rows, StateWriting, testing::ValuesIn(rows()), support::rowName);

TEST_P(StateWriting, GivesTheDocument)
{
    Repository const repository;
    EXPECT_EQ(repository.saved(GetParam().state), GetParam().document);
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
}

State fullState()
{
    State state;
    state.head = L"feature";
    state.headCommit = 17;
    state.stagedFiles = kStaged;
    state.renames = kRenames;
    state.index = kIndex;
    return state;
}

TEST(StateWritten, WholeIsTheGoldenDocument)
{
    EXPECT_EQ(Repository().saved(fullState()), golden("full.json"));
}

TEST(StateWritten, UnderTheCLocaleEscapesWhatIsBeyondAscii)
{
    EXPECT_EQ(Repository().saved(oddState()), golden("escaped.json"));
}

TEST(StateWritten, UnderAUtf8LocaleHoldsPrintableCharactersAsTheyAre)
{
    support::ForeignLocale const locale("C.UTF-8");
    ASSERT_STREQ(std::setlocale(LC_CTYPE, nullptr), "C.UTF-8");
    State state = oddState();
    state.renames.clear();
    state.stagedFiles.clear();
    EXPECT_EQ(Repository().saved(state), golden("utf8.json"));
}

TEST(StateWritten, FollowsNoLocaleInItsNumbers)
{
    support::ForeignLocale const locale("C");
    EXPECT_EQ(Repository().saved(fullState()), golden("full.json"));
    EXPECT_EQ(Repository().saved(oddState()), golden("escaped.json"));
}

TEST(StateWritten, ReadsBackTheSame)
{
    State state = fullState();
    state.headCommit.reset();
    Repository const repository;
    repository.saved(state);
    EXPECT_EQ(repository.loaded(), inWords(state));
}

TEST(StateWritten, ReadsBackTheSameButForCharactersBeyond16Bits)
{
    Repository const repository;
    repository.saved(oddState());
    State expected = oddState();
    expected.index.erase(L"\U0001F600.dwg");
    expected.index[L"\uF600.dwg"] = {kMost, true};
    EXPECT_EQ(repository.loaded(), inWords(expected));
}

TEST(StateWritten, UnderAUtf8LocaleReadsBackWholly)
{
    support::ForeignLocale const locale("C.UTF-8");
    Repository const repository;
    repository.saved(oddState());
    EXPECT_EQ(repository.loaded(), inWords(oddState()));
}

/// Two names that are written alike: the first in the order of the index stays.
TEST(StateWritten, KeepsTheFirstOfTwoNamesThatDifferBeyond16BitsOnly)
{
    State state;
    state.index = {{L"\uF600.dwg", {1, false}}, {L"\U0001F600.dwg", {2, false}}};
    Repository const repository;
    repository.saved(state);
    EXPECT_EQ(repository.loaded(), "HEAD master\nindex \xEF\x98\x80.dwg 1\n");
}

TEST(StateWritten, WithHeadCommitIsNotReadBack)
{
    Repository const repository;
    repository.saved(fullState());
    EXPECT_EQ(repository.loaded(), missing("head"));
}

TEST(StateWritten, BringsAll64BitsOfATimeBack)
{
    for (std::uint64_t const time : {std::uint64_t{0}, kMostSigned, kMostSigned + 1, kMost}) {
        State state;
        state.index[L"a"] = {time, false};
        Repository const repository;
        repository.saved(state);
        EXPECT_EQ(repository.open()->read().index.at(L"a").lastChecked, time);
    }
}

TEST(StateWritten, EndsWithoutALineFeed)
{
    EXPECT_EQ(Repository().saved(State()).back(), '}');
}

/// A change that has no text, at each place of the list.
class UnwritableChange : public testing::TestWithParam<std::size_t> {};

INSTANTIATE_TEST_SUITE_P(Places, UnwritableChange, testing::Values(0U, 1U, 2U));

TEST_P(UnwritableChange, IsReportedAndTheFileStays)
{
    Repository const repository(golden("full.json"));
    State state = fullState();
    state.headCommit.reset();
    state.stagedFiles.insert(
        state.stagedFiles.begin() + static_cast<std::ptrdiff_t>(GetParam()), {L"odd.dwg", static_cast<FileChange>(3)});
    EXPECT_EQ(repository.saved(state), golden("full.json"));
    EXPECT_THAT(repository.calls(), ElementsAre("report error: unsupported file change"));
    EXPECT_THAT(repository.list(), ElementsAre(".tav/", ".tav/tav.state"));
}

TEST(UnwritableChangeOfANewRepository, MakesNoFile)
{
    Repository const repository;
    State state;
    state.stagedFiles = {{L"odd.dwg", static_cast<FileChange>(-1)}};
    Cache(repository.root(), state, repository.io()).write();
    EXPECT_THAT(repository.calls(), ElementsAre("report error: unsupported file change"));
    EXPECT_THAT(repository.list(), ElementsAre(".tav/"));
}

} // namespace
