#include "platform/ut/FileName.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/temp_folder.h"

#include <array>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

using support::asOrdinaryUser;
using support::TempFolder;
using testing::ElementsAre;
using testing::IsEmpty;
using ut::DateTime;
using ut::FileName;

struct Parts {
    char const* row;
    wchar_t const* path;
    wchar_t const* name;
    wchar_t const* extension;
    std::size_t count;
    wchar_t const* withoutLast;
};

void PrintTo(Parts const& row, std::ostream* out)
{
    *out << row.row;
}

class FileNameParts : public testing::TestWithParam<Parts> {};

TEST_P(FileNameParts, AreTheseOnes)
{
    FileName file{OdString(GetParam().path)};
    EXPECT_STREQ(file.getName().c_str(), GetParam().name);
    EXPECT_STREQ(file.getExt().c_str(), GetParam().extension);
    EXPECT_EQ(file.hasExt(), GetParam().extension[0] != L'\0');
    EXPECT_EQ(file.getDirCount(), GetParam().count);
    EXPECT_STREQ(file.getFullPath().c_str(), GetParam().path);
    file.removeLastDir();
    EXPECT_STREQ(file.getFullPath().c_str(), GetParam().withoutLast);
}

INSTANTIATE_TEST_SUITE_P(
    Paths, FileNameParts,
    testing::Values(
        Parts{"InAFolder", L"sub/plan.dwg", L"plan", L"dwg", 2, L"sub"},
        Parts{"Absolute", L"/a/b", L"b", L"", 2, L"/a"}, Parts{"BelowTheRoot", L"/a", L"a", L"", 1, L"/"},
        Parts{"Root", L"/", L"", L"", 0, L"/"}, Parts{"RootTwice", L"//", L"", L"", 0, L"//"},
        Parts{"Empty", L"", L"", L"", 0, L""}, Parts{"OneName", L"plan", L"plan", L"", 1, L""},
        Parts{"Hidden", L".bak", L".bak", L"", 1, L""},
        Parts{"HiddenWithExtension", L".bak.dwg", L".bak", L"dwg", 1, L""},
        Parts{"HiddenInAFolder", L"sub/.bak", L".bak", L"", 2, L"sub"},
        Parts{"EmptyExtension", L"plan.", L"plan.", L"", 1, L""},
        Parts{"EmptyExtensionAfterAnother", L"plan.dwg.", L"plan.dwg.", L"", 1, L""},
        Parts{"LastDotCounts", L"plan.theirs.dwg", L"plan.theirs", L"dwg", 1, L""},
        Parts{"TwoDots", L"plan..dwg", L"plan.", L"dwg", 1, L""},
        Parts{"DotOfTheFolder", L"v1.2/plan", L"plan", L"", 2, L"v1.2"}, Parts{"Dot", L".", L".", L"", 1, L""},
        Parts{"DotDot", L"..", L"..", L"", 1, L""}, Parts{"LeadingDots", L"..b", L".", L"b", 1, L""},
        Parts{"ParentFolder", L"../plan.dwg", L"plan", L"dwg", 2, L".."},
        Parts{"TrailingSeparator", L"a/b.c/", L"b", L"c", 2, L"a"},
        Parts{"ManySeparators", L"//a///b//", L"b", L"", 2, L"//a"},
        Parts{"ManySeparatorsAtTheRoot", L"///a", L"a", L"", 1, L"/"},
        Parts{"Backslash", L"a\\b.c", L"a\\b", L"c", 1, L""}, Parts{"BlankIsAName", L"a/ .dwg", L" ", L"dwg", 2, L"a"},
        Parts{"NotAscii", L"\u00FC/\u20AC.\u00E4", L"\u20AC", L"\u00E4", 2, L"\u00FC"}),
    [](auto const& row) { return row.param.row; });

TEST(FileName, IsComposedOfItsParts)
{
    EXPECT_EQ(FileName(L"/a", L"plan", L"tf").getFullPath(), OdString(L"/a/plan.tf"));
    EXPECT_EQ(FileName(L"/a", L"plan", L"").getFullPath(), OdString(L"/a/plan"));
    EXPECT_EQ(FileName(L"/a/", L"sub/plan.1", L"tf").getFullPath(), OdString(L"/a//sub/plan.1.tf"));
    EXPECT_EQ(FileName(L"", L"plan", L"tf").getFullPath(), OdString(L"/plan.tf"));
}

TEST(FileName, ResolvesNothing)
{
    TempFolder const folder;
    folder.makeFolder("sub");
    folder.makeLink("link", "sub");
    OdString const path = folder.widePathTo("./link/..//x");
    EXPECT_EQ(FileName(path).getFullPath(), path);
}

TEST(FileName, RemovesAllComponentsOneByOne)
{
    FileName path{OdString(L"/a//b/c")};
    std::vector<std::string> paths;
    for (; path.getDirCount() != 0; path.removeLastDir()) {
        paths.push_back(path.getFullPath().ansi_str());
    }
    EXPECT_THAT(paths, ElementsAre("/a//b/c", "/a//b", "/a"));
    EXPECT_EQ(path.getFullPath(), OdString(L"/"));
}

TEST(FileName, OnlyTheSlashSeparates)
{
    EXPECT_EQ(FileName::getPathSeparator(), OdString(L"/"));
    EXPECT_TRUE(FileName::isPathSeparator(L'/'));
    EXPECT_FALSE(FileName::isPathSeparator(L'\\'));
    EXPECT_FALSE(FileName::isPathSeparator(L'\0'));
}

class FileNameOnDisk : public testing::Test {
protected:
    FileNameOnDisk()
    {
        folder.write("file", "content");
        folder.makeFolder("sub");
        folder.makeLink("link to file", "file");
        folder.makeLink("link to folder", "sub");
        folder.makeLink("dangling", "nowhere");
        folder.makeLink("loop", "loop");
        EXPECT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    }

    bool exists(std::string_view name) const { return FileName(folder.widePathTo(name)).exists(FileName::kAnyKind); }

    mode_t modeOf(std::string_view name) const
    {
        struct stat status;
        EXPECT_EQ(stat(folder.pathTo(name).c_str(), &status), 0);
        return status.st_mode & 07777U;
    }

    TempFolder const folder;
};

TEST_F(FileNameOnDisk, ExistsAsAnyKindOfEntry)
{
    EXPECT_TRUE(exists("file"));
    EXPECT_TRUE(exists("sub"));
    EXPECT_TRUE(exists("sub/"));
    EXPECT_TRUE(exists("link to file"));
    EXPECT_TRUE(exists("link to folder"));
    EXPECT_TRUE(exists("pipe"));
    EXPECT_EQ(FileName::kAnyKind + 0, 0x1FFFU);
}

TEST_F(FileNameOnDisk, DoesNotExistWithoutAnEntryAtTheEndOfItsLinks)
{
    EXPECT_FALSE(exists("missing"));
    EXPECT_FALSE(exists("dangling"));
    EXPECT_FALSE(exists("loop"));
    EXPECT_FALSE(exists("file/"));
    EXPECT_FALSE(FileName{OdString()}.exists(FileName::kAnyKind));
}

TEST_F(FileNameOnDisk, FileExistsForRegularFilesOnly)
{
    EXPECT_TRUE(FileName::fileExists(folder.widePathTo("file")));
    EXPECT_TRUE(FileName::fileExists(folder.widePathTo("link to file")));
    for (char const* name : {"sub", "link to folder", "dangling", "loop", "pipe", "missing"}) {
        EXPECT_FALSE(FileName::fileExists(folder.widePathTo(name))) << name;
    }
}

TEST_F(FileNameOnDisk, PathThatTheSystemCannotTakeNamesNothing)
{
    OdString const withNul = folder.widePathTo("sub") + L'\0';
    OdString const tooLong = folder.widePathTo(std::string(5000, '/') + "sub");
    for (OdString const& path : {withNul, tooLong}) {
        EXPECT_FALSE(FileName(path).exists(FileName::kAnyKind));
        EXPECT_FALSE(FileName(path).isDirWritable());
        EXPECT_FALSE(FileName(path).getTimes(nullptr, nullptr, nullptr));
        EXPECT_FALSE(FileName::mkdir(path, 0777, 0));
        EXPECT_FALSE(FileName::mkdir(path, 0777, FileName::kFullPath));
    }
    EXPECT_FALSE(FileName::fileExists(folder.widePathTo("file") + L'\0'));
}

TEST_F(FileNameOnDisk, FindsNamesOfAnyBytes)
{
    for (std::string const name : {"\xC3\xA4", "\xFF", "\xED\xA0\x80", "a\nb", "n\xCC\x88"}) {
        folder.write(name, "");
        EXPECT_TRUE(exists(name));
        EXPECT_TRUE(FileName::fileExists(folder.widePathTo(name)));
    }
    EXPECT_FALSE(exists("a\xCC\x88"));
}

TEST_F(FileNameOnDisk, FolderIsWritableForItsOwner)
{
    EXPECT_TRUE(FileName(folder.widePathTo("sub")).isDirWritable());
    EXPECT_TRUE(FileName(folder.widePathTo("link to folder")).isDirWritable());
}

TEST_F(FileNameOnDisk, NothingButAFolderIsWritable)
{
    for (char const* name : {"file", "link to file", "dangling", "missing", "pipe"}) {
        EXPECT_FALSE(FileName(folder.widePathTo(name)).isDirWritable()) << name;
    }
}

class FileNameOfFolder
    : public FileNameOnDisk
    , public testing::WithParamInterface<std::pair<mode_t, char const*>> {};

TEST_P(FileNameOfFolder, IsWritableWithTheRightToWriteAndToEnter)
{
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    auto const [mode, expected] = GetParam();
    // The same for the owner and for others: which of them the child is depends on who runs the test.
    ASSERT_EQ(chmod(folder.pathTo("sub").c_str(), mode), 0);
    EXPECT_EQ(
        asOrdinaryUser([&] { return FileName(folder.widePathTo("sub")).isDirWritable() ? "writable" : "refused"; }),
        expected);
}

INSTANTIATE_TEST_SUITE_P(
    Modes, FileNameOfFolder,
    testing::Values(
        std::pair<mode_t, char const*>{0777, "writable"}, std::pair<mode_t, char const*>{0333, "writable"},
        std::pair<mode_t, char const*>{0555, "refused"}, std::pair<mode_t, char const*>{0666, "refused"}));

TEST_F(FileNameOnDisk, HasItsTimesInNanoseconds)
{
    std::array<timespec, 2> const times{timespec{1'709'647'629, 123'456'789}, timespec{1'709'647'630, 987'654'321}};
    ASSERT_EQ(utimensat(AT_FDCWD, folder.pathTo("file").c_str(), times.data(), 0), 0);
    DateTime access;
    DateTime modification;
    EXPECT_TRUE(FileName(folder.widePathTo("link to file")).getTimes(&access, &modification, nullptr));
    EXPECT_EQ(access.getTicks(), 1'709'647'629'123'456'789);
    EXPECT_EQ(modification.getTicks(), 1'709'647'630'987'654'321);
}

TEST_F(FileNameOnDisk, HasTimesBefore1970)
{
    std::array<timespec, 2> const times{timespec{-2, 500'000'000}, timespec{-1, 0}};
    ASSERT_EQ(utimensat(AT_FDCWD, folder.pathTo("file").c_str(), times.data(), 0), 0);
    DateTime access;
    DateTime modification;
    EXPECT_TRUE(FileName(folder.widePathTo("file")).getTimes(&access, &modification, nullptr));
    EXPECT_EQ(access.getTicks(), -1'500'000'000);
    EXPECT_EQ(modification.getTicks(), -1'000'000'000);
}

TEST_F(FileNameOnDisk, KeepsItsCreationWhenItIsModified)
{
    DateTime creation;
    DateTime creationLater;
    ASSERT_TRUE(FileName(folder.widePathTo("file")).getTimes(nullptr, nullptr, &creation));
    std::array<timespec, 2> const times{timespec{5, 0}, timespec{5, 0}};
    ASSERT_EQ(utimensat(AT_FDCWD, folder.pathTo("file").c_str(), times.data(), 0), 0);
    ASSERT_TRUE(FileName(folder.widePathTo("file")).getTimes(nullptr, nullptr, &creationLater));
    EXPECT_EQ(creation.getTicks(), creationLater.getTicks());
    EXPECT_NE(creationLater.getTicks(), 5'000'000'000);
}

TEST_F(FileNameOnDisk, HasNoTimesWhenItCannotBeExamined)
{
    DateTime modification(7);
    for (char const* name : {"missing", "dangling", "loop"}) {
        EXPECT_FALSE(FileName(folder.widePathTo(name)).getTimes(nullptr, &modification, nullptr)) << name;
    }
    EXPECT_EQ(modification.getTicks(), 7);
    EXPECT_EQ(DateTime().getTicks(), 0);
}

TEST_F(FileNameOnDisk, HasTimesWithoutTheRightToRead)
{
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(folder.pathTo("file").c_str(), 0), 0);
    EXPECT_EQ(
        asOrdinaryUser([&] {
            DateTime modification;
            bool const known = FileName(folder.widePathTo("file")).getTimes(nullptr, &modification, nullptr);
            return known && modification.getTicks() != 0 ? "known" : "unknown";
        }),
        "known");
}

TEST_F(FileNameOnDisk, MkdirMakesAFolder)
{
    EXPECT_TRUE(FileName::mkdir(folder.widePathTo("new"), 0700, 0));
    EXPECT_EQ(modeOf("new"), 0700U);
    EXPECT_FALSE(FileName::mkdir(folder.widePathTo("deep/er"), 0777, 0));
    EXPECT_FALSE(folder.has("deep"));
}

TEST_F(FileNameOnDisk, MkdirSucceedsForAFolderThatIsThere)
{
    ASSERT_EQ(chmod(folder.pathTo("sub").c_str(), 0710), 0);
    for (char const* name : {"sub", "sub/", "link to folder"}) {
        EXPECT_TRUE(FileName::mkdir(folder.widePathTo(name), 0777, 0)) << name;
        EXPECT_TRUE(FileName::mkdir(folder.widePathTo(name), 0777, FileName::kFullPath)) << name;
    }
    EXPECT_EQ(modeOf("sub"), 0710U);
    EXPECT_TRUE(FileName::mkdir(L"/", 0777, FileName::kFullPath));
}

TEST_F(FileNameOnDisk, MkdirMakesMissingParents)
{
    EXPECT_EQ(static_cast<int>(FileName::kFullPath), 1);
    EXPECT_TRUE(FileName::mkdir(folder.widePathTo("sub/a/\xFF//c/"), 0777, FileName::kFullPath));
    EXPECT_TRUE(FileName::mkdir(folder.widePathTo("link to folder/d"), 0777, FileName::kFullPath));
    EXPECT_TRUE(FileName::mkdir(folder.widePathTo("e/../f"), 0777, FileName::kFullPath));
    for (char const* name : {"sub/a/\xFF/c", "sub/d", "e", "f"}) {
        EXPECT_TRUE(exists(name)) << name;
    }
}

TEST_F(FileNameOnDisk, MkdirFollowsTheUmask)
{
    mode_t const before = umask(027);
    EXPECT_TRUE(FileName::mkdir(folder.widePathTo("a/b"), 0777, FileName::kFullPath));
    umask(before);
    EXPECT_EQ(modeOf("a"), 0750U);
    EXPECT_EQ(modeOf("a/b"), 0750U);
}

TEST_F(FileNameOnDisk, MkdirMakesParentsThatItCanEnter)
{
    ASSERT_EQ(chmod(folder.path().c_str(), 0777), 0);
    EXPECT_EQ(
        asOrdinaryUser(
            [&] { return FileName::mkdir(folder.widePathTo("a/b"), 0500, FileName::kFullPath) ? "made" : "refused"; }),
        "made");
    EXPECT_EQ(modeOf("a"), 0700U);
    EXPECT_EQ(modeOf("a/b"), 0500U);
}

TEST_F(FileNameOnDisk, MkdirFailsWhereSomethingElseStands)
{
    for (char const* name :
         {"file", "file/below", "file/below/it", "dangling", "dangling/below", "loop/below", "pipe/x"}) {
        EXPECT_FALSE(FileName::mkdir(folder.widePathTo(name), 0777, FileName::kFullPath)) << name;
    }
    EXPECT_FALSE(FileName::mkdir(L"", 0777, FileName::kFullPath));
    EXPECT_EQ(folder.read("file"), "content");
}

TEST_F(FileNameOnDisk, MkdirMakesNothingOfAPathThatIsTooLong)
{
    std::string name;
    while (name.size() < 4200) {
        name += "deep/";
    }
    EXPECT_FALSE(FileName::mkdir(folder.widePathTo(name), 0777, FileName::kFullPath));
    EXPECT_FALSE(folder.has("deep"));
    EXPECT_FALSE(FileName::mkdir(folder.widePathTo(std::string("deep/") + '\0' + "/er"), 0777, FileName::kFullPath));
    EXPECT_FALSE(folder.has("deep"));
}

TEST_F(FileNameOnDisk, MkdirFailsWithoutTheRightToWrite)
{
    ASSERT_EQ(chmod(folder.path().c_str(), 0555), 0);
    EXPECT_EQ(
        asOrdinaryUser(
            [&] { return FileName::mkdir(folder.widePathTo("a/b"), 0777, FileName::kFullPath) ? "made" : "refused"; }),
        "refused");
}

} // namespace
