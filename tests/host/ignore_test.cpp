#include "tests/host/tav_test.h"
#include "tests/support/rows.h"

namespace host_tests {
namespace {

using Ignore = TavTest;

constexpr char const* kNoExpression =
    " is not a valid regular expression. Rules match whole names: write '^.*\\.tmp$' for all names that end in "
    "'.tmp'.\n";

/// What is said when a rule is added that no name matches.
Outcome addedForLater(std::string const& rule)
{
    return {
        0, "Names that match '" + rule + "' are ignored from now on.\n",
        "tav: No file or folder has such a name yet.\n"};
}

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
    EXPECT_EQ(tav({"ignore", "--add", "^old$"}), addedForLater("^old$"));
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
    EXPECT_EQ(tav({"ignore", "--add=" + GetParam().rule}), addedForLater(GetParam().rule));
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
        RefusalRow{"WildcardWithClass", "*.[tT]mp", std::string("tav: '*.[tT]mp'") + kNoExpression},
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
        EXPECT_EQ(first.wait(), addedForLater("^first$"));
        EXPECT_EQ(second.wait(), addedForLater("^second$"));
        EXPECT_EQ(repo.read(".tav/properties/ignore").size(), std::string("^first$\n^second$").size());
    }
}

struct WildcardRow {
    char const* name;
    std::string typed;
    std::string rule;
    std::vector<std::string> ignored;
    std::vector<std::string> kept;
};

class IgnoreWildcard
    : public TavTest
    , public testing::WithParamInterface<WildcardRow> {};

TEST_P(IgnoreWildcard, BecomesTheRuleThatMatchesTheSameNames)
{
    repo.ignore("");
    for (std::string const& name : GetParam().ignored) {
        repo.write(name, "");
    }
    std::string files;
    for (std::string const& name : GetParam().kept) {
        repo.write(name, "");
        files += name + "\n";
    }
    EXPECT_EQ(
        tav({"ignore", "--add=" + GetParam().typed}),
        done("Names that match '" + GetParam().rule + "' are ignored from now on.\n"));
    EXPECT_EQ(repo.read(".tav/properties/ignore"), GetParam().rule);
    EXPECT_EQ(tav({"files"}), done(files + ".tav/properties/ignore\n"));
}

INSTANTIATE_TEST_SUITE_P(
    Typed, IgnoreWildcard,
    testing::Values(
        WildcardRow{"Ending", "*.plt", "^.*\\.plt$", {"a.plt", "b/c d.plt", "'\".plt"}, {"a.plt.dwg", "aplt"}},
        WildcardRow{"Beginning", "plot*", "^plot.*$", {"plot", "plot.dwg", "plots/a.dwg"}, {"a plot.dwg"}},
        WildcardRow{
            "OneCharacter",
            "План ?.dwg",
            "^План [^\\x80-\\xBF][\\x80-\\xBF]*\\.dwg$",
            {"План 1.dwg", "План Б.dwg", "План 图.dwg"},
            {"План .dwg", "План 12.dwg", "План ББ.dwg"}},
        WildcardRow{
            "CombiningAccent",
            "e?tage.dwg",
            "^e[^\\x80-\\xBF][\\x80-\\xBF]*tage\\.dwg$",
            {"e\xCC\x81tage.dwg"},
            {"\xC3\xA9tage.dwg"}},
        WildcardRow{"LeadingDash", "-*", "^-.*$", {"-a.dwg"}, {"a-b.dwg"}},
        WildcardRow{"QuotesAndSpaces", "a '\" *", "^a '\" .*$", {"a '\" b"}, {"a"}},
        WildcardRow{"ExpressionWithoutAnchors", ".*plt", ".*plt", {"a.plt", "plt"}, {"a.plt.dwg"}}),
    support::rowName);

TEST_F(Ignore, TakesTheNameOfAFileAsItIs)
{
    repo.add({"Plan (1).dwg", "plans/a [old/b.dwg", "Plan 1.dwg"});
    EXPECT_EQ(
        tav({"ignore", "--add", "Plan (1).dwg"}),
        done("Names that match '^Plan \\(1\\)\\.dwg$' are ignored from now on.\n"));
    EXPECT_EQ(tav({"ignore", "--add", "a [old"}), done("Names that match '^a \\[old$' are ignored from now on.\n"));
    EXPECT_EQ(tav({"files"}), done("Plan 1.dwg\n.tav/properties/ignore\n"));
    EXPECT_EQ(tav({"ignore", "--remove", "Plan (1).dwg"}), done("Removed the rule '^Plan \\(1\\)\\.dwg$'.\n"));
}

TEST_F(Ignore, RefusesARuleForAPath)
{
    repo.add({"sub dir/a.dwg"});
    std::string const message =
        "' has a '/', and rules are for single names. Give the name of the file or folder alone, as in 'tav ignore "
        "--add old' for a folder 'plans/old'.\n";
    for (std::string const typed : {"sub dir/", "sub dir/*.dwg"}) {
        EXPECT_EQ(tav({"ignore", "--add", typed}), failed("tav: '" + typed + message));
    }
    EXPECT_FALSE(repo.has(".tav/properties"));
}

TEST_F(Ignore, NotesThatANewRuleDoesNotApplyToCommittedAndStagedFiles)
{
    repo.add({"a.plt", "b.plt", "c.plt", "plots/d.dwg"});
    tav({"init"});
    tav({"add", "a.plt", "plots"});
    tav({"commit", "-m", "First"});
    tav({"add", "b.plt"});
    EXPECT_EQ(
        tav({"ignore", "--add", "*.plt"}),
        (Outcome{
            0, "Names that match '^.*\\.plt$' are ignored from now on.\n",
            "tav: The rule is for new files: it does not apply to 2 committed or staged files with such a name.\n"}));
    EXPECT_EQ(
        tav({"ignore", "--add", "plots", "--dry-run"}),
        (Outcome{
            0, "Names that match 'plots' would be ignored.\n",
            "tav: The rule is for new files: it does not apply to 1 committed or staged file with such a name.\n"}));
}

struct RemoveRow {
    char const* name;
    std::string before;
    std::string typed;
    std::string rule;
    std::string after;
};

class IgnoreRemove
    : public TavTest
    , public testing::WithParamInterface<RemoveRow> {};

TEST_P(IgnoreRemove, TakesTheRuleOutAndLeavesTheRest)
{
    repo.ignore(GetParam().before);
    EXPECT_EQ(tav({"ignore", "--remove=" + GetParam().typed}), done("Removed the rule '" + GetParam().rule + "'.\n"));
    EXPECT_EQ(repo.read(".tav/properties/ignore"), GetParam().after);
}

INSTANTIATE_TEST_SUITE_P(
    Files, IgnoreRemove,
    testing::Values(
        RemoveRow{"Only", "^a$", "^a$", "^a$", ""}, RemoveRow{"First", "^a$\n^b$\n", "^a$", "^a$", "^b$\n"},
        RemoveRow{"Last", "^a$\n^b$", "^b$", "^b$", "^a$\n"},
        RemoveRow{"Wildcard", "^.*\\.plt$\n^b$\n", "*.plt", "^.*\\.plt$", "^b$\n"},
        RemoveRow{"Twice", "^a$\n^b$\n^a$\n", "^a$", "^a$", "^b$\n"},
        RemoveRow{"OutOfEffect", "^a$\n\n^a$\n", "^a$", "^a$", "\n^a$\n"},
        RemoveRow{"OtherLineEnds", "^a$\r\n^b$\r\n", "^a$", "^a$", "^b$\r\n"},
        RemoveRow{"OtherScripts", "^План$\n^b$\n", "^План$", "^План$", "^b$\n"},
        RemoveRow{"AsStoredBeforeWildcard", "colou?r\n^colou.*$\n", "colou?r", "colou?r", "^colou.*$\n"}),
    support::rowName);

TEST_F(Ignore, KeepsTheOtherDefaultsWhenOneIsRemoved)
{
    EXPECT_EQ(tav({"ignore", "--remove", "*.bak"}), done("Removed the rule '^.*\\.bak$'.\n"));
    EXPECT_EQ(tav({"ignore"}), done("^.*\\.dwl$\n^.*\\.dwl2$\n"));
}

TEST_F(Ignore, FailsToRemoveWhatIsNotThere)
{
    std::string const message = "tav: There is no rule '^.*\\.plt$'. Run 'tav ignore' to see the rules.\n";
    EXPECT_EQ(tav({"ignore", "--remove", "*.plt"}), failed(message));
    EXPECT_EQ(tav({"ignore", "--remove", "*.plt", "--dry-run"}), failed(message));
    EXPECT_FALSE(repo.has(".tav/properties"));
}

TEST_F(Ignore, ChangesNothingOnADryRun)
{
    repo.add({"a.plt"});
    EXPECT_EQ(
        tav({"ignore", "--add", "*.plt", "--dry-run"}), done("Names that match '^.*\\.plt$' would be ignored.\n"));
    EXPECT_EQ(tav({"ignore", "--add", "^.*\\.bak$", "--dry-run"}), done("The rule '^.*\\.bak$' was there already.\n"));
    EXPECT_EQ(tav({"ignore", "--remove", "*.bak", "--dry-run"}), done("Would remove the rule '^.*\\.bak$'.\n"));
    EXPECT_FALSE(repo.has(".tav/properties"));
    EXPECT_FALSE(repo.has(".tav/tav.lock"));
}

TEST_F(Ignore, NamesTheRuleThatIgnoresAFile)
{
    EXPECT_EQ(
        tav({"ignore", "--why", "План.bak"}),
        done("A rule that every repository begins with matches 'План.bak': ^.*\\.bak$\n"));
    repo.ignore("^a$\n^old$\n");
    EXPECT_EQ(
        tavIn(repo.pathTo(".tav"), {"ignore", "--why", "../x/old/b.dwg"}),
        done("Rule 2 of '.tav/properties/ignore' matches 'old': ^old$\n"));
    EXPECT_EQ(tav({"ignore", "--why", "x/.git/b.dwg"}), done("'.git' is hidden: it begins with a dot.\n"));
    EXPECT_EQ(
        tav({"ignore", "--why", "x/a", "--json"}),
        done("{\n    \"ignored\" : true,\n    \"path\" : \"x/a\",\n    \"rule\" : \"^a$\"\n}\n"));
}

TEST_F(Ignore, SaysThatNoRuleIgnoresAFile)
{
    EXPECT_EQ(
        tav({"ignore", "--why", "plan.dwg"}),
        failed("tav: No rule ignores 'plan.dwg'. Run 'tav ignore' to see the rules.\n"));
    EXPECT_EQ(
        tav({"ignore", "--why", ".tav/properties/ignore"}),
        failed("tav: No rule ignores '.tav/properties/ignore'. Run 'tav ignore' to see the rules.\n"));
}

TEST_F(Ignore, RefusesANameThatIsTooLongForARule)
{
    repo.ignore("^(a)\\1*$\n");
    std::string const name(100000, 'a');
    EXPECT_EQ(
        tav({"ignore", "--why", name}),
        failed("tav: '" + name + "' is longer than a name can be. Type the path of a file.\n"));
}

TEST_F(Ignore, SaysThatACommittedFileIsNotIgnored)
{
    repo.add({"a.plt"});
    tav({"init"});
    tav({"add", "--all"});
    tav({"commit", "-m", "First"});
    tav({"ignore", "--add", "*.plt"});
    std::string const why = "tav: 'a.plt' is committed, so it is not ignored. Rule 4 of '.tav/properties/ignore' "
                            "matches 'a.plt': ^.*\\.plt$\n";
    EXPECT_EQ(tav({"ignore", "--why", "a.plt"}), failed(why));
    repo.write("a.plt", "changed");
    EXPECT_EQ(tav({"status", "-s"}).out.find(" M a.plt") != std::string::npos, true);
}

} // namespace
} // namespace host_tests
