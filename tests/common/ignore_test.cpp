#include "common/mu_common_file_utils.h"
#include "common/mu_common_repo_prop.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/foreign_locale.h"
#include "tests/support/rows.h"
#include "tests/support/small_stack.h"
#include "tests/support/temp_repository.h"
#include "tests/support/utf8.h"

#include <algorithm>
#include <functional>
#include <gmock/gmock.h>
#include <random>
#include <regex>
#include <set>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <vector>

namespace {

using common::RepoIgnore;
using support::TempRepository;
using testing::ElementsAre;
using testing::IsEmpty;

std::vector<std::string> rulesOf(RepoIgnore const& ignore)
{
    std::vector<std::string> rules;
    for (OdString const& rule : ignore.rules()) {
        rules.push_back(rule.ansi_str());
    }
    return rules;
}

std::set<std::string> scanned(TempRepository const& repository)
{
    Expected<std::vector<common::File>> const files = common::collectRepoFiles(repository.root());
    std::set<std::string> names;
    for (common::File const& file : files.value()) {
        names.insert(file.path.ansi_str());
    }
    return names;
}

bool anyCovers(std::vector<std::regex> const& expressions, std::string const& name)
{
    return std::any_of(expressions.begin(), expressions.end(), [&](std::regex const& expression) {
        return std::regex_match(name, expression);
    });
}

std::string repeated(std::string const& text, int times)
{
    std::string result;
    for (int i = 0; i < times; ++i) {
        result += text;
    }
    return result;
}

TEST(RepoIgnore, HasTheDefaultsWithoutAFile)
{
    TempRepository const repository;
    RepoIgnore const ignore(repository.root());
    EXPECT_THAT(rulesOf(ignore), ElementsAre(R"(^.*\.bak$)", R"(^.*\.dwl$)", R"(^.*\.dwl2$)"));
    EXPECT_EQ(ignore.expressions().size(), 3U);
    EXPECT_THAT(repository.list(), ElementsAre(".tav/"));
}

TEST(RepoIgnore, LiesInThePropertiesFolder)
{
    TempRepository const repository;
    EXPECT_EQ(RepoIgnore(repository.root()).ignorePath().ansi_str(), repository.path() + "/.tav/properties/ignore");
}

TEST(RepoIgnore, HasTheDefaultsWhenSomethingElseHasItsName)
{
    TempRepository const repository;
    repository.makeFolder(".tav/properties/ignore");
    EXPECT_EQ(RepoIgnore(repository.root()).rules().size(), 3U);
}

struct Content {
    char const* name;
    std::string bytes;
    std::vector<std::string> rules;
};

void PrintTo(Content const& row, std::ostream* out)
{
    *out << row.name;
}

class IgnoreFile : public testing::TestWithParam<Content> {};

TEST_P(IgnoreFile, HoldsTheseRules)
{
    TempRepository const repository;
    repository.ignore(GetParam().bytes);
    RepoIgnore const ignore(repository.root());
    EXPECT_EQ(rulesOf(ignore), GetParam().rules);
    EXPECT_EQ(ignore.expressions().size(), GetParam().rules.size());
}

INSTANTIATE_TEST_SUITE_P(
    Contents, IgnoreFile,
    testing::Values(
        Content{"Nothing", "", {}}, Content{"OneLine", "^a$", {"^a$"}},
        Content{"InTheOrderOfTheFile", "^b$\n^a$\n^b$\n", {"^b$", "^a$", "^b$"}},
        Content{"EmptyLineEndsTheList", "^a$\n\n^b$", {"^a$"}}, Content{"EmptyLineFirst", "\n^a$", {}},
        Content{"CarriageReturns", "^a$\r\n^b$\r\n\r\n^c$\r\n", {"^a$", "^b$"}},
        Content{"ByteOrderMark", "\xEF\xBB\xBF^a$", {"^a$"}},
        Content{"BlanksBelongToTheRule", " a \n\t", {" a ", "\t"}}, Content{"NumberSignIsNoComment", "#a", {"#a"}},
        Content{"OutsideAscii", "^\u56FE$", {"^\u56FE$"}}, Content{"NotUtf8", "^\xFF\x80$", {"^\xFF\x80$"}}),
    support::rowName);

TEST(RepoIgnore, AppendsTheRulesWhenItLoadsAgain)
{
    TempRepository const repository;
    repository.ignore("^a$\n^b$");
    RepoIgnore ignore(repository.root());
    repository.ignore("^c$");
    ignore.load();
    EXPECT_THAT(rulesOf(ignore), ElementsAre("^a$", "^b$", "^c$"));
    std::vector<std::regex> const expressions = ignore.expressions();
    ASSERT_EQ(expressions.size(), 3U);
    EXPECT_TRUE(std::regex_match("c", expressions[2]));
}

TEST(RepoIgnore, AppendsTheDefaultsAgain)
{
    TempRepository const repository;
    RepoIgnore ignore(repository.root());
    ignore.load();
    EXPECT_EQ(ignore.expressions().size(), 6U);
    EXPECT_EQ(ignore.rules()[3], OdString(LR"(^.*\.bak$)"));
}

TEST(RepoIgnore, DoesNotWatchItsFile)
{
    TempRepository const repository;
    repository.ignore("^a$");
    RepoIgnore const ignore(repository.root());
    repository.ignore("^b$\n^c$");
    EXPECT_THAT(rulesOf(ignore), ElementsAre("^a$"));
}

TEST(RepoIgnore, GivesACopyOfItsExpressions)
{
    TempRepository const repository;
    RepoIgnore const ignore(repository.root());
    ignore.expressions().clear();
    EXPECT_EQ(ignore.expressions().size(), 3U);
}

std::string thrownAsOrdinaryUser(std::function<void()> const& body)
{
    return support::asOrdinaryUser([&]() -> std::string {
        try {
            body();
        } catch (OdError const& error) {
            return error.description().ansi_str();
        }
        return "nothing was thrown";
    });
}

// It would count as empty, and a scan would offer what is meant to stay out.
TEST(RepoIgnore, ThrowsWhenItsFileCannotBeRead)
{
    TempRepository const repository;
    repository.ignore("^a$");
    repository.add({"a"});
    std::string const file = repository.pathTo(".tav/properties/ignore");
    ASSERT_EQ(chmod(repository.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(file.c_str(), 0), 0);
    std::string const message = "Could not read Ignore file '" + file + "'.";
    EXPECT_EQ(thrownAsOrdinaryUser([&] { RepoIgnore const rules(repository.root()); }), message);
    EXPECT_EQ(thrownAsOrdinaryUser([&] { static_cast<void>(common::collectRepoFiles(repository.root())); }), message);
}

TEST(RepoIgnoreWrite, CreatesTheFileWithTheDefaults)
{
    TempRepository const repository;
    repository.makeFolder(".tav/properties");
    EXPECT_TRUE(RepoIgnore::write(repository.root()).hasValue());
    EXPECT_EQ(repository.read(".tav/properties/ignore"), "^.*\\.bak$\n^.*\\.dwl$\n^.*\\.dwl2$");
    EXPECT_THAT(repository.list(), ElementsAre(".tav/", ".tav/properties/", ".tav/properties/ignore"));
}

TEST(RepoIgnoreWrite, ReadsBackAsTheDefaults)
{
    TempRepository const repository;
    std::vector<std::string> const before = rulesOf(RepoIgnore(repository.root()));
    repository.makeFolder(".tav/properties");
    ASSERT_TRUE(RepoIgnore::write(repository.root()).hasValue());
    EXPECT_EQ(rulesOf(RepoIgnore(repository.root())), before);
}

TEST(RepoIgnoreWrite, LeavesAnExistingFileAlone)
{
    for (char const* content : {"^mine$\n", "", "("}) {
        TempRepository const repository;
        repository.ignore(content);
        EXPECT_TRUE(RepoIgnore::write(repository.root()).hasValue());
        EXPECT_EQ(repository.read(".tav/properties/ignore"), content);
    }
}

TEST(RepoIgnoreWrite, FailsWithoutThePropertiesFolder)
{
    TempRepository const repository;
    WriteOutcome const outcome = RepoIgnore::write(repository.root());
    ASSERT_FALSE(outcome.hasValue());
    EXPECT_EQ(outcome.error().message.ansi_str(), "Failed to write Ignore file.");
    EXPECT_EQ(outcome.error().code, 0);
    EXPECT_THAT(repository.list(), ElementsAre(".tav/"));
}

TEST(RepoIgnoreWrite, FailsWhereAFolderHasTheName)
{
    TempRepository const repository;
    repository.makeFolder(".tav/properties/ignore");
    EXPECT_EQ(RepoIgnore::write(repository.root()).error().message.ansi_str(), "Failed to write Ignore file.");
}

TEST(RepoIgnoreWrite, FailsWhereNothingMayBeWritten)
{
    TempRepository const repository;
    repository.makeFolder(".tav/properties");
    ASSERT_EQ(chmod(repository.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(repository.pathTo(".tav/properties").c_str(), 0555), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] {
            WriteOutcome const outcome = RepoIgnore::write(repository.root());
            return outcome.hasValue() ? "written" : outcome.error().message.ansi_str();
        }),
        "Failed to write Ignore file.");
    EXPECT_THAT(repository.list(), ElementsAre(".tav/", ".tav/properties/"));
}

struct Rule {
    char const* name;
    char const* rules; // null: there is no ignore file
    std::string file;
    bool ignored;
};

void PrintTo(Rule const& row, std::ostream* out)
{
    *out << row.name;
}

class IgnoreRules : public testing::TestWithParam<Rule> {};

TEST_P(IgnoreRules, DecideOnAName)
{
    TempRepository const repository;
    if (GetParam().rules != nullptr) {
        repository.ignore(GetParam().rules);
    }
    repository.add({GetParam().file});
    EXPECT_EQ(scanned(repository).count(GetParam().file), GetParam().ignored ? 0U : 1U);
    EXPECT_EQ(anyCovers(RepoIgnore(repository.root()).expressions(), GetParam().file), GetParam().ignored);
}

constexpr bool ignored = true;
constexpr bool kept = false;

INSTANTIATE_TEST_SUITE_P(
    Cases, IgnoreRules,
    testing::Values(
        Rule{"DefaultsDropBackups", nullptr, "plan.bak", ignored},
        Rule{"DefaultsDropLocks", nullptr, "plan.dwl", ignored},
        Rule{"DefaultsDropLocksOfTheSecondForm", nullptr, "plan.dwl2", ignored},
        Rule{"DefaultsKeepDrawings", nullptr, "plan.dwg", kept},
        Rule{"DefaultsKeepADrawingNamedAfterABackup", nullptr, "plan.bak.dwg", kept},
        Rule{"DefaultsKeepOtherCase", nullptr, "PLAN.BAK", kept},
        Rule{"DefaultsKeepAnEndingWithoutItsDot", nullptr, "planbak", kept},
        Rule{"DefaultsKeepAnotherLock", nullptr, "plan.dwl3", kept},
        Rule{"DefaultsKeepABackupWithALineFeed", nullptr, "plan\n.bak", kept},
        Rule{"DefaultsDropBackupsThatAreNotUtf8", nullptr, "pl\xE4n.bak", ignored},
        Rule{"DefaultsDoNotApplyBesideAnEmptyFile", "", "plan.bak", kept},
        Rule{"DefaultsDoNotApplyBesideOtherRules", "^a$", "plan.bak", kept},
        Rule{"PatternMustCoverTheWholeName", "old", "older.dwg", kept},
        Rule{"PatternCoversTheWholeName", "old", "old", ignored}, Rule{"EmptyLineEndsTheList", "^a$\n\n^b$", "b", kept},
        Rule{"LetterCaseCounts", "^PLAN$", "plan", kept}, Rule{"BlanksCount", " plan", "plan", kept},
        Rule{"DotIsAnyCharacter", "^pl.n$", "plan", ignored}, Rule{"EscapedDotIsADot", "^pl\\.n$", "plan", kept},
        Rule{"Beginning", "^tmp.*$", "tmp1", ignored}, Rule{"BeginningOfAnother", "^tmp.*$", "1tmp", kept},
        Rule{"Middle", "^.*tmp.*$", "1tmp2", ignored}, Rule{"MiddleIsMissing", "^.*tmp.*$", "1tm2p", kept},
        Rule{"Anything", "^.*$", "plan.dwg", ignored}, Rule{"AnythingButALineFeed", "^.*$", "a\nb", kept},
        Rule{"Class", "^[a-c]+\\d{2}$", "abc42", ignored}, Rule{"Alternatives", "^(a|b)$|^c$", "c", ignored},
        Rule{"BackReference", "^(.)\\1$", "aa", ignored}, Rule{"BackReferenceToAnother", "^(.)\\1$", "ab", kept},
        Rule{"LookAhead", "^(?!plan).*$", "draft.dwg", ignored},
        Rule{"LookAheadRefuses", "^(?!plan).*$", "plan.dwg", kept},
        Rule{"OutsideAsciiIsSeveralBytes", "^.$", "\u00E4", kept},
        Rule{"OutsideAsciiByItsBytes", "^..$", "\u00E4", ignored},
        Rule{"OutsideAscii", "^\u56FE.*$", "\u56FE.dwg", ignored}, Rule{"NotUtf8", "^\xFF.*$", "\xFF.dwg", ignored},
        Rule{"EscapedDollar", "^a\\$", "a$", ignored}, Rule{"EscapedStar", "^a\\.*$", "a...", ignored},
        Rule{"EscapedBackslash", "^a\\\\$", "a\\", ignored}, Rule{"Placeholders", "^%s%n$", "%s%n", ignored}),
    support::rowName);

TEST(IgnoreRulesOfARepository, TellWhatAScanSkips)
{
    TempRepository const repository;
    repository.ignore("^.*\\.bak$\n(a*)*b\n^(a*)\\1c$");
    RepoIgnore const rules(repository.root());
    EXPECT_TRUE(rules.matches(L"plan.bak"));
    EXPECT_FALSE(rules.matches(L"plan.bak.dwg"));
    EXPECT_FALSE(rules.matches(support::fromUtf8(std::string(255, 'a'))));
    EXPECT_TRUE(rules.matches(support::fromUtf8(std::string(254, 'a') + "c")));
    EXPECT_THROW(static_cast<void>(rules.matches(support::fromUtf8(std::string(2'000, 'a')))), std::regex_error);
}

char const* const kInvalid[] = {"(",      ")",    "a)",    "[",     "[a",       "*a",   "+",       "?",   "a{2",
                                "a{3,2}", "a{x}", "\\",    "[b-a]", "[[:x:]]",  "(?a",  "(?<n>a)", "\\1", "(a",
                                "a{,2}",  "\\x1", "\\u12", "(*)",   "[[.ab.]]", "(?=a", "a**+(",   "^*",  "(\\2)"};

TEST(InvalidRule, IsThrownOut)
{
    for (char const* rule : kInvalid) {
        EXPECT_THROW(RepoIgnore::compile(support::fromUtf8(rule)), std::regex_error) << rule;
    }
}

TEST(InvalidRule, ReachesTheCallerOfTheScan)
{
    TempRepository const repository;
    repository.ignore("^a$\n(\n^b$");
    EXPECT_THROW(RepoIgnore(repository.root()), std::regex_error);
    EXPECT_THROW(static_cast<void>(common::collectRepoFiles(repository.root())), std::regex_error);
}

TEST(InvalidRule, IsNotSeenBehindAnEmptyLine)
{
    TempRepository const repository;
    repository.ignore("^a$\n\n(");
    EXPECT_THAT(rulesOf(RepoIgnore(repository.root())), ElementsAre("^a$"));
}

/// How a rule fares: refused as too complex, or matching or not.
std::string fate(std::string const& rule, std::string const& name)
{
    std::string result;
    support::onSmallStack([&] {
        try {
            result = std::regex_match(name, RepoIgnore::compile(support::fromUtf8(rule))) ? "match" : "no match";
        } catch (std::regex_error const& error) {
            result = error.code() == std::regex_constants::error_complexity ? "refused" : error.what();
        }
    });
    return result;
}

struct Hostile {
    char const* name;
    std::string rule;
    std::string text;
    char const* fate;
};

void PrintTo(Hostile const& row, std::ostream* out)
{
    *out << row.name;
}

class HostileRule : public testing::TestWithParam<Hostile> {};

TEST_P(HostileRule, IsAnsweredOrRefused)
{
    EXPECT_EQ(fate(GetParam().rule, GetParam().text), GetParam().fate);
}

std::string const kLong(250, 'a');
std::string const kVeryLong(100'000, 'a');
std::string const kLookAheads = repeated("(?=.*x)", 50);

INSTANTIATE_TEST_SUITE_P(
    ManyWays, HostileRule,
    testing::Values(
        Hostile{"StarOfStar", "(a*)*b", kLong, "no match"},
        Hostile{"StarOfStarMatches", "(a*)*b", kLong + "b", "match"},
        Hostile{"PlusOfPlus", "(a+)+b", kLong, "no match"}, Hostile{"EqualAlternatives", "(a|a)*b", kLong, "no match"},
        Hostile{"OverlappingAlternatives", "^(a|aa)+$", kLong + "b", "no match"},
        Hostile{"EmptyAlternative", "(|a|)*b", kLong, "no match"},
        Hostile{"OneBehindTheOther", "(.*)*(.*)*(.*)*(.*)*b", kLong, "no match"},
        Hostile{"ManyOptions", repeated("a?", 250) + repeated("a", 250), kLong, "match"},
        Hostile{"LazyLoops", "(a*?)*?b", kLong, "no match"},
        Hostile{"NestedHundredDeep", repeated("(", 100) + "a" + repeated(")*", 100), kLong, "match"},
        Hostile{"SeveralLookAheads", "(" + kLookAheads + ".)*", kLong, "no match"}),
    support::rowName);

std::string alternativesOf(std::size_t count)
{
    std::string text;
    for (std::size_t i = 0; i < count; ++i) {
        text += (i > 0 ? "|" : "") + std::string("plan-of-level-") + std::to_string(100 + i);
    }
    return "(" + text + ")";
}

// Valid and harmless: nobody would understand a refusal.
INSTANTIATE_TEST_SUITE_P(
    Harmless, HostileRule,
    testing::Values(
        Hostile{"AllButAFewNames", "^(?!" + alternativesOf(30) + R"(\.dwg$).*$)", "plan-of-level-130.dwg", "match"},
        Hostile{"NoneOfAFewNames", "^(?!" + alternativesOf(30) + R"(\.dwg$).*$)", "plan-of-level-129.dwg", "no match"},
        Hostile{"NoneOfAFewNamesAnywhere", "^(?!.*" + alternativesOf(30) + ").*$", kLong, "match"},
        Hostile{"NeverOneOfManyNames", "^((?!" + alternativesOf(250) + ").)*$", kLong, "match"},
        Hostile{"OneOfManyNames", "^" + alternativesOf(250) + R"(\.dwg$)", "plan-of-level-349.dwg", "match"},
        Hostile{"AnythingAndOneOfManyNames", "^.*" + alternativesOf(250) + ".*$", kLong, "no match"},
        Hostile{"NameWithItsNumberAndItself", R"(^([a-z]+)[0-9]*_\1.*\.dwg$)", "plan12_plan-b.dwg", "match"},
        Hostile{"NameWithItsNumberAndAnother", R"(^([a-z]+)[0-9]*_\1.*\.dwg$)", kLong, "no match"},
        Hostile{"TwoWordsTwice", R"(^(\w+)-(\w+)-\1-\2.*$)", "a-b-a-b.dwg", "match"},
        Hostile{"TwoWordsAndOthers", R"(^(\w+)-(\w+)-\1-\2.*$)", "a-b-a-c.dwg", "no match"},
        Hostile{"OneCharacterOnly", R"(^(.)\1+$)", kLong, "match"},
        Hostile{"OneCharacterAndAnother", R"(^(.)\1+$)", kLong + "b", "no match"},
        Hostile{"TwoPartsTwice", R"(^(.*)_(.*)_\1_\2$)", "a_b_a_b", "match"},
        Hostile{"AlternativesTwice", R"(^(plan|site)-([0-9]+|[a-z]+)_\1$)", "site-12_site", "match"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    LongTexts, HostileRule,
    testing::Values(
        Hostile{"AnyText", ".*", kVeryLong, "match"}, Hostile{"AnyTextInAGroup", "(.)*", kVeryLong, "match"},
        Hostile{"Alternatives", "(a|b)*", kVeryLong, "match"}, Hostile{"LazyLoop", ".*?b", kVeryLong, "no match"},
        Hostile{"StarOfStar", "(a*)*b", kVeryLong, "no match"},
        Hostile{"Ending", "^.*\\.bak$", kVeryLong + ".bak", "match"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    TooDeep, HostileRule,
    testing::Values(
        Hostile{"HundredGroups", repeated("(", 100) + "a" + repeated(")", 100), "a", "match"},
        Hostile{"HundredAndOneGroups", repeated("(", 101) + "a" + repeated(")", 101), "a", "refused"},
        Hostile{"GroupsWithoutNumber", repeated("(?:", 101) + "a" + repeated(")", 101), "a", "refused"},
        Hostile{"ThousandsOfGroups", repeated("(", 5000) + "a" + repeated(")", 5000), "a", "refused"},
        Hostile{"GroupsNeverClosed", std::string(1'000'000, '('), "a", "refused"},
        Hostile{"LoopsOfLoops", repeated("(", 5000) + "a" + repeated(")*", 5000), "a", "refused"},
        Hostile{"GroupsOneBehindTheOther", repeated("(a)", 300), std::string(300, 'a'), "match"},
        Hostile{"NestedLookAheads", "(?=(?=a)a)a", "a", "match"},
        Hostile{"NestedNegativeLookAheads", "(?!a(?!b))a", "a", "no match"},
        Hostile{"LookAheadInAGroupOfALookAhead", "(?=(a(?=b)))ab", "ab", "match"},
        Hostile{"LookAheadBehindAGroupOfALookAhead", "(?=(a)(?=b))ab", "ab", "match"},
        Hostile{"NestedLookAheadsInALoop", "((?=.*(?=.*)).)*", kLong, "refused"},
        Hostile{"ThousandsOfNestedLookAheads", repeated("(?=", 5000) + repeated(")", 5000), "a", "refused"},
        Hostile{"LookAheadsOneBehindTheOther", "(?=a)(?!b)a", "a", "match"},
        Hostile{"EscapedParenthesesAreText", repeated("\\(", 300), std::string(300, '('), "match"},
        Hostile{"ParenthesesInAClassAreText", "[" + std::string(300, '(') + "]", "(", "match"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    TooLarge, HostileRule,
    testing::Values(
        Hostile{"RepetitionsOfRepetitions", "((a{100}){100}){100}", kLong, "refused"},
        Hostile{"RepetitionsWithoutGroups", "a{100}{100}{100}", kLong, "refused"},
        Hostile{"OneLargeRepetition", "a{100000}", kLong, "refused"},
        Hostile{"LargestNumber", "a{2147483647}", kLong, "refused"},
        Hostile{"BeyondTheLargestNumber", "a{99999999999999999999999}", kLong, "refused"},
        Hostile{"UpperBoundCounts", "a{0,100000}", kLong, "refused"},
        Hostile{"LowerBoundCounts", "a{100000,}", kLong, "refused"},
        Hostile{"LongLine", std::string(100'000, 'a'), kLong, "refused"},
        Hostile{"ManyRepetitions", repeated("a{500}", 50), kLong, "refused"},
        Hostile{"RepeatedClass", "[a-z]{1000}", kLong, "no match"},
        Hostile{"ClassRepeatedOften", "[a-z]{20000}", kLong, "refused"},
        Hostile{"RepetitionsOfARepetition", "a" + repeated("{1}", 5000), kLong, "refused"},
        Hostile{"ManyAlternatives", repeated("a|", 5000), kLong, "refused"},
        Hostile{"LoopsOneBehindTheOther", repeated("(a*)*", 5000), kLong, "refused"},
        Hostile{"RepetitionsThatFit", "((a{5}){5}){10}", kLong, "match"},
        Hostile{"RepetitionThatFits", "a{250}", kLong, "match"}, Hostile{"RangeThatFits", "a{1,300}", kLong, "match"},
        Hostile{"LineThatFits", kLong, kLong, "match"},
        Hostile{"LookAheadInALargeRule", "(?=a)" + std::string(500, 'a'), kLong, "no match"},
        Hostile{"LargeLookAheadInALoop", "((?!" + repeated("a*", 300) + "b).)*", kLong, "refused"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    BackReferences, HostileRule,
    testing::Values(
        Hostile{"Doubled", "^(.)\\1$", "aa", "match"}, Hostile{"NotDoubled", "^(.)\\1$", "ab", "no match"},
        Hostile{"DoubledText", "^(.*)\\1$", kLong, "match"}, Hostile{"ToTheSecondGroup", "(a)(b)\\2", "abb", "match"},
        Hostile{"WithAFewAlternatives", "^(plan|site)_(a|b)\\2$", "site_bb", "match"},
        Hostile{"ToAGroupBeyondAllNumbers", "(a)\\" + std::string(60, '2'), "aa", "refused"},
        Hostile{"ToTheLastGroupThatCouldBe", "(a)\\99999", "aa", "refused"},
        Hostile{"BesideALoopOfLoops", "(a*)*\\1b", kLong, "refused"},
        Hostile{"InALoop", "(a)(\\1)*b", kLong, "no match"}, Hostile{"RepeatedItself", "(a)\\1*b", kLong, "no match"},
        Hostile{"BesideAFewLoops", "(a*)(a*)\\1b", kLong, "no match"},
        Hostile{"BesideManyLoops", "(a*)(a*)(a*)(a*)\\1b", kLong, "refused"},
        Hostile{"BesideALoopOfWords", "(a)\\1(b+c)*", "aa" + repeated("bbc", 80), "match"},
        Hostile{"BesideALoopOfWordsThatRunTogether", "(a)\\1(b+b)*c", "aa" + std::string(250, 'b'), "refused"},
        Hostile{"BesideALoopThatMayCoverNothing", "(a)\\1(b?)*c", "aa" + std::string(250, 'b'), "refused"},
        Hostile{"BesideALoopOfAlternatives", "(a)\\1(b|c)*", "aa" + repeated("bc", 120), "match"},
        Hostile{"BesideALoopOfEqualAlternatives", "(a)\\1(b|b)*c", "aa" + std::string(250, 'b'), "refused"},
        Hostile{"BesideALoopOfOptions", "(a)\\1(b?b)*c", "aa" + std::string(250, 'b'), "refused"},
        Hostile{"BesideALoopOfClassesThatMeet", "(a)\\1([ab]*[bc])*d", "aa" + std::string(250, 'b'), "refused"},
        Hostile{"BesideALoopOfOtherClasses", "(a)\\1([ab]*[cd])*", "aa" + repeated("bc", 120), "match"},
        Hostile{"BesideALoopOfItself", "(a)(\\1+\\1)*b", kLong, "refused"},
        Hostile{"BesideACountedLoopOfLoops", "(a)\\1(b*){30}c", "aa" + std::string(250, 'b'), "refused"},
        Hostile{"BesideManyOptions", "(a)\\1" + repeated("b?", 40) + "c", "aa" + std::string(250, 'b'), "refused"},
        Hostile{"OfManyGroupsInALoop", "((((((a))))))*\\1", kLong, "refused"},
        Hostile{"BesideARepeatedGroup", "(a|a){40}\\1b", kLong, "refused"},
        Hostile{"BesideManyAlternatives", repeated("(a|a)", 40) + "\\1b", kLong, "refused"},
        Hostile{"BesideALookAhead", "(?=a)(a)\\1", "aa", "match"},
        Hostile{"InALookAhead", "(a)(?!\\1)b", "ab", "match"},
        Hostile{"BesideALookAheadInALoop", "(a)\\1((?!.*x).)*", "aa" + std::string(250, 'b'), "match"},
        Hostile{"BesideALookAheadOfManyWays", "(a)\\1(?=(b*)*c).*", "aa" + std::string(250, 'b'), "refused"},
        Hostile{"BesideALookAheadBehindALoop", "(a)\\1.*.*.*(?=.*x)y", "aa" + std::string(250, 'b'), "refused"},
        Hostile{"EscapedBackslashIsNone", "(a*)*\\\\1", "a\\1", "match"}),
    support::rowName);

// From U+0400, Cyrillic and others.
std::string alternativesByNumber(std::size_t count)
{
    constexpr std::string_view kDigits = "0123456789abcdef";
    std::string text;
    for (std::size_t code = 0x400; code < 0x400 + count; ++code) {
        text += code > 0x400 ? "|\\u0" : "\\u0";
        for (unsigned const shift : {8U, 4U, 0U}) {
            text += kDigits[code >> shift & 15U];
        }
    }
    return text;
}

// Few steps, but each takes far longer than most, or compiling does.
INSTANTIATE_TEST_SUITE_P(
    LongSteps, HostileRule,
    testing::Values(
        Hostile{"LookAheadsInALargeRule", "(.*" + repeated("(?!b)", 800) + ")|x{8000}", kLong, "refused"},
        Hostile{"LongLookAheadsInALargeRule", "(.*" + repeated("(?=.*)", 100) + ")|x{8000}", kLong, "refused"},
        Hostile{"LookAheadsBesideABackReference", "(a*)(a*)" + repeated("(?!\\1b)", 80) + "c", kLong, "refused"},
        Hostile{
            "LookAheadsInALargeRuleWithABackReference", "(a*)(" + repeated("(?!b)", 400) + "|x{8000})\\1b", kLong,
            "refused"},
        Hostile{"WordBoundaries", ".*" + repeated("\\B", 7000) + "b", kLong, "refused"},
        Hostile{"WordBoundariesBesideABackReference", "(a*)(a*)" + repeated("\\B", 400) + "\\1b", kLong, "refused"},
        Hostile{"WordsThatFit", ".*\\bplan\\b.*", "a plan b", "match"},
        Hostile{"Classes", repeated("[b]", 8000), kLong, "refused"},
        Hostile{"NamedClasses", repeated("\\d", 8000), kLong, "refused"},
        Hostile{"ClassesThatFit", repeated("[b]", 400) + "\\w{4000}", kLong, "no match"},
        Hostile{
            "CharactersByNumberBesideABackReference", "(a|" + alternativesByNumber(1500) + ")\\1", kLong, "refused"}),
    [](auto const& row) { return row.param.name; });

// These need more than a small stack, but no more than a thread has by itself.
TEST(LargeRule, IsAnsweredUpToItsLimit)
{
    for (std::string const& rule :
         {repeated("a", 8000), repeated("a?", 8000), repeated("a|", 4000), repeated("()", 2000),
          repeated("(|a)*", 1500), repeated("^", 8000), repeated("(", 100) + repeated("a|", 3900) + repeated(")*", 100),
          std::string("a{16000}"), std::string("(a?){2000}"), repeated("(?=", 99) + "a" + repeated(")", 99),
          std::string("((a))*()\\3")}) {
        EXPECT_NO_THROW({
            std::regex const compiled = RepoIgnore::compile(support::fromUtf8(rule));
            EXPECT_FALSE(std::regex_match("b", compiled)) << rule.substr(0, 20);
        }) << rule.substr(0, 20);
    }
}

TEST(LargeRule, IsAnsweredForTheLongestTextThatABackReferenceIsFollowedThrough)
{
    std::regex const compiled = RepoIgnore::compile(L"((a))*()\\3");
    EXPECT_TRUE(std::regex_match(std::string(1024, 'a'), compiled));
}

TEST(HostileIgnoreFile, IsAnsweredByAScanOfLongNames)
{
    TempRepository const repository;
    repository.ignore("(a*)*b\n(.*)*(.*)*x\n^(.*)\\1$\n(a|a)*c");
    std::string const longest(254, 'a');
    repository.add({longest + "b", longest + "c", longest + "d", longest, "sub/" + longest + "e"});
    EXPECT_THAT(scanned(repository), ElementsAre(".tav/properties/ignore", longest + "d", "sub/" + longest + "e"));
}

TEST(HostileIgnoreFile, IsRefusedByTheScan)
{
    TempRepository const repository;
    repository.add({"plan.dwg"});
    repository.ignore("^a$\n" + std::string(100'000, '('));
    support::onSmallStack(
        [&] { EXPECT_THROW(static_cast<void>(common::collectRepoFiles(repository.root())), std::regex_error); });
}

struct SameEverywhere {
    char const* rule;
    char const* text;
    bool matches;
};

constexpr SameEverywhere kSameEverywhere[] = {
    {"^\\d+$", "2024", true},
    {"^\\d+$", "plan", false},
    {"^[[:alpha:]]+$", "plan", true},
    {"^[[:alpha:]]+$", "42", false},
    {"^[[:upper:]]+$", "ab", false},
    {"^\\w+$", "a_1", true},
    {"^\\w+$", "a b", false},
    {"^\\s$", " ", true},
    {"^\\s$", "a", false},
    {"^a\\b.b$", "a-b", true},
    {"^a\\b.b$", "aab", false},
    {"^[a-c]{2,12}$", "abcabc", true},
    {"^a{10}$", "aaaaaaaaaa", true},
    {"^plan$", "PLAN", false},
    {"^(.)\\1$", "aa", true},
    {"^(.)\\1$", "aA", false},
    {"^\\x41\\u0042\\0?$", "AB", true},
    {"^[\\d-]+$", "1-2", true},
};

class RuleUnderLocale : public testing::TestWithParam<char const*> {};

INSTANTIATE_TEST_SUITE_P(Locales, RuleUnderLocale, testing::Values("C", "C.UTF-8"), [](auto const& row) {
    return row.index == 0 ? "C" : "C_UTF_8";
});

TEST_P(RuleUnderLocale, IsCompiledAndMatchedTheSame)
{
    support::ForeignLocale const locale(GetParam());
    for (SameEverywhere const& row : kSameEverywhere) {
        EXPECT_EQ(std::regex_match(row.text, RepoIgnore::compile(support::fromUtf8(row.rule))), row.matches)
            << row.rule << " on " << row.text;
    }
}

TEST_P(RuleUnderLocale, IsReadAndWrittenTheSame)
{
    TempRepository const repository;
    repository.makeFolder(".tav/properties");
    repository.add({"plan.bak", "pl\xE4n.bak", "plan.dwg"});
    support::ForeignLocale const locale(GetParam());
    EXPECT_TRUE(RepoIgnore::write(repository.root()).hasValue());
    EXPECT_EQ(repository.read(".tav/properties/ignore"), "^.*\\.bak$\n^.*\\.dwl$\n^.*\\.dwl2$");
    EXPECT_THAT(scanned(repository), ElementsAre(".tav/properties/ignore", "plan.dwg"));
}

/// Writes expressions at random, always the same ones. Quantifiers stand on what holds none itself: on the others the
/// standard library's own way of matching takes for ever.
class Expressions {
public:
    /// Not a long one: the library may refuse that as too large.
    std::string next()
    {
        std::string text = alternatives(3);
        return text.size() < 200 ? text : next();
    }

private:
    unsigned upTo(unsigned most) { return std::uniform_int_distribution<unsigned>(0, most)(random_); }

    template <std::size_t N>
    std::string anyOf(char const* const (&texts)[N])
    {
        return texts[upTo(N - 1)];
    }

    std::string alternatives(int depth)
    {
        std::string text = sequence(depth);
        for (unsigned more = upTo(5); more > 3; --more) {
            text += "|" + sequence(depth);
        }
        return text;
    }

    std::string sequence(int depth)
    {
        std::string text;
        for (unsigned left = upTo(4); left > 0; --left) {
            text += term(depth);
        }
        return text;
    }

    std::string term(int depth)
    {
        static constexpr char const* kAssertions[] = {"^", "$", "\\b", "\\B", "(?=a)", "(?!b.)", "(?=.*[ab]$)"};
        static constexpr char const* kAtoms[] = {
            "a",     "b", ".",   "\\.",    "[ab]",        "[^a]", "\\w",   "\\W",   "\\d",  "1",  "\\x61",
            "[1-9]", "-", "\\s", "[\\w.]", "[[:alpha:]]", "(a)",  "(?:b)", "(a|b)", "(|a)", "()", "(ab|a)"};
        static constexpr char const* kQuantifiers[] = {"*",   "+",   "?",    "*?",    "+?",     "??",
                                                       "{2}", "{0}", "{1,}", "{0,2}", "{1,3}?", "{2,}?"};
        unsigned const kind = upTo(9);
        if (kind == 0) {
            return anyOf(kAssertions);
        }
        if (kind < 3 && depth > 0) {
            return (upTo(1) == 0 ? "(" : "(?:") + alternatives(depth - 1) + ")";
        }
        return anyOf(kAtoms) + (upTo(2) == 0 ? anyOf(kQuantifiers) : "");
    }

    std::mt19937 random_{20240305};
};

class Names {
public:
    std::string next()
    {
        static constexpr char kCharacters[] = "aaabb1.-_ \n\xC3";
        std::string name(std::uniform_int_distribution<std::size_t>(0, 7)(random_), ' ');
        for (char& c : name) {
            c = kCharacters[std::uniform_int_distribution<std::size_t>(0, sizeof kCharacters - 2)(random_)];
        }
        return name;
    }

private:
    std::mt19937 random_{20240306};
};

TEST(RandomRule, MatchesWhatTheStandardLibrarySays)
{
    Expressions expressions;
    Names names;
    for (int i = 0; i < 1000; ++i) {
        std::string const expression = expressions.next();
        std::regex const ours = RepoIgnore::compile(support::fromUtf8(expression));
        std::regex const standard(expression);
        for (int j = 0; j < 20; ++j) {
            std::string const name = names.next();
            EXPECT_EQ(std::regex_match(name, ours), std::regex_match(name, standard)) << expression << " on " << name;
        }
    }
}

/// Rules near the shapes that users write: a text with something before or behind it.
std::string nearlyPlain(std::mt19937& random)
{
    static constexpr char const* kStarts[] = {"", "^", "^.*", ".*", "^.", ".*.*", "^^", "\\^"};
    static constexpr char const* kTexts[] = {"",   "a",    "ab", "\\.", "a\\.b", ".",   "\\$", "\\\\",
                                             "a*", "\xC3", "-",  "\\-", "/",     "[a]", "a|b"};
    static constexpr char const* kEnds[] = {"", "$", ".*$", ".*", "\\$", "\\.*", "\\\\$", "$$", ".*?", "\\.*$"};
    auto const one = [&](auto const& texts) {
        return std::string(texts[std::uniform_int_distribution<std::size_t>(0, std::size(texts) - 1)(random)]);
    };
    return one(kStarts) + one(kTexts) + one(kTexts) + one(kEnds);
}

TEST(RandomRule, IgnoresInAScanWhatItCovers)
{
    TempRepository const repository;
    std::set<std::string> const names = {
        "a",  "b", "ab",  "ba",  "aab",  "a.b",   "b.a", "a.",   "a$",   "$",   "\\",      "a\\", "\\a",
        "^a", "^", "-",   "a-b", "\xC3", "a\xC3", "a\n", "\nab", "a\nb", "a\r", "ab.a.b",  "a..", "a...",
        "a*", "A", "aaa", "bbb", "a.bb", "axb",   "*",   "|",    "a|b",  "[a]", "\xC3\xA4"};
    for (std::string const& name : names) {
        repository.add({name});
    }
    std::mt19937 random(20240307);
    for (int i = 0; i < 500; ++i) {
        std::string const rule = nearlyPlain(random);
        if (rule.empty()) {
            continue;
        }
        repository.ignore(rule);
        std::set<std::string> expected;
        std::copy_if(names.begin(), names.end(), std::inserter(expected, expected.end()), [&](std::string const& name) {
            return !std::regex_match(name, std::regex(rule));
        });
        if (!std::regex_match("ignore", std::regex(rule))) {
            expected.insert(".tav/properties/ignore");
        }
        EXPECT_EQ(scanned(repository), expected) << rule;
    }
}

} // namespace
