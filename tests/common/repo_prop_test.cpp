#include "common/mu_common_repo_prop.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/rows.h"
#include "tests/support/temp_folder.h"
#include "tests/support/temp_repository.h"
#include "tests/support/utf8.h"

#include <cerrno>
#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

using common::RootPath;
using support::TempFolder;
using support::TempRepository;
using testing::ElementsAre;
using testing::IsEmpty;

/// What `get` gives, in words: the root, or the message.
std::string got(OdString const& path, bool create)
{
    Expected<RootPath> const result = RootPath::get(path, create);
    return result.hasValue() ? "root " + result.value().path().ansi_str() : result.error().message.ansi_str();
}

mode_t modeOf(std::string const& path)
{
    struct stat status;
    EXPECT_EQ(stat(path.c_str(), &status), 0) << path;
    return status.st_mode & 07777U;
}

struct Root {
    char const* name;
    wchar_t const* given;
    wchar_t const* root;
};

void PrintTo(Root const& row, std::ostream* out)
{
    *out << row.name;
}

class RootOf : public testing::TestWithParam<Root> {};

TEST_P(RootOf, IsThePathWithoutTrailingSeparators)
{
    EXPECT_EQ(RootPath(GetParam().given).path(), OdString(GetParam().root));
}

INSTANTIATE_TEST_SUITE_P(
    Paths, RootOf,
    testing::Values(
        Root{"Plain", L"/w/proj", L"/w/proj"}, Root{"OneSeparator", L"/w/proj/", L"/w/proj"},
        Root{"AllSeparators", L"/w/proj///", L"/w/proj"}, Root{"Empty", L"", L""}, Root{"OnlySeparators", L"//", L""},
        Root{"InnerSeparatorsStay", L"//w//proj/", L"//w//proj"}, Root{"RelativeStaysRelative", L"proj/", L"proj"},
        Root{"NothingIsResolved", L"./a/../proj/.", L"./a/../proj/."}, Root{"Blanks", L" /w/proj/ ", L" /w/proj/ "},
        Root{"BackslashBelongsToTheName", L"/w/proj\\", L"/w/proj\\"},
        Root{"OutsideAscii", L"/w/Pl\u00E4ne \xDCFF/", L"/w/Pl\u00E4ne \xDCFF"}),
    support::rowName);

TEST(RootPath, ComposesEveryPathOfTheRepository)
{
    RootPath const root(L"/w/proj//");
    EXPECT_EQ(root.tavPath(), OdString(L"/w/proj/.tav"));
    EXPECT_EQ(root.statePath(), OdString(L"/w/proj/.tav/tav.state"));
    EXPECT_EQ(root.dbPath(), OdString(L"/w/proj/.tav/tav.db"));
    EXPECT_EQ(root.propertiesPath(), OdString(L"/w/proj/.tav/properties"));
    EXPECT_EQ(root.logPath(), OdString(L"/w/proj/.tav/tav.log"));
    EXPECT_EQ(root.conflictPath(), OdString(L"/w/proj/.tav/conflict"));
    EXPECT_EQ(root.pathTo(L"a/b.dwg"), OdString(L"/w/proj/a/b.dwg"));
    EXPECT_EQ(root.conflictPathTo(L"sub/plan.dwg"), OdString(L"/w/proj/.tav/conflict/sub/plan.dwg"));
}

TEST(RootPath, TakesThePathForTavAsGiven)
{
    EXPECT_EQ(RootPath::tavPath(L"/w/proj"), OdString(L"/w/proj/.tav"));
    EXPECT_EQ(RootPath::tavPath(L"/w/proj//"), OdString(L"/w/proj///.tav"));
    EXPECT_EQ(RootPath::tavPath(L""), OdString(L"/.tav"));
}

TEST(RootPath, JoinsWithOneSeparatorAndTrimsNothing)
{
    RootPath const root(L"/w/proj");
    EXPECT_EQ(root.pathTo(L"/abs"), OdString(L"/w/proj//abs"));
    EXPECT_EQ(root.pathTo(L""), OdString(L"/w/proj/"));
    EXPECT_EQ(root.pathTo(L"sub/"), OdString(L"/w/proj/sub/"));
    EXPECT_EQ(root.conflictPathTo(L"/abs"), OdString(L"/w/proj/.tav/conflict//abs"));
    EXPECT_EQ(RootPath(L"").statePath(), OdString(L"/.tav/tav.state"));
}

TEST(RootPath, IsInterchangeableWithACopy)
{
    RootPath const root(L"/w/proj/");
    RootPath copy(L"/w/other");
    copy = root;
    EXPECT_EQ(copy.path(), OdString(L"/w/proj"));
}

struct Copies {
    char const* name;
    wchar_t const* file;
    wchar_t const* theirs;
    wchar_t const* base;
};

void PrintTo(Copies const& row, std::ostream* out)
{
    *out << row.name;
}

class ConflictCopies : public testing::TestWithParam<Copies> {};

TEST_P(ConflictCopies, LieFlatInTheConflictFolder)
{
    RootPath const root(L"/w/proj");
    EXPECT_EQ(root.relativeToTheirs(GetParam().file), OdString(GetParam().theirs));
    EXPECT_EQ(root.relativeToBase(GetParam().file), OdString(GetParam().base));
}

INSTANTIATE_TEST_SUITE_P(
    Names, ConflictCopies,
    testing::Values(
        Copies{"Plain", L"plan.dwg", L".tav/conflict/plan.theirs.dwg", L".tav/conflict/plan.base.dwg"},
        Copies{"FoldersAreDropped", L"sub/plan.dwg", L".tav/conflict/plan.theirs.dwg", L".tav/conflict/plan.base.dwg"},
        Copies{"DeepFolders", L"a/b.c/plan.dwg", L".tav/conflict/plan.theirs.dwg", L".tav/conflict/plan.base.dwg"},
        Copies{"NoExtension", L"plan", L".tav/conflict/plan.theirs.dwg", L".tav/conflict/plan.base.dwg"},
        Copies{
            "OnlyTheLastExtensionGoes", L"plan.v2.dwg", L".tav/conflict/plan.v2.theirs.dwg",
            L".tav/conflict/plan.v2.base.dwg"},
        Copies{"Hidden", L".plan", L".tav/conflict/.plan.theirs.dwg", L".tav/conflict/.plan.base.dwg"},
        Copies{"Empty", L"", L".tav/conflict/.theirs.dwg", L".tav/conflict/.base.dwg"},
        Copies{
            "OutsideAscii", L"Pl\u00E4ne/\u56FE \xDCFF.dwg", L".tav/conflict/\u56FE \xDCFF.theirs.dwg",
            L".tav/conflict/\u56FE \xDCFF.base.dwg"}),
    support::rowName);

struct Below {
    char const* name;
    wchar_t const* path;
    char const* relative; // null: not located
};

void PrintTo(Below const& row, std::ostream* out)
{
    *out << row.name;
}

class RelativePath : public testing::TestWithParam<Below> {};

TEST_P(RelativePath, IsWhatFollowsTheRoot)
{
    Expected<OdString> const result = RootPath(L"/w/proj").relativePathTo(GetParam().path);
    ASSERT_EQ(result.hasValue(), GetParam().relative != nullptr);
    if (result.hasValue()) {
        EXPECT_EQ(result.value().ansi_str(), GetParam().relative);
    } else {
        EXPECT_EQ(result.error().message.ansi_str(), "%ls is not located in the current repository");
        EXPECT_EQ(result.error().code, 0);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Paths, RelativePath,
    testing::Values(
        Below{"File", L"/w/proj/a.dwg", "a.dwg"}, Below{"FileInAFolder", L"/w/proj/a/b.dwg", "a/b.dwg"},
        Below{"RootWithSeparator", L"/w/proj/", ""}, Below{"RootItself", L"/w/proj", nullptr},
        Below{"LetterCaseOfTheRoot", L"/W/proj/a.dwg", nullptr},
        Below{"LongerNameOfTheRoot", L"/w/projX/a.dwg", nullptr}, Below{"ShorterPath", L"/w", nullptr},
        Below{"EmptyPath", L"", nullptr}, Below{"Elsewhere", L"/x/proj/a.dwg", nullptr},
        Below{"DotsAreNotResolved", L"/w/./proj/a.dwg", nullptr},
        Below{"DotsBehindTheRootStay", L"/w/proj/../a.dwg", "../a.dwg"},
        Below{"DoubledSeparatorStays", L"/w/proj//a.dwg", "/a.dwg"},
        Below{"DoubledSeparatorInTheRoot", L"/w//proj/a.dwg", nullptr},
        Below{"Placeholders", L"/w/proj/%s%n.dwg", "%s%n.dwg"}, Below{"PlaceholdersElsewhere", L"/%s%n", nullptr},
        Below{"OutsideAscii", L"/w/proj/\u56FE \xDCFF.dwg", "\u56FE \xFF.dwg"}),
    support::rowName);

TEST(RelativePathOfARootOutsideAscii, IsComparedCharacterByCharacter)
{
    RootPath const root(L"/w/Pl\u00E4ne \xDCFF");
    EXPECT_EQ(root.relativePathTo(L"/w/Pl\u00E4ne \xDCFF/a.dwg").value(), OdString(L"a.dwg"));
    EXPECT_FALSE(root.relativePathTo(L"/w/Pla\u0308ne \xDCFF/a.dwg").hasValue());
}

TEST(RelativePathOfTheEmptyRoot, IsWhatFollowsTheFirstSeparator)
{
    EXPECT_EQ(RootPath(L"").relativePathTo(L"/a.dwg").value(), OdString(L"a.dwg"));
    EXPECT_FALSE(RootPath(L"").relativePathTo(L"a.dwg").hasValue());
}

TEST(RepositoryExtension, IsThatOfStorageFiles)
{
    EXPECT_EQ(common::repositoryExt(), OdString(L"tf"));
}

TEST(RootPathGet, OpensARepository)
{
    TempRepository const repository;
    EXPECT_EQ(got(repository.widePath(), false), "root " + repository.path());
    EXPECT_EQ(got(repository.widePath() + L"//", false), "root " + repository.path());
}

TEST(RootPathGet, OpensARepositoryThatIsALink)
{
    TempFolder const folder;
    folder.makeFolder("real/tav");
    folder.makeLink("real/.tav", "tav");
    folder.makeLink("link", "real");
    EXPECT_EQ(got(folder.widePathTo("link"), false), "root " + folder.pathTo("link"));
}

TEST(RootPathGet, DoesNotOpenAPlainFolder)
{
    TempFolder const folder;
    EXPECT_EQ(got(folder.widePath(), false), "Path: " + folder.path() + " is not a tav directory.");
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(RootPathGet, NamesThePathAsGiven)
{
    TempFolder const folder;
    EXPECT_EQ(got(folder.widePath() + L"//", false), "Path: " + folder.path() + "// is not a tav directory.");
    EXPECT_EQ(got(L"", false), "Path:  is not a tav directory.");
}

TEST(RootPathGet, DoesNotSearchParentFolders)
{
    TempRepository const repository;
    repository.makeFolder("sub");
    EXPECT_EQ(
        got(repository.widePathTo("sub"), false), "Path: " + repository.pathTo("sub") + " is not a tav directory.");
}

TEST(RootPathGet, DoesNotTakeAFileNamedTavForARepository)
{
    TempFolder const folder;
    folder.write(".tav", "");
    folder.makeFolder("TAV");
    EXPECT_EQ(got(folder.widePath(), false), "Path: " + folder.path() + " is not a tav directory.");
}

TEST(RootPathGet, HasCode0InItsErrors)
{
    EXPECT_EQ(RootPath::get(L"/nowhere/at/all", false).error().code, 0);
}

TEST(RootPathGet, OpensAnExistingRepositoryInsteadOfMakingOne)
{
    TempRepository const repository;
    repository.write(".tav/tav.state", "{}");
    ASSERT_EQ(chmod(repository.path().c_str(), 0555), 0);
    ASSERT_EQ(chmod(repository.pathTo(".tav").c_str(), 0555), 0);
    auto const open = [&] { return got(repository.widePath(), true); };
    EXPECT_EQ(support::asOrdinaryUser(open), "root " + repository.path());
    EXPECT_EQ(support::countCalls(open), 0); // Looking is no call that writes.
    EXPECT_THAT(repository.list(), ElementsAre(".tav/", ".tav/tav.state"));
}

TEST(RootPathGet, MakesTavInAnExistingFolder)
{
    TempFolder const folder;
    folder.write("plan.dwg", "drawing");
    EXPECT_EQ(got(folder.widePath(), true), "root " + folder.path());
    EXPECT_THAT(folder.list(), ElementsAre(".tav/", "plan.dwg"));
    EXPECT_EQ(got(folder.widePath(), false), "root " + folder.path());
}

TEST(RootPathGet, MakesMissingParents)
{
    TempFolder const folder;
    EXPECT_EQ(got(folder.widePathTo("new/deeper/"), true), "root " + folder.pathTo("new/deeper"));
    EXPECT_THAT(folder.list(), ElementsAre("new/", "new/deeper/", "new/deeper/.tav/"));
}

TEST(RootPathGet, MakesFoldersForEverybodyLessTheUmask)
{
    TempFolder const folder;
    mode_t const before = umask(0);
    EXPECT_EQ(got(folder.widePathTo("open/deeper"), true), "root " + folder.pathTo("open/deeper"));
    umask(027);
    EXPECT_EQ(got(folder.widePathTo("shut/deeper"), true), "root " + folder.pathTo("shut/deeper"));
    umask(before);
    for (char const* name : {"open", "open/deeper", "open/deeper/.tav"}) {
        EXPECT_EQ(modeOf(folder.pathTo(name)), 0777U) << name;
    }
    for (char const* name : {"shut", "shut/deeper", "shut/deeper/.tav"}) {
        EXPECT_EQ(modeOf(folder.pathTo(name)), 0750U) << name;
    }
}

TEST(RootPathGet, MakesARepositoryWhoseNameIsNotUtf8)
{
    TempFolder const folder;
    std::string const name = "Pl\xE4ne \u56FE %s%n";
    EXPECT_EQ(got(folder.widePathTo(name), true), "root " + folder.pathTo(name));
    EXPECT_THAT(folder.list(), ElementsAre(name + "/", name + "/.tav/"));
}

TEST(RootPathGet, MakesARepositoryOfARelativePath)
{
    TempFolder const folder;
    ASSERT_EQ(chmod(folder.path().c_str(), 0777), 0);
    EXPECT_EQ(
        support::asOrdinaryUser(
            [&] { return chdir(folder.path().c_str()) == 0 ? got(L"new/proj/", true) : "no such folder"; }),
        "root new/proj");
    EXPECT_THAT(folder.list(), ElementsAre("new/", "new/proj/", "new/proj/.tav/"));
}

TEST(RootPathGet, FailsWhenTheWorkingFolderCannotBeMade)
{
    TempFolder const folder;
    ASSERT_EQ(chmod(folder.path().c_str(), 0555), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return got(folder.widePathTo("new/deeper//"), true); }),
        "Not able to create the version control folder: " + folder.pathTo("new/deeper//"));
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(RootPathGet, FailsWhenTheWorkingFolderIsAFile)
{
    TempFolder const folder;
    folder.write("file", "");
    folder.makeLink("dangling", "nowhere");
    for (char const* name : {"file", "file/proj", "dangling"}) {
        EXPECT_EQ(
            got(folder.widePathTo(name), true),
            "Not able to create the version control folder: " + folder.pathTo(name));
    }
    EXPECT_THAT(folder.list(), ElementsAre("dangling", "file"));
}

TEST(RootPathGet, FailsForAPathThatTheSystemDoesNotTake)
{
    TempFolder const folder;
    std::string const tooLong = folder.pathTo(std::string(300, 'n'));
    EXPECT_EQ(got(support::fromUtf8(tooLong), true), "Not able to create the version control folder: " + tooLong);
    EXPECT_EQ(got(L"", true), "Not able to create the version control folder: ");
    EXPECT_FALSE(RootPath::get(folder.widePathTo("proj") + L'\0' + L"more", true).hasValue());
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(RootPathGet, FailsWhenTavCannotBeMade)
{
    TempFolder const folder;
    ASSERT_EQ(chmod(folder.path().c_str(), 0555), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return got(folder.widePath() + L"/", true); }),
        "Not able to create a tav directory in " + folder.path() + "/");
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(RootPathGet, FailsWhenTheNameOfTavIsTaken)
{
    TempFolder const folder;
    folder.write("file/.tav", "");
    folder.makeLink("link/.tav", "nowhere");
    for (char const* name : {"file", "link"}) {
        EXPECT_EQ(got(folder.widePathTo(name), true), "Not able to create a tav directory in " + folder.pathTo(name));
    }
    EXPECT_THAT(folder.list(), ElementsAre("file/", "file/.tav", "link/", "link/.tav"));
}

TEST(RootPathGet, TakesPercentSignsOfAPathForText)
{
    TempFolder const folder;
    folder.write("%s%n", "");
    folder.write("100%ls/.tav", "");
    EXPECT_EQ(got(folder.widePathTo("%d%ls"), false), "Path: " + folder.pathTo("%d%ls") + " is not a tav directory.");
    EXPECT_EQ(
        got(folder.widePathTo("%s%n"), true),
        "Not able to create the version control folder: " + folder.pathTo("%s%n"));
    EXPECT_EQ(
        got(folder.widePathTo("100%ls"), true), "Not able to create a tav directory in " + folder.pathTo("100%ls"));
}

} // namespace
