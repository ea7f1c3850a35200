// Which messages of state and explorer are translated. A program of its own: translations are the process's.
#include "tests/state/states.h"

#include "common/mu_common_diff.h"
#include "tests/server/translations.h"
#include "tests/support/rows.h"

#include <gmock/gmock.h>
#include <string>
#include <variant>

namespace {

using namespace states;
using server::Translations;

/// Translated to itself in braces, placeholders too.
std::vector<std::string> const kTexts = {
    "No state file found at %ls",
    "State does not contain HEAD.",
    "HEAD does not point to a branch",
    "Unable to parse json, please check if syntax is valid",
    "Error writing to file '%ls'",
    "unsupported file change",
    "Unsupported file change enum: %ls",
    "There are no modified or untracked files for commit.",
    "More that one file found with name %ls.\n",
    "Unable to find json key '%ls'",
    "Error:\tExpected json type '%ls', found '%ls'",
    "Encounterd '%ls', found '%ls. While %ls'",
};

TEST(StateMessages, AreTranslatedBeforePathsAreFilledIn)
{
    Translations const translations(kTexts);
    Repository const repository;
    EXPECT_EQ(repository.loaded(), "error: {No state file found at " + repository.statePath() + "}");
    Cache(common::RootPath(repository.widePathTo("missing")), repository.io()).write();
    EXPECT_EQ(
        repository.calls().back(),
        "report error: {Error writing to file '" + repository.pathTo("missing/.tav/tav.state") + "'}");
}

struct Row {
    char const* name;
    std::string document;
    std::string outcome;
};

void PrintTo(Row const& row, std::ostream* out)
{
    *out << row.document;
}

class StateMessage : public testing::TestWithParam<Row> {};

INSTANTIATE_TEST_SUITE_P(
    Rows, StateMessage,
    testing::Values(
        Row{"NoHead", "{}", "error: {State does not contain HEAD.}"},
        Row{"NoBranch", R"({"head": {}})", "error: {HEAD does not point to a branch}"},
        Row{"NoJson", "{", "error: {Unable to parse json, please check if syntax is valid}"},
        Row{"OddChange", R"({"head": {"reference": "a"}, "staged_files": [{"file_change": "odd"}]})",
            "error: {Unsupported file change enum: odd}"},
        Row{"MissingMemberIsNotTranslated", R"({"head": {"commit": 17, "reference": "a"}})", missing("head")},
        Row{"OddTypeIsNotTranslated", "[]", mismatch("object", "array", "")},
        Row{"OddElementIsNotTranslated", R"({"head": {"reference": "a"}, "index": [5]})",
            "error: Encounterd 'object', found 'int. While parsing json map.'"}),
    support::rowName);

TEST_P(StateMessage, IsAsTranslated)
{
    Translations const translations(kTexts);
    EXPECT_EQ(Repository(GetParam().document).loaded(), GetParam().outcome);
}

TEST(StateMessages, OfAnOddChangeAreTranslated)
{
    Translations const translations(kTexts);
    Repository const repository;
    State state;
    state.stagedFiles = {{L"a", static_cast<FileChange>(3)}};
    Cache(repository.root(), state, repository.io()).write();
    EXPECT_THAT(repository.calls(), testing::ElementsAre("report error: {unsupported file change}"));
}

TEST(ExplorerMessages, AreTranslatedBeforeNamesAreFilledIn)
{
    Translations const translations(kTexts);
    common::RepoChanges changes;
    EXPECT_EQ(
        common::RepoFileExplorer(changes, common::RootPath(L"/project")).stagedFiles().error().message.ansi_str(),
        "{There are no modified or untracked files for commit.}");
    changes.untracked = {{nullptr, {L"a/plan.dwg"}, 0}, {nullptr, {L"b/plan.dwg"}, 0}};
    auto const found = common::RepoFileExplorer(changes, common::RootPath(L"/project")).findForStaging(L"plan");
    ASSERT_TRUE(std::holds_alternative<ErrorMessage>(found));
    EXPECT_EQ(std::get<ErrorMessage>(found).message.ansi_str(), "{More that one file found with name plan.\n}");
}

} // namespace
