#include "kept_calls.h"

#include "platform/os/os_files.h"
#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <array>
#include <cerrno>
#include <fcntl.h>
#include <filesystem>
#include <gmock/gmock.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

namespace {

using support::asOrdinaryUser;
using support::TempFolder;
using testing::AnyOf;
using testing::ElementsAre;
using testing::IsEmpty;

std::error_code fails(int error)
{
    return {error, std::generic_category()};
}

class ReplaceFile : public testing::Test {
protected:
    std::error_code replace(std::string_view name, std::string_view content) const
    {
        return os::replaceFile(folder.pathTo(name), content);
    }

    struct stat statusOf(std::string_view name) const
    {
        struct stat status {};
        EXPECT_EQ(lstat(folder.pathTo(name).c_str(), &status), 0) << name;
        return status;
    }

    mode_t modeOf(std::string_view name) const { return statusOf(name).st_mode & 07777U; }

    void setMode(std::string_view name, mode_t mode) const { ASSERT_EQ(chmod(folder.pathTo(name).c_str(), mode), 0); }

    void openFolderToAll() const { ASSERT_EQ(chmod(folder.path().c_str(), 0777), 0); }

    TempFolder const folder;
};

TEST_F(ReplaceFile, MakesANewFile)
{
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_EQ(folder.read("plan.dwg"), "new");
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, ReplacesTheContentAsAWhole)
{
    folder.write("plan.dwg", "a longer old content");
    for (std::string const& content : {std::string("new"), std::string(), std::string("a\0\r\n\xFF", 5)}) {
        EXPECT_EQ(replace("plan.dwg", content), std::error_code());
        EXPECT_EQ(folder.read("plan.dwg"), content);
    }
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, WritesLargeContents)
{
    std::string content(20'000'000, 'x');
    content.back() = 'y';
    EXPECT_EQ(replace("plan.dwg", content), std::error_code());
    EXPECT_EQ(folder.read("plan.dwg"), content);
}

TEST_F(ReplaceFile, TakesPathsRelativeToTheCurrentFolder)
{
    std::filesystem::path const before = std::filesystem::current_path();
    std::filesystem::current_path(folder.path());
    EXPECT_EQ(os::replaceFile("plan.dwg", "new"), std::error_code());
    EXPECT_EQ(os::replaceFile("./plan.2", "new"), std::error_code());
    std::filesystem::current_path(before);
    EXPECT_THAT(folder.list(), ElementsAre("plan.2", "plan.dwg"));
}

TEST_F(ReplaceFile, LeavesReadersOfTheOldContentAlone)
{
    folder.write("plan.dwg", "old");
    int const reader = open(folder.pathTo("plan.dwg").c_str(), O_RDONLY | O_CLOEXEC);
    ASSERT_NE(reader, -1);
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    std::array<char, 8> bytes{};
    EXPECT_EQ(read(reader, bytes.data(), bytes.size()), 3);
    EXPECT_STREQ(bytes.data(), "old");
    close(reader);
}

TEST_F(ReplaceFile, NewFileFollowsTheUmask)
{
    mode_t const before = umask(0027);
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    umask(before);
    EXPECT_EQ(modeOf("plan.dwg"), 0640U);
}

class ReplaceFileOfMode
    : public ReplaceFile
    , public testing::WithParamInterface<mode_t> {};

TEST_P(ReplaceFileOfMode, KeepsThePermissions)
{
    folder.write("plan.dwg", "old");
    setMode("plan.dwg", GetParam());
    mode_t const before = umask(0077);
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    umask(before);
    EXPECT_EQ(modeOf("plan.dwg"), GetParam());
}

INSTANTIATE_TEST_SUITE_P(Modes, ReplaceFileOfMode, testing::Values(0600, 0644, 0666, 0755, 0777, 02775, 04755));

TEST_F(ReplaceFile, KeepsOwnerAndGroup)
{
    folder.write("plan.dwg", "old");
    // Refused to an ordinary user, who then checks that the own files stay the own ones.
    static_cast<void>(chown(folder.pathTo("plan.dwg").c_str(), 12345, 23456));
    setMode("plan.dwg", 04640);
    struct stat const before = statusOf("plan.dwg");
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    struct stat const after = statusOf("plan.dwg");
    EXPECT_EQ(after.st_uid, before.st_uid);
    EXPECT_EQ(after.st_gid, before.st_gid);
    EXPECT_EQ(after.st_mode, before.st_mode);
}

TEST_F(ReplaceFile, ReplacesTheFileOfSomebodyElseWithoutRunningAsThem)
{
    KeptCalls const kept;
    folder.write("plan.dwg", "old");
    setMode("plan.dwg", 06666);
    // Makes the file look as if it belonged to somebody else, and giving files away impossible.
    os::calls().fchown = [](int, uid_t, gid_t) {
        errno = EPERM;
        return -1;
    };
    if (chown(folder.pathTo("plan.dwg").c_str(), 12345, 23456) == 0) { // only as the administrator
        setMode("plan.dwg", 06666);
        EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
        EXPECT_EQ(modeOf("plan.dwg"), 0666U);
        EXPECT_EQ(statusOf("plan.dwg").st_uid, geteuid());
    } else {
        EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
        EXPECT_EQ(modeOf("plan.dwg"), 06666U);
    }
    EXPECT_EQ(folder.read("plan.dwg"), "new");
}

// The file's own list of users with rights, as the system stores it: version 2, then entries of 8 bytes.
std::string accessList()
{
    auto const entry = [](int tag, int rights, unsigned id) {
        std::string bytes{static_cast<char>(tag), 0, static_cast<char>(rights), 0};
        for (unsigned shift = 0; shift < 32; shift += 8) {
            bytes += static_cast<char>(id >> shift & 0xFFU);
        }
        return bytes;
    };
    constexpr unsigned kNobody = 0xFFFFFFFF;
    return std::string("\2\0\0\0", 4) + entry(1, 6, kNobody) + entry(2, 6, 1234) + entry(4, 0, kNobody) +
           entry(0x10, 6, kNobody) + entry(0x20, 0, kNobody);
}

// Where the file system keeps no such lists, there is none before and none after.
std::string accessListOf(std::string const& path)
{
    std::array<char, 256> list;
    ssize_t const size = getxattr(path.c_str(), "system.posix_acl_access", list.data(), list.size());
    return size > 0 ? std::string(list.data(), static_cast<std::size_t>(size)) : "none";
}

void setList(std::string const& path, char const* name)
{
    std::string const list = accessList();
    int const result = setxattr(path.c_str(), name, list.data(), list.size(), 0);
    ASSERT_TRUE(result == 0 || errno == EOPNOTSUPP);
}

TEST_F(ReplaceFile, KeepsTheListOfUsersWithRights)
{
    folder.write("plan.dwg", "old");
    setList(folder.pathTo("plan.dwg"), "system.posix_acl_access");
    std::string const before = accessListOf(folder.pathTo("plan.dwg"));
    mode_t const mode = modeOf("plan.dwg");
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_EQ(accessListOf(folder.pathTo("plan.dwg")), before);
    EXPECT_EQ(modeOf("plan.dwg"), mode);
}

TEST_F(ReplaceFile, GivesNoRightsThatTheOldFileDidNotGive)
{
    folder.write("plan.dwg", "old");
    setMode("plan.dwg", 0660);
    setList(folder.path(), "system.posix_acl_default");
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_EQ(accessListOf(folder.pathTo("plan.dwg")), "none");
    EXPECT_EQ(modeOf("plan.dwg"), 0660U);
}

TEST_F(ReplaceFile, FollowsALinkThatStays)
{
    folder.write("sub/plan.dwg", "old");
    folder.makeLink("link", "sub/plan.dwg");
    EXPECT_EQ(replace("link", "new"), std::error_code());
    EXPECT_TRUE(S_ISLNK(statusOf("link").st_mode));
    EXPECT_EQ(folder.read("sub/plan.dwg"), "new");
    EXPECT_THAT(folder.list(), ElementsAre("link", "sub/", "sub/plan.dwg"));
}

TEST_F(ReplaceFile, FollowsLinksFromFolderToFolder)
{
    folder.write("c/plan.dwg", "old");
    folder.makeLink("a/one", "../b/two");
    folder.makeLink("b/two", folder.pathTo("c/three"));
    folder.makeLink("c/three", "plan.dwg");
    folder.makeLink("d", "a");
    EXPECT_EQ(replace("d/one", "new"), std::error_code());
    EXPECT_EQ(folder.read("c/plan.dwg"), "new");
    EXPECT_THAT(folder.list(), ElementsAre("a/", "a/one", "b/", "b/two", "c/", "c/plan.dwg", "c/three", "d"));
}

TEST_F(ReplaceFile, MakesTheTargetOfADanglingLink)
{
    folder.makeFolder("sub");
    folder.makeLink("link", "sub/plan.dwg");
    EXPECT_EQ(replace("link", "new"), std::error_code());
    EXPECT_TRUE(S_ISLNK(statusOf("link").st_mode));
    EXPECT_EQ(folder.read("sub/plan.dwg"), "new");
}

TEST_F(ReplaceFile, FailsWhenALinkLeadsIntoAMissingFolder)
{
    folder.makeLink("link", "missing/plan.dwg");
    EXPECT_EQ(replace("link", "new"), fails(ENOENT));
    EXPECT_THAT(folder.list(), ElementsAre("link"));
}

TEST_F(ReplaceFile, FailsForLinksInACircle)
{
    folder.makeLink("itself", "itself");
    folder.makeLink("a", "b");
    folder.makeLink("b", "a");
    EXPECT_EQ(replace("itself", "new"), fails(ELOOP));
    EXPECT_EQ(replace("a", "new"), fails(ELOOP));
    EXPECT_EQ(replace("itself/plan.dwg", "new"), fails(ELOOP));
    EXPECT_THAT(folder.list(), ElementsAre("a", "b", "itself"));
}

TEST_F(ReplaceFile, FollowsAsManyLinksAsTheSystem)
{
    folder.write("0", "old");
    for (int i = 1; i <= 41; ++i) {
        folder.makeLink(std::to_string(i), std::to_string(i - 1));
    }
    EXPECT_EQ(folder.read("40"), "old");
    EXPECT_EQ(replace("40", "new"), std::error_code());
    EXPECT_EQ(folder.read("0"), "new");
    EXPECT_EQ(replace("41", "newer"), fails(ELOOP));
    EXPECT_EQ(folder.read("0"), "new");
}

TEST_F(ReplaceFile, RefusesWhatIsNoRegularFile)
{
    folder.makeFolder("sub");
    folder.makeLink("link to folder", "sub");
    folder.makeLink("link to device", "/dev/null");
    ASSERT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    std::vector<std::string> const before = folder.list();
    for (char const* name : {"sub", "sub/", "sub/.", "sub/..", "link to folder", "link to folder/", "."}) {
        EXPECT_EQ(replace(name, "new"), fails(EISDIR)) << name;
    }
    EXPECT_EQ(os::replaceFile("/", "new"), fails(EISDIR));
    EXPECT_EQ(replace("pipe", "new"), fails(EINVAL));
    EXPECT_EQ(replace("link to device", "new"), fails(EINVAL));
    EXPECT_EQ(folder.list(), before);
}

TEST_F(ReplaceFile, FailsWithoutAFolder)
{
    folder.write("file", "content");
    EXPECT_EQ(replace("missing/plan.dwg", "new"), fails(ENOENT));
    EXPECT_EQ(replace("missing/", "new"), fails(ENOENT));
    EXPECT_EQ(replace("file/plan.dwg", "new"), fails(ENOTDIR));
    EXPECT_EQ(replace("file/", "new"), fails(ENOTDIR));
    EXPECT_EQ(os::replaceFile("", "new"), fails(ENOENT));
    EXPECT_EQ(folder.read("file"), "content");
}

TEST_F(ReplaceFile, ProtectsAFileThatItsOwnerMadeReadOnly)
{
    folder.write("plan.dwg", "old");
    setMode("plan.dwg", 0444);
    openFolderToAll();
    EXPECT_EQ(asOrdinaryUser([&] { return replace("plan.dwg", "new").message(); }), fails(EACCES).message());
    EXPECT_EQ(folder.read("plan.dwg"), "old");
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, FailsInAFolderThatMayNotBeWritten)
{
    folder.write("plan.dwg", "old");
    setMode("plan.dwg", 0666);
    ASSERT_EQ(chmod(folder.path().c_str(), 0555), 0);
    for (char const* name : {"plan.dwg", "new.dwg"}) {
        EXPECT_EQ(asOrdinaryUser([&] { return replace(name, "new").message(); }), fails(EACCES).message());
    }
    EXPECT_EQ(folder.read("plan.dwg"), "old");
}

TEST_F(ReplaceFile, FailsInAFolderThatMayNotBeReadBeforeItTouchesAnything)
{
    folder.write("plan.dwg", "old");
    setMode("plan.dwg", 0666);
    ASSERT_EQ(chmod(folder.path().c_str(), 0333), 0);
    EXPECT_EQ(asOrdinaryUser([&] { return replace("plan.dwg", "new").message(); }), fails(EACCES).message());
    EXPECT_EQ(folder.read("plan.dwg"), "old");
    openFolderToAll();
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, WorksForAnOrdinaryUser)
{
    openFolderToAll();
    EXPECT_EQ(
        asOrdinaryUser([&] {
            std::error_code const first = replace("plan.dwg", "first");
            std::error_code const second = replace("plan.dwg", "second");
            return first.message() + ", " + second.message();
        }),
        "Success, Success");
    EXPECT_EQ(folder.read("plan.dwg"), "second");
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, PathWithANulNamesNothing)
{
    folder.write("plan", "old");
    EXPECT_EQ(replace(std::string("plan\0.dwg", 9), "new"), fails(EILSEQ));
    EXPECT_EQ(folder.read("plan"), "old");
    EXPECT_THAT(folder.list(), ElementsAre("plan"));
}

TEST_F(ReplaceFile, TakesNamesOfAnyBytes)
{
    for (std::string const name : {"\xFF\x80", "\xC3\xA4 \n", "-", "~", "\x01"}) {
        EXPECT_EQ(replace(name, name), std::error_code());
        EXPECT_EQ(replace(name, name), std::error_code());
        EXPECT_EQ(folder.read(name), name);
    }
    EXPECT_EQ(folder.list().size(), 5U);
}

// Both ways of writing, since each makes a temporary name of its own.
class ReplaceFileOfLongName
    : public ReplaceFile
    , public testing::WithParamInterface<bool> {
protected:
    void SetUp() override
    {
        if (GetParam()) {
            os::calls().openat = [](int parent, char const* path, int flags, mode_t mode) {
                errno = EOPNOTSUPP;
                return (flags & O_TMPFILE) == O_TMPFILE ? -1 : KeptCalls::real.openat(parent, path, flags, mode);
            };
        }
    }

    KeptCalls const kept_;
};

TEST_P(ReplaceFileOfLongName, TakesTheLongestNames)
{
    std::string euros;
    while (euros.size() < 255) {
        euros += "\xE2\x82\xAC";
    }
    for (std::string const& name : {std::string(255, 'n'), std::string(255, '\xA4'), euros, std::string(211, 'n')}) {
        EXPECT_EQ(replace(name, "first"), std::error_code());
        EXPECT_EQ(replace(name, "second"), std::error_code());
        EXPECT_EQ(folder.read(name), "second");
    }
    EXPECT_EQ(replace(std::string(256, 'n'), "new"), fails(ENAMETOOLONG));
    EXPECT_EQ(folder.list().size(), 4U);
}

TEST_P(ReplaceFileOfLongName, TakesTheLongestPaths)
{
    std::string path;
    while (folder.pathTo(path).size() + 202 < 4093) {
        path += std::string(200, 'd') + "/";
    }
    path += std::string(4093 - folder.pathTo(path).size(), 'e') + "/";
    folder.makeFolder(path);
    ASSERT_EQ(folder.pathTo(path + "p").size(), 4095U);
    EXPECT_EQ(replace(path + "p", "first"), std::error_code());
    EXPECT_EQ(replace(path + "p", "second"), std::error_code());
    EXPECT_EQ(folder.read(path + "p"), "second");
    EXPECT_EQ(replace(path + std::string(5000, '/') + "p", "third"), fails(ENAMETOOLONG));
    EXPECT_EQ(folder.read(path + "p"), "second");
}

INSTANTIATE_TEST_SUITE_P(Ways, ReplaceFileOfLongName, testing::Bool(), [](auto const& way) {
    return way.param ? "Named" : "Unnamed";
});

TEST_F(ReplaceFile, WritesTheContentBeforeTheNameShowsItAndTheNameBeforeItReturns)
{
    static std::vector<std::string> steps;
    steps.clear();
    KeptCalls const kept;
    os::calls().write = [](int file, void const* bytes, std::size_t count) {
        steps.emplace_back("write");
        return KeptCalls::real.write(file, bytes, count);
    };
    os::calls().fsync = [](int file) {
        struct stat status {};
        fstat(file, &status);
        steps.emplace_back(S_ISDIR(status.st_mode) ? "flush folder" : "flush file");
        return KeptCalls::real.fsync(file);
    };
    os::calls().renameat = [](int fromFolder, char const* from, int toFolder, char const* to) {
        steps.emplace_back("rename");
        return KeptCalls::real.renameat(fromFolder, from, toFolder, to);
    };
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_THAT(steps, ElementsAre("write", "flush file", "rename", "flush folder"));
}

TEST_F(ReplaceFile, ShowsASecretToNobodyMeanwhile)
{
    folder.write("plan.dwg", "old");
    setMode("plan.dwg", 0600);
    static mode_t seen;
    seen = 0;
    KeptCalls const kept;
    os::calls().write = [](int file, void const* bytes, std::size_t count) {
        struct stat status {};
        fstat(file, &status);
        seen |= status.st_mode & 0777U;
        return KeptCalls::real.write(file, bytes, count);
    };
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_EQ(seen, 0600U);
}

TEST_F(ReplaceFile, WritesOnAfterPartialWrites)
{
    KeptCalls const kept;
    os::calls().write = [](int file, void const* bytes, std::size_t count) {
        return KeptCalls::real.write(file, bytes, std::min<std::size_t>(count, 3));
    };
    EXPECT_EQ(replace("plan.dwg", "a new content"), std::error_code());
    EXPECT_EQ(folder.read("plan.dwg"), "a new content");
}

TEST_F(ReplaceFile, WorksWhereFoldersCannotBeFlushed)
{
    KeptCalls const kept;
    os::calls().fsync = [](int file) {
        struct stat status {};
        fstat(file, &status);
        errno = EINVAL;
        return S_ISDIR(status.st_mode) ? -1 : KeptCalls::real.fsync(file);
    };
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
}

TEST_F(ReplaceFile, ReportsThatTheFolderCouldNotBeFlushed)
{
    folder.write("plan.dwg", "old");
    KeptCalls const kept;
    os::calls().fsync = [](int file) {
        struct stat status {};
        fstat(file, &status);
        errno = EIO;
        return S_ISDIR(status.st_mode) ? -1 : KeptCalls::real.fsync(file);
    };
    EXPECT_EQ(replace("plan.dwg", "new"), fails(EIO));
    EXPECT_EQ(folder.read("plan.dwg"), "new");
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, WorksWhereUnnamedFilesCannotGetAName)
{
    folder.write("plan.dwg", "old");
    KeptCalls const kept;
    for (int const error : {ENOENT, EACCES, EPERM, EXDEV, EOPNOTSUPP}) {
        static int given;
        given = error;
        os::calls().linkat = [](int, char const*, int, char const*, int) {
            errno = given;
            return -1;
        };
        std::string const content = "new " + std::to_string(error);
        EXPECT_EQ(replace("plan.dwg", content), std::error_code());
        EXPECT_EQ(folder.read("plan.dwg"), content);
        EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
    }
}

TEST_F(ReplaceFile, TakesAnotherNameWhenOneIsTaken)
{
    static int refusals;
    refusals = 3;
    KeptCalls const kept;
    os::calls().linkat = [](int fromFolder, char const* from, int toFolder, char const* to, int flags) {
        errno = EEXIST;
        return refusals-- > 0 ? -1 : KeptCalls::real.linkat(fromFolder, from, toFolder, to, flags);
    };
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_LT(refusals, 0);
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

// Another writer takes the temporary file for abandoned just before it is renamed.
int renameWithoutSource(int fromFolder, char const* from, int toFolder, char const* to)
{
    KeptCalls::real.unlinkat(fromFolder, from, 0);
    return KeptCalls::real.renameat(fromFolder, from, toFolder, to);
}

TEST_F(ReplaceFile, StartsAgainWhenItsTemporaryFileIsTakenAway)
{
    folder.write("plan.dwg", "old");
    KeptCalls const kept;
    static int thefts;
    thefts = 3;
    os::calls().renameat = [](int fromFolder, char const* from, int toFolder, char const* to) {
        auto const rename = thefts-- > 0 ? renameWithoutSource : KeptCalls::real.renameat;
        return rename(fromFolder, from, toFolder, to);
    };
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_EQ(folder.read("plan.dwg"), "new");
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, GivesUpWhenItsTemporaryFilesAreAlwaysTakenAway)
{
    folder.write("plan.dwg", "old");
    KeptCalls const kept;
    os::calls().renameat = renameWithoutSource;
    EXPECT_EQ(replace("plan.dwg", "new"), fails(EAGAIN));
    EXPECT_EQ(folder.read("plan.dwg"), "old");
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, StartsAgainBeforeItWritesWhenItsNamedFileVanishesBeforeItIsLocked)
{
    KeptCalls const kept;
    static int thefts;
    static int writes;
    thefts = 2;
    writes = 0;
    os::calls().write = [](int file, void const* bytes, std::size_t count) {
        ++writes;
        return KeptCalls::real.write(file, bytes, count);
    };
    os::calls().openat = [](int parent, char const* path, int flags, mode_t mode) {
        errno = EOPNOTSUPP;
        int const file = (flags & O_TMPFILE) == O_TMPFILE ? -1 : KeptCalls::real.openat(parent, path, flags, mode);
        if ((flags & O_EXCL) != 0 && thefts-- > 0) {
            KeptCalls::real.unlinkat(parent, path, 0);
        }
        return file;
    };
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_LT(thefts, 0);
    EXPECT_EQ(writes, 1);
    EXPECT_EQ(folder.read("plan.dwg"), "new");
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, SweepsWhatKilledWritersOfTheSameFileLeft)
{
    for (char const* name : {".plan.dwg.1-0.tmp", ".plan.dwg.4194304-18446744073709551615.tmp", ".new.7-7.tmp"}) {
        folder.write(name, "half");
    }
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre(".new.7-7.tmp", "plan.dwg"));
    EXPECT_EQ(replace("new", "new"), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre("new", "plan.dwg"));
}

TEST_F(ReplaceFile, SweepsLeftoversOfLongNames)
{
    std::string const name(255, 'n');
    folder.write("." + std::string(210, 'n') + ".12-3.tmp", "half");
    EXPECT_EQ(replace(name, "new"), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre(name));
}

TEST_F(ReplaceFile, SweepsNothingElse)
{
    std::vector<std::string> const names{
        ".plan.dwg..tmp",      ".plan.dwg.-.tmp",       ".plan.dwg.1-.tmp",   ".plan.dwg.-1.tmp",
        ".plan.dwg.1-2-3.tmp", ".plan.dwg.1-2.TMP",     ".plan.dwg.1-2.tmp~", ".plan.dwg.12.tmp",
        ".plan.dwg.a-1.tmp",   ".plan.dwg.bak.1-2.tmp", ".plan.dwgx.1-2.tmp", ".plan.dwg.tmp",
        ".xplan.dwg.1-2.tmp",  "plan.dwg.1-2.tmp",      ".plan.1-2.tmp",      "sub/.plan.dwg.1-2.tmp"};
    for (std::string const& name : names) {
        folder.write(name, "mine");
    }
    folder.makeFolder(".plan.dwg.5-5.tmp");
    folder.makeLink(".plan.dwg.6-6.tmp", "sub/.plan.dwg.1-2.tmp");
    std::vector<std::string> expected = folder.list();
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    expected.emplace_back("plan.dwg");
    EXPECT_THAT(folder.list(), testing::UnorderedElementsAreArray(expected));
}

TEST_F(ReplaceFile, LeavesTheTemporaryFileOfALivingWriterAlone)
{
    folder.write(".plan.dwg.1-0.tmp", "half");
    int const writer = open(folder.pathTo(".plan.dwg.1-0.tmp").c_str(), O_RDWR | O_CLOEXEC);
    ASSERT_EQ(flock(writer, LOCK_EX), 0);
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre(".plan.dwg.1-0.tmp", "plan.dwg"));
    close(writer);
    EXPECT_EQ(replace("plan.dwg", "newer"), std::error_code());
    EXPECT_THAT(folder.list(), ElementsAre("plan.dwg"));
}

TEST_F(ReplaceFile, HoldsALockOnItsTemporaryFileAsLongAsItHasAName)
{
    KeptCalls const kept;
    static std::string problem;
    problem = "not renamed";
    os::calls().renameat = [](int fromFolder, char const* from, int toFolder, char const* to) {
        int const other = openat(fromFolder, from, O_RDWR | O_CLOEXEC);
        problem = flock(other, LOCK_EX | LOCK_NB) == 0 ? "not locked" : "";
        close(other);
        return KeptCalls::real.renameat(fromFolder, from, toFolder, to);
    };
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_EQ(problem, "");
}

TEST_F(ReplaceFile, SweepsNothingWhereThereAreNoLocks)
{
    folder.write(".plan.dwg.1-0.tmp", "half");
    KeptCalls const kept;
    os::calls().flock = [](int, int) {
        errno = ENOLCK;
        return -1;
    };
    EXPECT_EQ(replace("plan.dwg", "new"), std::error_code());
    EXPECT_EQ(folder.read("plan.dwg"), "new");
    EXPECT_THAT(folder.list(), ElementsAre(".plan.dwg.1-0.tmp", "plan.dwg"));
}

} // namespace
