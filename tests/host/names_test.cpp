#include "host/errors/failure.h"
#include "host/repository/names.h"

#include "tests/support/rows.h"
#include "tests/support/temp_repository.h"

#include <gmock/gmock.h>

#include <functional>
#include <string>
#include <unistd.h>

namespace {

using common::FileChange;
using common::StagedFile;
using testing::ElementsAre;
using testing::IsEmpty;

/// What a failed lookup says, line by line.
std::string failureOf(std::function<void()> const& lookup)
{
    try {
        lookup();
        return "no failure";
    } catch (tav::Failure const& failure) {
        std::string text = failure.what + " " + failure.next;
        for (std::string const& detail : failure.details) {
            text += "\n" + detail;
        }
        return text;
    }
}

struct PathRow {
    char const* name;
    char const* root;
    char const* typed;
    char const* path; ///< null when it lies outside
};

class PathInRepository : public testing::TestWithParam<PathRow> {};

TEST_P(PathInRepository, IsRelativeToTheWorkingFolder)
{
    ASSERT_EQ(chdir("/usr"), 0);
    common::RootPath const root(OdString(GetParam().root, CP_UTF_8));
    if (GetParam().path != nullptr) {
        EXPECT_EQ(tav::pathInRepository(root, GetParam().typed).ansi_str(), GetParam().path);
    } else {
        EXPECT_THROW(tav::pathInRepository(root, GetParam().typed), tav::Failure);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Roots, PathInRepository,
    testing::Values(
        PathRow{"Relative", "/usr", "a/b.dwg", "a/b.dwg"}, PathRow{"Absolute", "/usr", "/usr/a/b.dwg", "a/b.dwg"},
        PathRow{"TheRoot", "/usr", "/usr", ""}, PathRow{"TheRootWithSlash", "/usr", "/usr/", ""},
        PathRow{"CurrentFolder", "/usr", ".", ""}, PathRow{"CurrentFolderWithSlash", "/usr", "./", ""},
        PathRow{"Dots", "/usr", "./a/../b/./c", "b/c"}, PathRow{"OutAndBackIn", "/usr", "../usr/a", "a"},
        PathRow{"SlashesAtTheEnd", "/usr", "a//", "a"}, PathRow{"DoubledSlashes", "/usr", "a//b", "a/b"},
        PathRow{"RootBelow", "/usr/share", "share/a", "a"}, PathRow{"RelativeRoot", "share", "share/a", "a"},
        PathRow{"RelativeRootWithDots", "./share/../share", "share/a", "a"},
        PathRow{"RootOfTheSystem", "/", "a", "usr/a"}, PathRow{"RootOfTheSystemItself", "/", "/", ""},
        PathRow{"OtherScript", "/usr", "План.dwg", "План.dwg"}, PathRow{"NotUtf8", "/usr", "\xff\xfe", "\xff\xfe"},
        PathRow{"LineFeed", "/usr", "a\nb", "a\nb"}, PathRow{"Above", "/usr", "..", nullptr},
        PathRow{"Beside", "/usr", "../usrX", nullptr}, PathRow{"LongerName", "/usr/sha", "share/a", nullptr},
        PathRow{"OtherCase", "/usr", "/USR/a", nullptr},
        PathRow{"AboveTheRootOfTheSystem", "/usr", "../../../../etc", nullptr}, PathRow{"Empty", "/usr", "", nullptr}),
    support::rowName);

TEST(PathInRepositoryFailure, NamesWhatWasTypedAndTheWorkingFolder)
{
    common::RootPath const root(L"/nowhere/in particular/");
    EXPECT_EQ(
        failureOf([&] { tav::pathInRepository(root, "/etc//passwd"); }),
        "'/etc//passwd' is not located in the current repository. Name a file below '/nowhere/in particular'.");
}

class NameFinder : public testing::Test {
protected:
    NameFinder() { EXPECT_EQ(chdir(repo.path().c_str()), 0); }
    ~NameFinder() override { EXPECT_EQ(chdir("/"), 0); }

    tav::NameFinder finder() const
    {
        common::RepoChanges changes;
        for (wchar_t const* const name : {L"plans/ground.dwg", L"modified.dwg"}) {
            changes.modified.push_back({nullptr, {name}, {name, L"po#"}, 0});
        }
        for (wchar_t const* const name : {L"plans/roof.dwg", L"plans/north/a.dwg", L"new.dwg", L"plans.txt"}) {
            changes.untracked.push_back({nullptr, {name}, 0});
        }
        changes.removed.push_back({nullptr, {L"removed.dwg", L"po#"}, 0});
        changes.unchanged.push_back({L"unchanged.dwg", L"po#"});
        return tav::NameFinder(changes, repo.root());
    }

    static std::vector<std::string> texts(std::vector<StagedFile> const& files)
    {
        std::vector<std::string> texts;
        for (StagedFile const& file : files) {
            texts.push_back(common::toString(file.change).value().ansi_str() + " " + file.path.ansi_str());
        }
        return texts;
    }

    support::TempRepository const repo;
};

TEST_F(NameFinder, KnowsAllCandidatesInAscendingOrder)
{
    EXPECT_THAT(
        texts(finder().all()), ElementsAre(
                                   "modified modified.dwg", "added new.dwg", "added plans.txt",
                                   "modified plans/ground.dwg", "added plans/north/a.dwg", "added plans/roof.dwg"));
}

TEST_F(NameFinder, FindsOneFileByItsPath)
{
    EXPECT_THAT(texts(finder().find("plans/ground.dwg")), ElementsAre("modified plans/ground.dwg"));
    EXPECT_THAT(texts(finder().find(repo.pathTo("new.dwg"))), ElementsAre("added new.dwg"));
}

TEST_F(NameFinder, FindsAllFilesOfAFolder)
{
    EXPECT_THAT(
        texts(finder().find("plans")),
        ElementsAre("modified plans/ground.dwg", "added plans/north/a.dwg", "added plans/roof.dwg"));
    EXPECT_EQ(finder().find(".").size(), 6u);
}

TEST_F(NameFinder, FindsTheOneFileThatAnExpressionMatches)
{
    EXPECT_THAT(texts(finder().find("gr[ou]+nd")), ElementsAre("modified plans/ground.dwg"));
    EXPECT_THAT(texts(finder().find("nor.h/.*")), ElementsAre("added plans/north/a.dwg"));
}

TEST_F(NameFinder, FindsNoRemovedAndNoUnchangedFiles)
{
    EXPECT_THAT(finder().find("removed.dwg"), IsEmpty());
    EXPECT_THAT(finder().find("unchanged.dwg"), IsEmpty());
    EXPECT_THAT(finder().find("nothing"), IsEmpty());
}

TEST_F(NameFinder, ListsWhatAnExpressionMatchesThatMatchesSeveral)
{
    EXPECT_EQ(
        failureOf([&] { finder().find("plans/[gr].*"); }),
        "More that one file found with name plans/[gr].*.\n Type more of the path of the one you mean:\n"
        "plans/ground.dwg\n"
        "plans/roof.dwg");
}

TEST_F(NameFinder, RefusesWhatIsNeitherAPathNorAnExpression)
{
    EXPECT_EQ(
        failureOf([&] { finder().find("a (1"); }), "No file is named 'a (1', and it is not a valid expression. "
                                                   "Type the path of a file as 'tav status' shows "
                                                   "it.");
}

TEST_F(NameFinder, FindsStagedFilesOfEveryKind)
{
    std::vector<StagedFile> const staged = {
        {L"b", FileChange::removed}, {L"a/c", FileChange::added}, {L"a/b", FileChange::modified}};
    tav::NameFinder const finder(staged, repo.root());
    EXPECT_THAT(texts(finder.all()), ElementsAre("modified a/b", "added a/c", "removed b"));
    EXPECT_THAT(texts(finder.find("b")), ElementsAre("removed b"));
    EXPECT_THAT(texts(finder.find("a")), ElementsAre("modified a/b", "added a/c"));
    EXPECT_THAT(texts(finder.find("c.{0}")), ElementsAre("added a/c"));
}

TEST(FindUnchanged, FindsTheFirstThatTheNameMatches)
{
    common::RepoChanges changes;
    changes.unchanged = {{L"plans/roof.dwg", L"po#"}, {L"roof.dwg", L"po#"}};
    changes.untracked.push_back({nullptr, {L"cellar.dwg"}, 0});
    common::RootPath const root(L"/nowhere");
    EXPECT_EQ(tav::findUnchanged("roof", changes, root).ansi_str(), "plans/roof.dwg");
    EXPECT_EQ(tav::findUnchanged("cellar", changes, root).ansi_str(), "");
    EXPECT_EQ(
        failureOf([&] { tav::findUnchanged("(", changes, root); }),
        "No file is named '(', and it is not a valid expression. Type the path of a file as 'tav status' shows "
        "it.");
}

} // namespace
