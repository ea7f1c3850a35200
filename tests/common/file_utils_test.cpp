#include "common/mu_common_file_utils.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/rows.h"
#include "tests/support/temp_repository.h"

#include <ctime>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <regex>
#include <string>
#include <sys/stat.h>
#include <unistd.h>
#include <vector>

namespace {

using common::collectDirContents;
using common::CollectOptions;
using common::DirContents;
using support::TempFolder;
using support::TempRepository;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr bool relative = true;
constexpr bool withFolder = false;
constexpr bool listDirs = true;
constexpr bool noDirs = false;
constexpr bool hiddenToo = true;
constexpr bool noHidden = false;

std::vector<std::string> narrow(std::vector<OdString> const& texts)
{
    std::vector<std::string> result;
    for (OdString const& text : texts) {
        result.push_back(text.ansi_str());
    }
    return result;
}

std::vector<std::regex> expressions(std::initializer_list<char const*> texts)
{
    return {texts.begin(), texts.end()};
}

std::vector<std::string> filesIn(TempFolder const& folder, std::vector<std::regex> excludes)
{
    return narrow(
        collectDirContents(folder.widePath(), CollectOptions(relative, noDirs, noHidden, std::move(excludes))).files);
}

timespec modificationOf(std::string const& path)
{
    struct stat status;
    EXPECT_EQ(stat(path.c_str(), &status), 0) << path;
    return status.st_mtim;
}

void makeOld(std::string const& path)
{
    timespec const times[] = {{1'000'000, 0}, {1'000'000, 0}};
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
}

TEST(CollectOptions, HoldsWhatItIsGiven)
{
    CollectOptions const plain(false, true, false, {});
    EXPECT_FALSE(plain.relativePaths);
    EXPECT_TRUE(plain.collectDirs);
    EXPECT_EQ(plain.enumerationFlags, 0);
    EXPECT_THAT(plain.excludes, IsEmpty());
    CollectOptions const hidden(true, false, true, expressions({"a", "b"}));
    EXPECT_TRUE(hidden.relativePaths);
    EXPECT_FALSE(hidden.collectDirs);
    EXPECT_EQ(hidden.enumerationFlags, 4);
    EXPECT_EQ(hidden.excludes.size(), 2U);
}

/// A folder with files and folders, hidden ones too.
class Collecting : public testing::Test {
protected:
    Collecting()
    {
        for (char const* name : {"b.dwg", "a.txt", ".hidden", "sub/d.dwg", "sub/deep/e.dwg", ".secret/f.dwg"}) {
            folder.write(name, "");
        }
        folder.makeFolder("empty");
    }

    DirContents collect(bool relativePaths, bool dirs, bool hidden) const
    {
        return collectDirContents(folder.widePath(), CollectOptions(relativePaths, dirs, hidden, {}));
    }

    TempFolder const folder;
};

TEST_F(Collecting, ListsTheFilesOfAFolderBeforeThoseOfItsFolders)
{
    DirContents const contents = collect(relative, noDirs, noHidden);
    EXPECT_THAT(narrow(contents.files), ElementsAre("a.txt", "b.dwg", "sub/d.dwg", "sub/deep/e.dwg"));
    EXPECT_THAT(contents.dirs, IsEmpty());
}

TEST_F(Collecting, ListsFoldersDepthFirstWhenItIsAsked)
{
    DirContents const contents = collect(relative, listDirs, noHidden);
    EXPECT_THAT(narrow(contents.files), ElementsAre("a.txt", "b.dwg", "sub/d.dwg", "sub/deep/e.dwg"));
    EXPECT_THAT(narrow(contents.dirs), ElementsAre("empty", "sub", "sub/deep"));
}

TEST_F(Collecting, ListsHiddenEntriesWhenItIsAsked)
{
    DirContents const contents = collect(relative, listDirs, hiddenToo);
    EXPECT_THAT(
        narrow(contents.files),
        ElementsAre(".hidden", "a.txt", "b.dwg", ".secret/f.dwg", "sub/d.dwg", "sub/deep/e.dwg"));
    EXPECT_THAT(narrow(contents.dirs), ElementsAre(".secret", "empty", "sub", "sub/deep"));
}

TEST_F(Collecting, PutsTheFolderBeforeEveryPathWhenItIsAsked)
{
    DirContents const contents = collect(withFolder, listDirs, noHidden);
    std::string const path = folder.path();
    EXPECT_THAT(
        narrow(contents.files),
        ElementsAre(path + "/a.txt", path + "/b.dwg", path + "/sub/d.dwg", path + "/sub/deep/e.dwg"));
    EXPECT_THAT(narrow(contents.dirs), ElementsAre(path + "/empty", path + "/sub", path + "/sub/deep"));
}

TEST_F(Collecting, TakesTheFolderAsGiven)
{
    DirContents const contents =
        collectDirContents(folder.widePathTo("sub") + L"/", CollectOptions(withFolder, noDirs, noHidden, {}));
    EXPECT_THAT(narrow(contents.files), ElementsAre(folder.pathTo("sub//d.dwg"), folder.pathTo("sub//deep/e.dwg")));
}

TEST_F(Collecting, FindsNothingWhereThereIsNoFolder)
{
    for (OdString const& path : {folder.widePathTo("missing"), folder.widePathTo("a.txt"), OdString()}) {
        DirContents const contents = collectDirContents(path, CollectOptions(relative, listDirs, hiddenToo, {}));
        EXPECT_THAT(contents.files, IsEmpty()) << path.ansi_str();
        EXPECT_THAT(contents.dirs, IsEmpty()) << path.ansi_str();
    }
}

TEST_F(Collecting, SkipsFoldersThatCannotBeOpened)
{
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(folder.pathTo("sub").c_str(), 0), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] {
            DirContents const contents = collect(relative, listDirs, noHidden);
            std::string found;
            for (std::vector<OdString> const& list : {contents.files, contents.dirs}) {
                for (std::string const& name : narrow(list)) {
                    found += name + " ";
                }
            }
            return found;
        }),
        "a.txt b.dwg empty sub ");
}

TEST_F(Collecting, ExcludesFilesAndWholeFolders)
{
    EXPECT_THAT(filesIn(folder, expressions({"sub"})), ElementsAre("a.txt", "b.dwg"));
    EXPECT_THAT(filesIn(folder, expressions({".*\\.dwg"})), ElementsAre("a.txt"));
    EXPECT_THAT(filesIn(folder, expressions({"nothing", "deep"})), ElementsAre("a.txt", "b.dwg", "sub/d.dwg"));
}

TEST_F(Collecting, ExcludesByTheWholeName)
{
    EXPECT_EQ(filesIn(folder, expressions({"su", "ub", "b", "\\.dwg"})).size(), 4U);
}

TEST_F(Collecting, ExcludesByTheBareName)
{
    EXPECT_EQ(filesIn(folder, expressions({"sub/d\\.dwg", "sub/.*", ".*/deep"})).size(), 4U);
}

TEST_F(Collecting, ExcludesFoldersFromTheListOfFolders)
{
    CollectOptions const options(relative, listDirs, noHidden, expressions({"deep|empty"}));
    EXPECT_THAT(narrow(collectDirContents(folder.widePath(), options).dirs), ElementsAre("sub"));
}

TEST_F(Collecting, ExcludesByAnyKindOfExpression)
{
    EXPECT_THAT(
        filesIn(folder, {std::regex("SUB", std::regex::icase), std::regex("a\\.txt", std::regex::extended)}),
        ElementsAre("b.dwg"));
}

TEST(CollectDirContents, ListsNamesByTheirBytes)
{
    TempFolder const folder;
    for (char const* name : {"b", "B", "\xFF", "\u00E4", "a b", "%s%n", "10", "9"}) {
        folder.write(name, "");
    }
    EXPECT_THAT(filesIn(folder, {}), ElementsAre("%s%n", "10", "9", "B", "a b", "b", "\u00E4", "\xFF"));
}

TEST(CollectDirContents, ExcludesByTheNarrowForm)
{
    TempFolder const folder;
    folder.write("\u00E4", "");
    folder.write("\xFF", "");
    folder.write("\u56FE.dwg", "");
    EXPECT_THAT(filesIn(folder, expressions({"\xFF", "\xC3."})), ElementsAre("\u56FE.dwg"));
}

TEST(CollectDirContents, KeepsNamesThatAreNotUtf8)
{
    TempFolder const folder;
    folder.write("Pl\xE4ne/\xC3.dwg", "");
    DirContents const contents =
        collectDirContents(folder.widePath(), CollectOptions(relative, listDirs, noHidden, {}));
    EXPECT_EQ(contents.files.at(0), OdString(L"Pl\xDCE4ne/\xDCC3.dwg"));
    EXPECT_THAT(narrow(contents.files), ElementsAre("Pl\xE4ne/\xC3.dwg"));
    EXPECT_THAT(narrow(contents.dirs), ElementsAre("Pl\xE4ne"));
}

TEST(CollectDirContents, CountsLinksToFilesAndFollowsNoLinksToFolders)
{
    TempFolder const folder;
    folder.write("plan.dwg", "");
    folder.makeLink("link.dwg", "plan.dwg");
    folder.makeLink("loop", ".");
    folder.makeLink("dangling", "nowhere");
    DirContents const contents =
        collectDirContents(folder.widePath(), CollectOptions(relative, listDirs, hiddenToo, {}));
    EXPECT_THAT(narrow(contents.files), ElementsAre("link.dwg", "plan.dwg"));
    EXPECT_THAT(contents.dirs, IsEmpty());
}

TEST(CollectDirContents, WalksDeepFolders)
{
    TempFolder const folder;
    std::string deep;
    for (int i = 0; i < 400; ++i) {
        deep += "d/";
    }
    folder.write(deep + "plan.dwg", "");
    EXPECT_THAT(filesIn(folder, {}), ElementsAre(deep + "plan.dwg"));
}

std::vector<std::string> repoFiles(TempRepository const& repository)
{
    Expected<std::vector<common::File>> const files = common::collectRepoFiles(repository.root());
    std::vector<std::string> paths;
    for (common::File const& file : files.value()) {
        paths.push_back(file.path.ansi_str());
    }
    return paths;
}

TEST(CollectRepoFiles, ListsTheWorkingFolderAndThenTheProperties)
{
    TempRepository const repository;
    repository.add({"plan.dwg", "notes.txt", "plan.bak", "sub/a.dwg"});
    EXPECT_THAT(repoFiles(repository), ElementsAre("notes.txt", "plan.dwg", "sub/a.dwg"));
    repository.add({".tav/properties/ignore"});
    EXPECT_THAT(
        repoFiles(repository), ElementsAre("notes.txt", "plan.bak", "plan.dwg", "sub/a.dwg", ".tav/properties/ignore"));
}

TEST(CollectRepoFiles, AppliesTheDefaultRules)
{
    TempRepository const repository;
    repository.add({"plan.bak", "plan.dwl", "plan.dwl2", "plan.bak.dwg", "PLAN.BAK", "old.bak/plan.dwg"});
    EXPECT_THAT(repoFiles(repository), ElementsAre("PLAN.BAK", "plan.bak.dwg"));
}

TEST(CollectRepoFiles, ListsFilesWhateverTheirExtension)
{
    TempRepository const repository;
    repository.add({"plan", "plan.", "plan.exe", "sub/plan.tf"});
    EXPECT_THAT(repoFiles(repository), ElementsAre("plan", "plan.", "plan.exe", "sub/plan.tf"));
}

TEST(CollectRepoFiles, LeavesHiddenEntriesOut)
{
    TempRepository const repository;
    repository.add({".plan.dwg", ".git/config", "sub/.plan.dwg", "plan.dwg"});
    EXPECT_THAT(repoFiles(repository), ElementsAre("plan.dwg"));
}

TEST(CollectRepoFiles, ListsNothingElseOfTheRepositoryFolder)
{
    TempRepository const repository;
    repository.add(
        {".tav/tav.state", ".tav/tav.db", ".tav/tav.log", ".tav/tf/plan.tf", ".tav/properties/units.json",
         ".tav/properties/sub/layers.json"});
    repository.addConflictCopies({"plan.base.dwg"});
    EXPECT_THAT(repoFiles(repository), ElementsAre(".tav/properties/units.json", ".tav/properties/sub/layers.json"));
}

TEST(CollectRepoFiles, EntersNoFolderThatARuleCovers)
{
    TempRepository const repository;
    repository.ignore("^old$");
    repository.add({"old/plan.dwg", "old/deep/plan.dwg", "older/plan.dwg", "sub/old/plan.dwg", "sub/old.dwg"});
    EXPECT_THAT(repoFiles(repository), ElementsAre("older/plan.dwg", "sub/old.dwg", ".tav/properties/ignore"));
}

TEST(CollectRepoFiles, AppliesTheRulesToThePropertiesToo)
{
    TempRepository const repository;
    repository.ignore("^ignore$\n^.*\\.tmp$");
    repository.add(
        {".tav/properties/units.json", ".tav/properties/units.tmp", ".tav/properties/.hidden",
         ".tav/properties/.tav/plan.dwg"});
    EXPECT_THAT(repoFiles(repository), ElementsAre(".tav/properties/units.json"));
}

TEST(CollectRepoFiles, AppliesEveryRuleOfTheFile)
{
    TempRepository const repository;
    repository.ignore("^a$\n^b.*$\n^.*c$");
    repository.add({"a", "aa", "b", "bb", "c", "cc", "d"});
    EXPECT_THAT(repoFiles(repository), ElementsAre("aa", "d", ".tav/properties/ignore"));
}

TEST(CollectRepoFiles, FindsNothingInAnEmptyOrMissingFolder)
{
    TempRepository const repository;
    EXPECT_THAT(repoFiles(repository), IsEmpty());
    Expected<std::vector<common::File>> const missing =
        common::collectRepoFiles(common::RootPath(repository.widePathTo("missing")));
    EXPECT_THAT(missing.value(), IsEmpty());
}

TEST(CollectRepoFiles, NamesTheFoldersThatCannotBeOpened)
{
    TempRepository const repository;
    repository.add({"a.txt", "plans/b.dwg", "plans/old/c.dwg"});
    ASSERT_EQ(chmod(repository.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(repository.pathTo("plans/old").c_str(), 0), 0);
    std::string const found = support::asOrdinaryUser([&] {
        std::vector<OdString> unread;
        Expected<std::vector<common::File>> const files = common::collectRepoFiles(repository.root(), unread);
        std::string text;
        for (common::File const& file : files.value()) {
            text += file.path.ansi_str() + " ";
        }
        for (OdString const& folder : unread) {
            text += "-" + folder.ansi_str() + " ";
        }
        return text;
    });
    EXPECT_EQ(found, "a.txt plans/b.dwg -plans/old -.tav/properties ") << "no properties are there";
}

TEST(CollectRepoFiles, ListsNamesOutsideAscii)
{
    TempRepository const repository;
    repository.add({"Pl\xE4ne/\u56FE %s%n.dwg"});
    EXPECT_THAT(repoFiles(repository), ElementsAre("Pl\xE4ne/\u56FE %s%n.dwg"));
}

/// The conflicts as "path|theirs|base", in order.
std::vector<std::string> conflicts(TempRepository const& repository)
{
    std::vector<std::string> result;
    for (auto const& info : common::collectConflictPaths(repository.root())) {
        result.push_back(info->path.ansi_str() + "|" + info->theirsPath.ansi_str() + "|" + info->basePath.ansi_str());
    }
    return result;
}

struct Conflict {
    char const* name;
    std::vector<std::string_view> files;
    std::vector<std::string> found;
};

void PrintTo(Conflict const& row, std::ostream* out)
{
    *out << row.name;
}

class CollectConflictPaths : public testing::TestWithParam<Conflict> {};

TEST_P(CollectConflictPaths, PairsTheCopies)
{
    TempRepository const repository;
    repository.makeFolder(".tav/conflict");
    for (std::string_view const file : GetParam().files) {
        repository.addConflictCopies({file});
    }
    EXPECT_EQ(conflicts(repository), GetParam().found);
}

INSTANTIATE_TEST_SUITE_P(
    Folders, CollectConflictPaths,
    testing::Values(
        Conflict{"Empty", {}, {}},
        Conflict{"Both", {"plan.base.dwg", "plan.theirs.dwg"}, {"plan.dwg|plan.theirs.dwg|plan.base.dwg"}},
        Conflict{"TheirsAlone", {"plan.theirs.dwg"}, {"plan.dwg|plan.theirs.dwg|"}},
        Conflict{"BaseAlone", {"plan.base.dwg"}, {"plan.dwg||plan.base.dwg"}},
        Conflict{"NothingBeforeTheSuffix", {".base.dwg", ".theirs.dwg"}, {}},
        Conflict{"OneCharacter", {"a.base.dwg", "b.theirs.dwg"}, {"a.dwg||a.base.dwg", "b.dwg|b.theirs.dwg|"}},
        Conflict{
            "OnlyAFolderBeforeTheSuffix",
            {"sub/.base.dwg", "sub/.theirs.dwg"},
            {"sub/.dwg|sub/.theirs.dwg|sub/.base.dwg"}},
        Conflict{
            "LetterCaseCounts",
            {"plan.BASE.dwg", "plan.Theirs.dwg", "plan.base.DWG", "Plan.base.dwg", "plan.theirs.dwg"},
            {"Plan.dwg||Plan.base.dwg", "plan.dwg|plan.theirs.dwg|"}},
        Conflict{
            "OtherFiles",
            {"plan.dwg", "notes.txt", "base.dwg", "plan.base.dwg.bak", "planbase.dwg", "x_theirs.dwg"},
            {}},
        Conflict{
            "InSubFolders",
            {"sub/plan.base.dwg", "plan.theirs.dwg"},
            {"plan.dwg|plan.theirs.dwg|", "sub/plan.dwg||sub/plan.base.dwg"}},
        Conflict{
            "InAscendingOrderOfThePaths",
            {"z.base.dwg", "B.base.dwg", "a/z.base.dwg", "a.base.dwg", "a-b.base.dwg"},
            {"B.dwg||B.base.dwg", "a.dwg||a.base.dwg", "a-b.dwg||a-b.base.dwg", "a/z.dwg||a/z.base.dwg",
             "z.dwg||z.base.dwg"}},
        Conflict{
            "Hidden",
            {".plan.base.dwg", ".sub/plan.theirs.dwg"},
            {".plan.dwg||.plan.base.dwg", ".sub/plan.dwg|.sub/plan.theirs.dwg|"}},
        Conflict{
            "OneSuffixBehindTheOther",
            {"plan.base.dwg.theirs.dwg", "plan.theirs.dwg.base.dwg"},
            {"plan.base.dwg.dwg|plan.base.dwg.theirs.dwg|", "plan.theirs.dwg.dwg||plan.theirs.dwg.base.dwg"}},
        Conflict{"IgnoreRulesDoNotCount", {"plan.bak.base.dwg"}, {"plan.bak.dwg||plan.bak.base.dwg"}},
        Conflict{"OutsideAscii", {"\u56FE\xFF.base.dwg"}, {"\u56FE\xFF.dwg||\u56FE\xFF.base.dwg"}}),
    support::rowName);

TEST(CollectConflictPathsOf, ARepositoryWithoutConflictFolderAreNone)
{
    TempRepository const repository;
    EXPECT_THAT(conflicts(repository), IsEmpty());
}

TEST(CollectConflictPathsOf, ARepositoryThatIgnoresEverythingAreAllThere)
{
    TempRepository const repository;
    repository.ignore("^.*$");
    repository.addConflictCopies({"plan.base.dwg"});
    EXPECT_THAT(conflicts(repository), ElementsAre("plan.dwg||plan.base.dwg"));
}

TEST(Touch, SetsTheTimesToNow)
{
    TempFolder const folder;
    folder.write("pl\xE4n %s.dwg", "drawing");
    std::string const path = folder.pathTo("pl\xE4n %s.dwg");
    makeOld(path);
    std::time_t const before = std::time(nullptr);
    common::touch(folder.widePathTo("pl\xE4n %s.dwg"));
    struct stat status;
    ASSERT_EQ(stat(path.c_str(), &status), 0);
    EXPECT_GE(status.st_mtim.tv_sec, before - 1); // File systems keep time by a coarser clock.
    EXPECT_GE(status.st_atim.tv_sec, before - 1);
    EXPECT_LE(status.st_mtim.tv_sec, std::time(nullptr));
    EXPECT_EQ(folder.read("pl\xE4n %s.dwg"), "drawing");
}

TEST(Touch, FollowsLinks)
{
    TempFolder const folder;
    folder.write("plan.dwg", "");
    folder.makeLink("link.dwg", "plan.dwg");
    makeOld(folder.pathTo("plan.dwg"));
    common::touch(folder.widePathTo("link.dwg"));
    EXPECT_GT(modificationOf(folder.pathTo("plan.dwg")).tv_sec, 1'000'000);
}

TEST(Touch, CreatesNothing)
{
    TempFolder const folder;
    folder.makeLink("dangling", "nowhere");
    common::touch(folder.widePathTo("missing.dwg"));
    common::touch(folder.widePathTo("missing/plan.dwg"));
    common::touch(folder.widePathTo("dangling"));
    common::touch(L"");
    EXPECT_THAT(folder.list(), ElementsAre("dangling"));
}

TEST(Touch, LeavesFoldersAlone)
{
    TempFolder const folder;
    folder.makeFolder("sub");
    makeOld(folder.pathTo("sub"));
    common::touch(folder.widePathTo("sub"));
    EXPECT_EQ(modificationOf(folder.pathTo("sub")).tv_sec, 1'000'000);
}

TEST(Touch, LeavesTheFileOfAShorterPathAlone)
{
    TempFolder const folder;
    folder.write("plan", "");
    makeOld(folder.pathTo("plan"));
    common::touch(folder.widePathTo("plan") + L'\0' + L".dwg");
    EXPECT_EQ(modificationOf(folder.pathTo("plan")).tv_sec, 1'000'000);
}

TEST(Touch, KeepsSilentWhenItMayNot)
{
    TempFolder const folder;
    folder.write("plan.dwg", "");
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(folder.pathTo("plan.dwg").c_str(), 0444), 0);
    makeOld(folder.pathTo("plan.dwg"));
    bool const isOwner = geteuid() != 0;
    EXPECT_EQ(
        support::asOrdinaryUser([&] {
            common::touch(folder.widePathTo("plan.dwg"));
            return "silent";
        }),
        "silent");
    // The owner may touch what is shut, others may not.
    EXPECT_EQ(modificationOf(folder.pathTo("plan.dwg")).tv_sec == 1'000'000, !isOwner);
}

} // namespace
