#include "common/mu_common_diff.h"

#include "tests/support/temp_folder.h"
#include "tests/support/utf8.h"

#include <gmock/gmock.h>
#include <optional>
#include <regex>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <variant>
#include <vector>

namespace {

using common::FileChange;
using common::filePattern;
using common::RepoChanges;
using common::RepoFileExplorer;
using common::StagedFile;
using common::StatusRef;
using testing::ElementsAre;
using testing::IsEmpty;

using Found = std::variant<StagedFile, std::monostate, ErrorMessage>;

/// Lists of paths, as they go into the changes.
struct Paths {
    std::vector<std::string> modified;
    std::vector<std::string> untracked;
    std::vector<std::string> removed;
    std::vector<std::string> unchanged;
};

RepoChanges changesOf(Paths const& paths)
{
    RepoChanges changes;
    changes.files = {{L"carried-along.dwg"}};
    for (std::string const& path : paths.modified) {
        changes.modified.push_back(
            {nullptr, {support::fromUtf8(path)}, {L"committed/" + support::fromUtf8(path), L"tf:x#1"}, 0});
    }
    for (std::string const& path : paths.untracked) {
        changes.untracked.push_back({nullptr, {support::fromUtf8(path)}, 0});
    }
    for (std::string const& path : paths.removed) {
        changes.removed.push_back({nullptr, {support::fromUtf8(path), L"tf:x#1"}, 0});
    }
    for (std::string const& path : paths.unchanged) {
        changes.unchanged.push_back({support::fromUtf8(path), L"tf:x#1"});
    }
    return changes;
}

RepoFileExplorer explorerOf(Paths const& paths)
{
    return RepoFileExplorer(changesOf(paths), common::RootPath(L"/project"));
}

std::string inWords(FileChange change)
{
    return common::toString(change).value().ansi_str();
}

std::vector<std::string> inWords(std::vector<StatusRef> const& files)
{
    std::vector<std::string> words;
    for (StatusRef const& file : files) {
        EXPECT_TRUE(file.selected);
        EXPECT_EQ(file.metaInfo(), nullptr);
        words.push_back(inWords(file.status()) + " " + file.path().ansi_str());
    }
    return words;
}

/// The files, or the error alone.
std::vector<std::string> inWords(Expected<std::vector<StatusRef>> const& files)
{
    if (files.hasValue()) {
        return inWords(files.value());
    }
    EXPECT_EQ(files.error().code, 0);
    return {"error: " + files.error().message.ansi_str()};
}

std::string inWords(Found const& found)
{
    if (auto const* const file = std::get_if<StagedFile>(&found)) {
        return inWords(file->change) + " " + file->path.ansi_str();
    }
    auto const* const error = std::get_if<ErrorMessage>(&found);
    return error ? "error: " + error->message.ansi_str() : "nothing";
}

std::string ambiguous(std::string const& name)
{
    return "error: More that one file found with name " + name + ".\n";
}

char const* const kNothingToCommit = "error: There are no modified or untracked files for commit.";

TEST(RepoChanges, IsAPlainAggregate)
{
    EXPECT_TRUE(std::is_aggregate_v<RepoChanges>);
    EXPECT_TRUE(std::is_copy_constructible_v<RepoChanges>);
    auto const [files, unchanged, modified, untracked, removed] = changesOf({{"m"}, {"u"}, {"r"}, {"same"}});
    EXPECT_EQ(files.front().path, OdString(L"carried-along.dwg"));
    EXPECT_EQ(unchanged.front().path, OdString(L"same"));
    EXPECT_EQ(modified.front().working.path, OdString(L"m"));
    EXPECT_EQ(untracked.front().working.path, OdString(L"u"));
    EXPECT_EQ(removed.front().committed.path, OdString(L"r"));
}

TEST(RepoFileExplorer, IsMovedAndNotCopied)
{
    EXPECT_FALSE(std::is_copy_constructible_v<RepoFileExplorer>);
    EXPECT_FALSE(std::is_copy_assignable_v<RepoFileExplorer>);
    EXPECT_TRUE(std::is_nothrow_move_constructible_v<RepoFileExplorer>);
}

TEST(RepoFileExplorer, TakesItsSelectionAlongWhenMoved)
{
    RepoFileExplorer first = explorerOf({{"m"}, {"u"}, {}, {"same.dwg"}});
    EXPECT_TRUE(first.stage({L"m", FileChange::modified}));
    RepoFileExplorer second(std::move(first));
    EXPECT_FALSE(second.stage({L"m", FileChange::modified}));
    EXPECT_TRUE(second.stage({L"u", FileChange::added}));
    EXPECT_FALSE(second.hasFilesToStage());
    RepoFileExplorer third = explorerOf({});
    third = std::move(second);
    EXPECT_FALSE(third.stage({L"u", FileChange::added}));
    EXPECT_EQ(third.findUnchanged(L"same").ansi_str(), "same.dwg");
    EXPECT_THAT(inWords(third.stagedFiles()), ElementsAre("modified m", "added u"));
}

TEST(RepoFileExplorer, KeepsACopyOfTheChanges)
{
    RepoChanges changes = changesOf({{"m"}, {"u"}, {"r"}, {"same.dwg"}});
    RepoFileExplorer explorer(changes, common::RootPath(L"/project"));
    EXPECT_EQ(changes.removed.size(), 1U);
    EXPECT_EQ(changes.unchanged.size(), 1U);
    changes = RepoChanges();
    EXPECT_THAT(inWords(explorer.possibleStageFiles()), ElementsAre("modified m", "added u"));
    EXPECT_EQ(explorer.findUnchanged(L"same").ansi_str(), "same.dwg");
}

TEST(Candidates, AreTheModifiedFilesAndThenTheNewOnesAsGiven)
{
    RepoFileExplorer const explorer = explorerOf({{"z", "b"}, {"y", "a", "b"}, {"r"}, {"same"}});
    EXPECT_THAT(
        inWords(explorer.possibleStageFiles()),
        ElementsAre("modified z", "modified b", "added y", "added a", "added b"));
}

TEST(Candidates, AreNoRemovedUnchangedOrCarriedFiles)
{
    RepoFileExplorer explorer = explorerOf({{}, {}, {"r"}, {"same"}});
    EXPECT_THAT(explorer.possibleStageFiles(), IsEmpty());
    EXPECT_FALSE(explorer.hasFilesToStage());
    for (FileChange const change : {FileChange::added, FileChange::modified, FileChange::removed}) {
        EXPECT_FALSE(explorer.stage({L"r", change}));
        EXPECT_FALSE(explorer.stage({L"same", change}));
        EXPECT_FALSE(explorer.stage({L"carried-along.dwg", change}));
    }
    EXPECT_EQ(inWords(explorer.findForStaging(L"r.*")), "nothing");
}

TEST(Candidates, AreListedWhetherStagedOrNot)
{
    RepoFileExplorer explorer = explorerOf({{"m"}, {"u"}, {}, {}});
    explorer.stage({L"m", FileChange::modified});
    EXPECT_THAT(inWords(explorer.possibleStageFiles()), ElementsAre("modified m", "added u"));
}

TEST(Candidates, AreGivenAsFreshStatusesEachTime)
{
    RepoFileExplorer const explorer = explorerOf({{"m"}, {}, {}, {}});
    explorer.possibleStageFiles().front().metaInfo() = std::make_shared<common::MetaInfo>();
    EXPECT_EQ(explorer.possibleStageFiles().front().metaInfo(), nullptr);
}

TEST(Staging, WorksOncePerCandidate)
{
    RepoFileExplorer explorer = explorerOf({{"m"}, {"u"}, {}, {}});
    EXPECT_TRUE(explorer.stage({L"u", FileChange::added}));
    EXPECT_FALSE(explorer.stage({L"u", FileChange::added}));
    EXPECT_TRUE(explorer.stage({L"m", FileChange::modified}));
}

TEST(Staging, ComparesPathAndChangeExactly)
{
    RepoFileExplorer explorer = explorerOf({{"plan.dwg"}, {}, {}, {}});
    EXPECT_FALSE(explorer.stage({L"Plan.dwg", FileChange::modified}));
    EXPECT_FALSE(explorer.stage({L"plan", FileChange::modified}));
    EXPECT_FALSE(explorer.stage({L"./plan.dwg", FileChange::modified}));
    EXPECT_FALSE(explorer.stage({L"plan.dwg", FileChange::added}));
    EXPECT_FALSE(explorer.stage({L"plan.dwg", FileChange::removed}));
    EXPECT_FALSE(explorer.stage({L"plan.dwg", static_cast<FileChange>(7)}));
    EXPECT_THAT(inWords(explorer.stagedFiles()), ElementsAre(kNothingToCommit));
    EXPECT_TRUE(explorer.stage({L"plan.dwg", FileChange::modified}));
}

TEST(Staging, TellsOnePathWithTwoChangesApart)
{
    RepoFileExplorer explorer = explorerOf({{"a"}, {"a"}, {}, {}});
    EXPECT_TRUE(explorer.stage({L"a", FileChange::added}));
    EXPECT_TRUE(explorer.hasFilesToStage());
    EXPECT_TRUE(explorer.stage({L"a", FileChange::modified}));
    EXPECT_FALSE(explorer.hasFilesToStage());
}

TEST(Staging, OfEqualCandidatesReachesTheFirstOnly)
{
    RepoFileExplorer explorer = explorerOf({{"a", "a"}, {}, {}, {}});
    EXPECT_TRUE(explorer.stage({L"a", FileChange::modified}));
    EXPECT_FALSE(explorer.stage({L"a", FileChange::modified}));
    EXPECT_TRUE(explorer.hasFilesToStage());
}

TEST(Staging, AnswersAlikeInWhateverOrderItIsAsked)
{
    StagedFile const a(L"a.dwg", FileChange::added);
    StagedFile const b(L"b.dwg", FileChange::added);
    StagedFile const c(L"c.dwg", FileChange::added);
    for (std::vector<StagedFile> const& order :
         {std::vector{a, b, c}, {a, c, b}, {b, a, c}, {b, c, a}, {c, a, b}, {c, b, a}}) {
        RepoFileExplorer explorer = explorerOf({{}, {"a.dwg", "b.dwg", "a.dwg", "c.dwg"}, {}, {}});
        for (StagedFile const& file : order) {
            EXPECT_TRUE(explorer.stage(file)) << file.path.ansi_str();
        }
        for (StagedFile const& file : order) {
            EXPECT_FALSE(explorer.stage(file)) << file.path.ansi_str();
        }
        EXPECT_TRUE(explorer.hasFilesToStage());
    }
}

TEST(FilesToStage, AreLeftUntilAllCandidatesAreStaged)
{
    RepoFileExplorer explorer = explorerOf({{"m"}, {"u"}, {"r"}, {}});
    EXPECT_TRUE(explorer.hasFilesToStage());
    explorer.stage({L"m", FileChange::modified});
    EXPECT_TRUE(explorer.hasFilesToStage());
    explorer.stage({L"u", FileChange::added});
    EXPECT_FALSE(explorer.hasFilesToStage());
}

TEST(FilesToStage, AreNoneWithoutCandidates)
{
    EXPECT_FALSE(explorerOf({}).hasFilesToStage());
}

TEST(StagedFiles, AreAnErrorWithNothingStagedAndNothingRemoved)
{
    EXPECT_THAT(inWords(explorerOf({}).stagedFiles()), ElementsAre(kNothingToCommit));
    EXPECT_THAT(inWords(explorerOf({{"m"}, {"u"}, {}, {"same"}}).stagedFiles()), ElementsAre(kNothingToCommit));
}

TEST(StagedFiles, AreNoneWithNothingStagedButSomethingRemoved)
{
    EXPECT_THAT(inWords(explorerOf({{}, {}, {"r"}, {}}).stagedFiles()), IsEmpty());
    EXPECT_THAT(inWords(explorerOf({{"m"}, {"u"}, {"r"}, {}}).stagedFiles()), IsEmpty());
}

TEST(StagedFiles, AreAllCandidatesOnceOneIsStaged)
{
    for (StagedFile const& one : {StagedFile(L"m", FileChange::modified), StagedFile(L"v", FileChange::added)}) {
        RepoFileExplorer explorer = explorerOf({{"m"}, {"u", "v"}, {"r"}, {"same"}});
        explorer.stage(one);
        EXPECT_THAT(inWords(explorer.stagedFiles()), ElementsAre("modified m", "added u", "added v"));
    }
}

TEST(StagedFiles, StayAsTheyAreAfterStagingWhatIsNoCandidate)
{
    RepoFileExplorer explorer = explorerOf({{"m"}, {}, {"r"}, {}});
    explorer.stage({L"r", FileChange::removed});
    EXPECT_THAT(inWords(explorer.stagedFiles()), IsEmpty());
}

struct Match {
    char const* name;
    std::string typed;
    std::string path;
    bool matches;
};

void PrintTo(Match const& row, std::ostream* out)
{
    *out << "'" << row.typed << "' and '" << row.path << "'";
}

Match const kMatches[] = {
    {"AnyExtension", "plan", "plan.dwg", true},
    {"ChainOfExtensions", "plan", "plan.dwg.bak", true},
    {"ExtensionIsRequired", "plan", "plan", false},
    {"EmptyExtension", "plan", "plan.", false},
    {"ExtensionWithADigit", "plan", "plan.dwl2", false},
    {"ChainWithADigitInside", "plan", "plan.b4k.dwg", false},
    {"ExtensionOfOneLetter", "plan", "plan.d", true},
    {"CapitalExtension", "plan", "plan.DWG", true},
    {"ExtensionBeyondAscii", "plan", "plan.dw\xC3\xA4", false},
    {"AnythingBefore", "plan", "floorplan.dwg", true},
    {"FolderBefore", "plan", "drawings/plan.dwg", true},
    {"NothingBehindButExtensions", "plan", "plan2.dwg", false},
    {"LetterCaseCounts", "plan", "Plan.dwg", false},
    {"FullName", "plan.dwg", "plan.dwg", true},
    {"FullNameInAFolder", "plan.dwg", "a/b/plan.dwg", true},
    {"FullNameTakesNoSuffix", "plan.dwg", "plan.dwg.bak", false},
    {"DotIsAnyCharacter", "plan.dwg", "plan_dwg", true},
    {"DotIsNoLineEnd", "plan.dwg", "plan\ndwg", false},
    {"NothingGoesAcrossALineEnd", "plan", "a\nplan.dwg", false},
    {"FolderWithADotGivesNoExtension", "v1.0/plan", "v1.0/plan.dwg", true},
    {"FolderWithADotAsAnyCharacter", "v1.0/plan", "v1_0/plan.dwg", true},
    {"NameThatIsAllExtension", ".dwg", "plan.dwg", false},
    {"NameThatIsAllExtensionHasNone", ".dwg", "plan.dwg.bak", true},
    {"TrailingDotIsNoExtension", "plan.", "plan_.dwg", true},
    {"TrailingDotAlone", "plan.", "plan.dwg", false},
    {"EmptyName", "", "any/thing.dwg", true},
    {"EmptyNameStillWantsAnExtension", "", "README", false},
    {"Expression", "pl[ao]n", "plon.dwg", true},
    {"ExpressionOfAnyNumber", "x+", "xxx.dwg", true},
    {"ExpressionWithAStar", "plan.*", "plan-2.old.dwg", true},
    {"AlternativesAreWholePatternsLeft", "a|b", "floor a", true},
    {"AlternativesAreWholePatternsRight", "a|b", "b.dwg", true},
    {"AlternativesAreWholePatternsBefore", "a|b", "floor b.dwg", false},
    {"EscapedDot", "plan\\.dwg", "plan_dwg", false},
    {"EscapedDotItself", "plan\\.dwg", "plan.dwg", true},
    {"EscapedBracket", "plan\\(1\\)", "plan(1).dwg", true},
    {"BracketIsAGroup", "plan(1)", "plan(1).dwg", false},
    {"NameBeyondAscii", "gr\xC3\xBCndung", "plan/gr\xC3\xBCndung.dwg", true},
    {"DotIsOneByte", "gr.ndung.dwg", "gr\xC3\xBCndung.dwg", false},
    {"TwoDotsAreTwoBytes", "gr..ndung.dwg", "gr\xC3\xBCndung.dwg", true},
    {"DotBeforeTheLastOneIsAnyCharacterToo", "gr.nd.dwg", "grand_dwg", true},
    {"DotInTheMiddleMakesAnExtension", "pl.n", "plan.dwg", false},
    {"DotInTheMiddleMakesAnExtensionOfTheRest", "pl.n", "floor/plan", true},
    {"NoNormalisation", "gr\xC3\xBCndung", "gru\xCC\x88ndung.dwg", false},
    {"BytesThatAreNotUtf8", "\xFF\x80", "\xFF\x80.dwg", true},
    {"BlankCounts", "plan ", "plan.dwg", false},
    {"BackReference", "(a)\\1.dwg", "aa.dwg", true},
    {"BackReferenceWithoutAnExtension", "(plan)\\1", "floor/planplan.old.dwg", true},
    {"BackReferenceWithoutAnExtensionToSomethingElse", "(plan)\\1", "plan.dwg", false},
    {"BackReferenceBehindALoop", "(a)(b)*\\1.dwg", "abbba.dwg", true},
    {"BackReferenceBehindALoopToSomethingElse", "(a)(b)*\\1.dwg", "abbbb.dwg", false},
    {"ManyCharacters", "a{4000}.dwg", "aaaa.dwg", false},
    {"BackReferenceToSomethingElse", "(a|b)\\1.dwg", "ab.dwg", false},
};

class FilePattern : public testing::TestWithParam<Match> {};

INSTANTIATE_TEST_SUITE_P(Rows, FilePattern, testing::ValuesIn(kMatches), [](auto const& row) {
    return std::string(row.param.name);
});

TEST_P(FilePattern, Matches)
{
    EXPECT_EQ(std::regex_match(GetParam().path, filePattern(support::fromUtf8(GetParam().typed))), GetParam().matches);
}

TEST_P(FilePattern, FindsCandidates)
{
    RepoFileExplorer const explorer = explorerOf({{}, {"other", GetParam().path}, {}, {}});
    std::string const expected = GetParam().matches ? "added " + GetParam().path : "nothing";
    EXPECT_EQ(inWords(explorer.findForStaging(support::fromUtf8(GetParam().typed))), expected);
}

TEST_P(FilePattern, FindsUnchangedFiles)
{
    RepoFileExplorer const explorer = explorerOf({{}, {}, {}, {"other", GetParam().path}});
    std::string const expected = GetParam().matches ? GetParam().path : "";
    EXPECT_EQ(explorer.findUnchanged(support::fromUtf8(GetParam().typed)).ansi_str(), expected);
}

class InvalidName : public testing::TestWithParam<std::string> {};

INSTANTIATE_TEST_SUITE_P(
    Names, InvalidName,
    testing::Values(
        "(", ")", "[", "plan[", "a{2,1}", "\\", "[z-a]", std::string(10'000, '('), std::string(10'000, 'x'),
        "x{100000}", "(x*)*\\1y.dwg", "(.*)(.*)(.*)\\1.dwg"));

TEST_P(InvalidName, ThrowsFromEveryQueryEvenIfThereIsNothingToLookThrough)
{
    OdString const name = support::fromUtf8(GetParam());
    EXPECT_THROW(filePattern(name), std::regex_error);
    for (Paths const& paths : {Paths(), Paths{{"plan.dwg"}, {"plan.dwg"}, {}, {"plan.dwg"}}}) {
        RepoFileExplorer const explorer = explorerOf(paths);
        EXPECT_THROW(explorer.findForStaging(name), std::regex_error);
        EXPECT_THROW(explorer.findUnchanged(name), std::regex_error);
    }
}

TEST(FindForStaging, HasItsAlternativesInOrder)
{
    EXPECT_TRUE((std::is_same_v<decltype(explorerOf({}).findForStaging(L"")), Found>));
    RepoFileExplorer const explorer = explorerOf({{"a.dwg"}, {"b.dwg"}, {}, {}});
    EXPECT_EQ(explorer.findForStaging(L"a").index(), 0U);
    EXPECT_EQ(explorer.findForStaging(L"c").index(), 1U);
    EXPECT_EQ(explorer.findForStaging(L"").index(), 2U);
}

TEST(FindForStaging, GivesPathAndChange)
{
    RepoFileExplorer const explorer = explorerOf({{"a/plan.dwg"}, {"roof.dwg"}, {}, {}});
    EXPECT_EQ(inWords(explorer.findForStaging(L"plan")), "modified a/plan.dwg");
    EXPECT_EQ(inWords(explorer.findForStaging(L"roof.dwg")), "added roof.dwg");
}

TEST(FindForStaging, GivesNothingWithoutCandidates)
{
    EXPECT_EQ(inWords(explorerOf({{}, {}, {"plan.dwg"}, {"plan.dwg"}}).findForStaging(L"plan")), "nothing");
}

TEST(FindForStaging, RefusesANameOfTwo)
{
    RepoFileExplorer const explorer = explorerOf({{"drawings/plan.dwg"}, {"drawings/floorplan.dwg"}, {}, {}});
    Found const found = explorer.findForStaging(L"plan");
    EXPECT_EQ(inWords(found), ambiguous("plan"));
    EXPECT_EQ(std::get<ErrorMessage>(found).code, 0);
    EXPECT_EQ(inWords(explorer.findForStaging(L"/plan")), "modified drawings/plan.dwg");
}

TEST(FindForStaging, RefusesANameThatIsWholeForOneAndAnEndForAnother)
{
    RepoFileExplorer const explorer = explorerOf({{"plan.dwg", "floorplan.dwg"}, {}, {}, {}});
    EXPECT_EQ(inWords(explorer.findForStaging(L"plan.dwg")), ambiguous("plan.dwg"));
}

TEST(FindForStaging, RefusesAPathThatIsACandidateTwice)
{
    EXPECT_EQ(inWords(explorerOf({{"a.dwg"}, {"a.dwg"}, {}, {}}).findForStaging(L"a")), ambiguous("a"));
}

TEST(FindForStaging, PutsTheNameIntoTheMessageAsItIs)
{
    RepoFileExplorer const explorer = explorerOf({{"%ls%n.dwg", "x%ls%n.dwg"}, {}, {}, {}});
    EXPECT_EQ(inWords(explorer.findForStaging(L"%ls%n")), ambiguous("%ls%n"));
    RepoFileExplorer const umlauts = explorerOf({{"\xC3\xBC.dwg", "a\xC3\xBC.dwg"}, {}, {}, {}});
    EXPECT_EQ(inWords(umlauts.findForStaging(L"\u00FC")), ambiguous("\xC3\xBC"));
}

TEST(FindForStaging, FindsStagedCandidatesToo)
{
    RepoFileExplorer explorer = explorerOf({{"a.dwg"}, {}, {}, {}});
    explorer.stage({L"a.dwg", FileChange::modified});
    EXPECT_EQ(inWords(explorer.findForStaging(L"a")), "modified a.dwg");
}

TEST(FindUnchanged, GivesTheFirstOfSeveralInTheOrderGiven)
{
    RepoFileExplorer const explorer = explorerOf({{}, {}, {}, {"roof.dwg", "z/plan.dwg", "a/plan.dwg", "plan.dwg"}});
    EXPECT_EQ(explorer.findUnchanged(L"plan").ansi_str(), "z/plan.dwg");
    EXPECT_EQ(explorer.findUnchanged(L"plan.dwg").ansi_str(), "z/plan.dwg");
    EXPECT_EQ(explorer.findUnchanged(L"").ansi_str(), "roof.dwg");
}

TEST(FindUnchanged, GivesAnEmptyTextWhenNothingMatches)
{
    EXPECT_TRUE(explorerOf({{}, {}, {}, {"roof.dwg"}}).findUnchanged(L"plan").isEmpty());
    EXPECT_TRUE(explorerOf({}).findUnchanged(L"plan").isEmpty());
}

TEST(FindUnchanged, LooksAtNoOtherFiles)
{
    RepoFileExplorer const explorer = explorerOf({{"a.dwg"}, {"a.dwg"}, {"a.dwg"}, {}});
    EXPECT_TRUE(explorer.findUnchanged(L"a").isEmpty());
    EXPECT_TRUE(explorer.findUnchanged(L"carried-along").isEmpty());
}

TEST(Explorer, TouchesNoDisk)
{
    support::TempFolder const folder;
    RepoFileExplorer explorer(changesOf({{"a.dwg"}, {}, {}, {}}), common::RootPath(folder.widePathTo("missing")));
    explorer.stage({L"a.dwg", FileChange::modified});
    EXPECT_TRUE(explorer.stagedFiles().hasValue());
    EXPECT_THAT(folder.list(), IsEmpty());
}

} // namespace
