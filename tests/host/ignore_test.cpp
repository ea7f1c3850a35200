#include "tests/host/tav_test.h"
#include "tests/support/rows.h"

namespace host_tests {
namespace {

using Ignore = TavTest;

constexpr char const* kNoExpression =
    " is not a valid regular expression. Rules match whole names: write '^.*\\.tmp$' for all names that end in "
    "'.tmp'.\n";

TEST_F(Ignore, ShowsTheDefaultRulesWhereThereIsNoFileOfThem)
{
    EXPECT_EQ(tav({"ignore"}), done("^.*\\.bak$\n^.*\\.dwl$\n^.*\\.dwl2$\n"));
    EXPECT_FALSE(repo.has(".tav/properties"));
}

TEST_F(Ignore, ShowsTheRulesInEffect)
{
    repo.ignore("^a$\n^План$\n\n^out of effect$\n");
    EXPECT_EQ(tav({"ignore"}), done("^a$\n^План$\n"));
    EXPECT_EQ(tav({"ignore", "--json"}), done("[\n    \"^a$\",\n    \"^План$\"\n]\n"));
}

TEST_F(Ignore, ShowsNothingForAnEmptyFile)
{
    repo.ignore("");
    EXPECT_EQ(tav({"ignore"}), done(""));
    EXPECT_EQ(tav({"ignore", "--json"}), done("[\n]\n"));
}

TEST_F(Ignore, EscapesRulesOnATerminalOnly)
{
    repo.ignore("^\x1b\xff$\n");
    EXPECT_EQ(tavOnTerminal({"ignore"}), done("^\\x1B\\xFF$\n"));
    EXPECT_EQ(tav({"ignore"}), done("^\x1b\xff$\n"));
    EXPECT_EQ(tav({"ignore", "--json"}), done("[\n    \"^\\u001B\\uDCFF$\"\n]\n"));
}

TEST_F(Ignore, AddsARuleToTheDefaultsWhereThereIsNoFile)
{
    EXPECT_EQ(tav({"ignore", "--add", "^old$"}), done("Names that match '^old$' are ignored from now on.\n"));
    EXPECT_EQ(repo.read(".tav/properties/ignore"), "^.*\\.bak$\n^.*\\.dwl$\n^.*\\.dwl2$\n^old$");
}

TEST_F(Ignore, HidesWhatTheNewRuleMatches)
{
    repo.add({"old/a.dwg", "older/b.dwg", "c.dwg", "d/old"});
    tav({"ignore", "--add", "old"});
    EXPECT_EQ(tav({"files"}), done("c.dwg\nolder/b.dwg\n.tav/properties/ignore\n"));
}

struct AddRow {
    char const* name;
    std::string before;
    std::string rule;
    std::string after;
};

class IgnoreAdd
    : public TavTest
    , public testing::WithParamInterface<AddRow> {};

TEST_P(IgnoreAdd, PutsTheRuleBehindThoseInEffect)
{
    repo.ignore(GetParam().before);
    EXPECT_EQ(
        tav({"ignore", "--add=" + GetParam().rule}),
        done("Names that match '" + GetParam().rule + "' are ignored from now on.\n"));
    EXPECT_EQ(repo.read(".tav/properties/ignore"), GetParam().after);
}

INSTANTIATE_TEST_SUITE_P(
    Files, IgnoreAdd,
    testing::Values(
        AddRow{"Empty", "", "^b$", "^b$"}, AddRow{"NoLastLineFeed", "^a$", "^b$", "^a$\n^b$"},
        AddRow{"LastLineFeed", "^a$\n", "^b$", "^a$\n^b$"},
        AddRow{"EmptyLine", "^a$\n\n^c$\n", "^b$", "^a$\n^b$\n\n^c$\n"},
        AddRow{"OnlyAnEmptyLine", "\n", "^b$", "^b$\n\n"}, AddRow{"EmptyFirstLine", "\n^c$", "^b$", "^b$\n\n^c$"},
        AddRow{"OtherLineEnds", "^a$\r\n\r\n^c$", "^b$", "^a$\r\n^b$\n\r\n^c$"},
        AddRow{"OutOfEffect", "^a$\n\n^b$", "^b$", "^a$\n^b$\n\n^b$"},
        AddRow{"OtherScripts", "", "^План.*$", "^План.*$"}, AddRow{"NotUtf8", "", "^\xff$", "^\xff$"},
        AddRow{"Brackets", "", "[ab]", "[ab]"}, AddRow{"BracketsWithCommas", "", "[a,b]", "[a,b]"},
        AddRow{"LikeAnOption", "", "--all", "--all"}),
    support::rowName);

TEST_F(Ignore, AddsARuleOnlyOnce)
{
    repo.ignore("^a$\n^b$\n");
    EXPECT_EQ(tav({"ignore", "--add", "^a$"}), done("The rule '^a$' was there already.\n"));
    EXPECT_EQ(repo.read(".tav/properties/ignore"), "^a$\n^b$\n");
}

struct RefusalRow {
    char const* name;
    std::string rule;
    std::string message;
};

class IgnoreRefusal
    : public TavTest
    , public testing::WithParamInterface<RefusalRow> {};

TEST_P(IgnoreRefusal, LeavesTheFileAsItWas)
{
    repo.ignore("^a$\n");
    EXPECT_EQ(tav({"ignore", "--add", GetParam().rule}), failed(GetParam().message));
    EXPECT_EQ(repo.read(".tav/properties/ignore"), "^a$\n");
}

INSTANTIATE_TEST_SUITE_P(
    Rules, IgnoreRefusal,
    testing::Values(
        RefusalRow{"Empty", "", "tav: A rule is one line that is not empty. Give one rule at a time.\n"},
        RefusalRow{"TwoLines", "^a$\n^b$", "tav: A rule is one line that is not empty. Give one rule at a time.\n"},
        RefusalRow{
            "LineFeedAtTheEnd", "^b$\n", "tav: A rule is one line that is not empty. Give one rule at a time.\n"},
        RefusalRow{"CarriageReturn", "^b$\r", "tav: A rule is one line that is not empty. Give one rule at a time.\n"},
        RefusalRow{"OpenBracket", "[", std::string("tav: '['") + kNoExpression},
        RefusalRow{"Wildcard", "*.tmp", std::string("tav: '*.tmp'") + kNoExpression},
        RefusalRow{"WithEscapes", "(\x1b\xff", std::string("tav: '(\\x1B\\xFF'") + kNoExpression},
        RefusalRow{
            "TooDeep", std::string(30000, '(') + std::string(30000, ')'),
            "tav: '" + std::string(30000, '(') + std::string(30000, ')') + "'" + kNoExpression}),
    support::rowName);

TEST_F(Ignore, FailsForAFileThatCannotBeUsed)
{
    repo.ignore("^a$\n(\n");
    std::string const message = "tav: The ignore file '" + repo.pathTo(".tav/properties/ignore") +
                                "' has a rule that is not a valid regular expression. Correct or remove it there.\n";
    EXPECT_EQ(tav({"ignore"}), failed(message));
    EXPECT_EQ(tav({"ignore", "--add", "^b$"}), failed(message));
    EXPECT_EQ(repo.read(".tav/properties/ignore"), "^a$\n(\n");
}

TEST_F(Ignore, WritesThroughNoLink)
{
    repo.write("shared rules", "^a$\n");
    repo.makeFolder(".tav/properties");
    repo.makeLink(".tav/properties/ignore", repo.pathTo("shared rules"));
    EXPECT_EQ(
        tav({"ignore", "--add", "^b$"}), failed(
                                             "tav: '" + repo.pathTo(".tav/properties/ignore") +
                                             "' is a link, and may lead to another repository. Put the file itself in "
                                             "its place.\n"));
    EXPECT_EQ(repo.read("shared rules"), "^a$\n");
}

TEST_F(Ignore, CountsBothOfTwoRulesAddedAtTheSameTime)
{
    for (int round = 0; round < 10; ++round) {
        repo.ignore("");
        Process first(setting(), {"ignore", "--add", "^first$"});
        Process second(setting(), {"ignore", "--add", "^second$"});
        EXPECT_EQ(first.wait(), done("Names that match '^first$' are ignored from now on.\n"));
        EXPECT_EQ(second.wait(), done("Names that match '^second$' are ignored from now on.\n"));
        EXPECT_EQ(repo.read(".tav/properties/ignore").size(), std::string("^first$\n^second$").size());
    }
}

} // namespace
} // namespace host_tests
