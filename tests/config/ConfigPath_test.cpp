#include "tests/config/configurations.h"
#include "tests/server/translations.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/rows.h"
#include "tests/support/utf8.h"

#include <cerrno>
#include <functional>
#include <gmock/gmock.h>
#include <sched.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

using namespace configurations;
using common::ConfigPath;
using common::ConfigPathOrder;
using support::asOrdinaryUser;
using support::TempFolder;
using testing::ElementsAre;
using testing::IsEmpty;

std::string checked(OdString const& path)
{
    Expected<ConfigPath> const result = ConfigPath::get(path);
    return result.hasValue() ? "path " + result.value().path().ansi_str() : inWords(result.error());
}

std::string checked(std::string const& path)
{
    return checked(support::fromUtf8(path));
}

TEST(ConfigPath, KeepsWhatItIsGivenUnchecked)
{
    for (char const* const path : {"", "a", "a/", "/a//b/../", "A"}) {
        EXPECT_EQ(ConfigPath(support::fromUtf8(path)).path(), support::fromUtf8(path));
    }
}

TEST(ConfigPath, PutsTheFileBehindTheFolderAndASeparator)
{
    EXPECT_EQ(ConfigPath::configFile(L"/home/ann").ansi_str(), "/home/ann/directories.state");
    EXPECT_EQ(ConfigPath::configFile(L"/home/ann/").ansi_str(), "/home/ann//directories.state");
    EXPECT_EQ(ConfigPath::configFile(L"").ansi_str(), "/directories.state");
    EXPECT_EQ(ConfigPath(L"a").configFile().ansi_str(), "a/directories.state");
}

TEST(ConfigPathOrder, IsThatOfTheCharacters)
{
    std::vector<OdString> const ascending = {L"", L"A", L"a", L"a/", L"a/b", L"ab", L"b", L"\u00E4", L"\U0001F600"};
    ConfigPathOrder const before;
    for (std::size_t i = 0; i < ascending.size(); ++i) {
        for (std::size_t j = 0; j < ascending.size(); ++j) {
            EXPECT_EQ(before(ConfigPath(ascending[i]), ConfigPath(ascending[j])), i < j) << i << " and " << j;
        }
    }
}

TEST(ConfigFolder, IsTakenWhenItIsThere)
{
    TempFolder const folder;
    EXPECT_EQ(checked(folder.path()), "path " + folder.path());
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(ConfigFolder, IsKeptAsItWasGiven)
{
    TempFolder const folder;
    folder.makeFolder("a");
    EXPECT_EQ(checked(folder.pathTo("a//")), "path " + folder.pathTo("a//"));
    EXPECT_EQ(checked(folder.pathTo("a/../a")), "path " + folder.pathTo("a/../a"));
}

TEST(ConfigFolder, IsMadeWithItsParentsButWithoutTheFile)
{
    TempFolder const folder;
    EXPECT_EQ(checked(folder.pathTo("a/b/c")), "path " + folder.pathTo("a/b/c"));
    EXPECT_THAT(folder.list(), ElementsAre("a/", "a/b/", "a/b/c/"));
}

TEST(ConfigFolder, IsMadeForEverybodyLessTheUmask)
{
    TempFolder const folder;
    mode_t const before = umask(0027);
    EXPECT_EQ(checked(folder.pathTo("a")), "path " + folder.pathTo("a"));
    umask(before);
    struct stat status {};
    ASSERT_EQ(stat(folder.pathTo("a").c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0750U);
}

TEST(ConfigFolder, IsMadeForEverybodyWithItsParentsWhereTheUmaskLeavesThat)
{
    TempFolder const folder;
    mode_t const before = umask(0);
    EXPECT_EQ(checked(folder.pathTo("a/b")), "path " + folder.pathTo("a/b"));
    umask(before);
    for (char const* const name : {"a", "a/b"}) {
        struct stat status {};
        ASSERT_EQ(stat(folder.pathTo(name).c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 07777U, 0777U) << name;
    }
}

TEST(ConfigFolder, IsTakenUnseenWhenTheFileIsAFolder)
{
    TempFolder const folder;
    folder.makeFolder("a/directories.state");
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(folder.pathTo("a").c_str(), 0555), 0);
    std::string const path = folder.pathTo("a");
    EXPECT_EQ(asOrdinaryUser([&] { return checked(path); }), "path " + path);
}

TEST(ConfigFolder, MustHaveAName)
{
    EXPECT_EQ(checked(""), "error: VC config path is empty.");
}

/// What `body` returns in a process of its own whose root folder is `folder`.
std::string below(std::string const& folder, std::function<std::string()> const& body)
{
    return support::inOwnProcess([&]() -> std::string {
        bool const mayChange = geteuid() == 0 || unshare(CLONE_NEWUSER) == 0;
        bool const isBelow = mayChange && chroot(folder.c_str()) == 0 && chdir("/") == 0;
        return isBelow ? body() : "cannot change the root folder";
    });
}

// The file of the folder without a name lies in the root folder.
TEST(ConfigFolder, IsLookedForBeforeItsNameIs)
{
    TempFolder const root;
    EXPECT_EQ(below(root.path(), [] { return checked(""); }), "error: VC config path is empty.");
    root.makeFolder("directories.state");
    EXPECT_EQ(below(root.path(), [] { return checked(""); }), "path ");
}

struct PathRow {
    char const* name;
    char const* path;
};

class ConfigFolderOutOfNothing : public testing::TestWithParam<PathRow> {};

INSTANTIATE_TEST_SUITE_P(
    Paths, ConfigFolderOutOfNothing,
    testing::Values(
        PathRow{"OneName", "mu_missing"}, PathRow{"TwoNames", "mu_missing/a"},
        PathRow{"SeparatorBehind", "mu_missing/"}, PathRow{"RootFolder", "/"}, PathRow{"SeveralSeparators", "//"},
        PathRow{"BelowTheRootFolder", "/mu_missing"}, PathRow{"TwoBelowTheRootFolder", "/mu_missing/a"}),
    support::rowName);

TEST_P(ConfigFolderOutOfNothing, IsNotValid)
{
    std::string const path = GetParam().path;
    EXPECT_EQ(checked(path), "error: The path " + path + " is not valid.");
}

TEST(ConfigFolder, MayBeRelativeToTheCurrentOne)
{
    TempFolder const folder;
    ASSERT_EQ(chmod(folder.path().c_str(), 0777), 0);
    std::string const outcome = asOrdinaryUser([&] {
        std::string const entered = chdir(folder.path().c_str()) == 0 ? "" : "cannot enter ";
        return entered + checked(".") + ", " + checked("./a/b") + ", " + checked("c");
    });
    EXPECT_EQ(outcome, "path ., path ./a/b, error: The path c is not valid.");
    EXPECT_THAT(folder.list(), ElementsAre("a/", "a/b/"));
}

class ConfigFolderOfAnother : public testing::Test {
protected:
    void SetUp() override
    {
        folder.makeFolder("locked");
        ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
        ASSERT_EQ(chmod(folder.pathTo("locked").c_str(), 0555), 0);
    }

    TempFolder const folder;
};

TEST_F(ConfigFolderOfAnother, IsRefusedUnderTheNameAskedFor)
{
    for (char const* const name : {"locked", "locked/a", "locked/a/b/c"}) {
        std::string const path = folder.pathTo(name);
        EXPECT_EQ(asOrdinaryUser([&] { return checked(path); }), "error: The directory " + path + " is not writable.");
    }
    EXPECT_THAT(folder.list(), ElementsAre("locked/"));
}

TEST_F(ConfigFolderOfAnother, IsRefusedEvenWhenTheFileIsThere)
{
    folder.write("readable/directories.state", "{}");
    ASSERT_EQ(chmod(folder.pathTo("readable").c_str(), 0555), 0);
    std::string const path = folder.pathTo("readable");
    EXPECT_EQ(asOrdinaryUser([&] { return checked(path); }), "error: The directory " + path + " is not writable.");
}

TEST(ConfigFolder, IsNoFile)
{
    TempFolder const folder;
    folder.write("file", "");
    for (char const* const name : {"file", "file/a"}) {
        std::string const path = folder.pathTo(name);
        EXPECT_EQ(checked(path), "error: The directory " + path + " is not writable.");
    }
}

class UnmakableConfigFolder : public testing::Test {
protected:
    void expectRefused(std::string const& path) const
    {
        std::vector<std::string> const before = folder.list();
        EXPECT_EQ(checked(path), "error: Could not create directory at: " + path);
        EXPECT_EQ(folder.list(), before);
    }

    TempFolder const folder;
};

TEST_F(UnmakableConfigFolder, HasTooLongAName)
{
    expectRefused(folder.pathTo(std::string(300, 'a')));
}

TEST_F(UnmakableConfigFolder, IsADanglingLink)
{
    folder.makeLink("link", "nowhere");
    expectRefused(folder.pathTo("link"));
}

TEST_F(UnmakableConfigFolder, HasANulInItsName)
{
    OdString const path = folder.widePath() + OdString(L"/a\0b", 4);
    EXPECT_EQ(checked(path), "error: Could not create directory at: " + folder.path() + "/a");
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST_F(UnmakableConfigFolder, IsRefusedByTheDisk)
{
    support::FailingCall const failing(0, ENOSPC);
    expectRefused(folder.pathTo("a"));
    EXPECT_EQ(failing.name(), "0: mkdir");
}

TEST_F(UnmakableConfigFolder, IsToldInTheLanguageOfTheUser)
{
    server::Translations const translations(
        {"VC config path is empty.", "The path %ls is not valid.", "The directory %ls is not writable.",
         "Could not create directory at: %ls"});
    folder.write("file", "");
    folder.makeLink("link", "nowhere");
    EXPECT_EQ(checked(""), "error: {VC config path is empty.}");
    EXPECT_EQ(checked("mu_missing"), "error: {The path mu_missing is not valid.}");
    EXPECT_EQ(checked(folder.pathTo("file")), "error: {The directory " + folder.pathTo("file") + " is not writable.}");
    EXPECT_EQ(checked(folder.pathTo("link")), "error: {Could not create directory at: " + folder.pathTo("link") + "}");
}

} // namespace
