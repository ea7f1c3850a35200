#include "platform/ut/Dir.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/temp_folder.h"
#include "tests/support/utf8.h"

#include <gmock/gmock.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/un.h>
#include <unistd.h>

namespace {

using support::TempFolder;
using testing::ElementsAre;
using testing::IsEmpty;
using ut::Dir;

std::vector<std::string> listed(Dir& dir, int flags)
{
    std::vector<std::string> names;
    OdString name;
    for (bool more = dir.getFirst(name, L"", flags); more; more = dir.getNext(name)) {
        names.push_back(name.ansi_str());
    }
    return names;
}

std::vector<std::string> listed(TempFolder const& folder, int flags)
{
    Dir dir;
    EXPECT_TRUE(dir.open(folder.widePath()));
    return listed(dir, flags);
}

std::vector<std::string> files(TempFolder const& folder)
{
    return listed(folder, Dir::kFiles | Dir::kHidden);
}

std::vector<std::string> dirs(TempFolder const& folder)
{
    return listed(folder, Dir::kDirs | Dir::kHidden);
}

OdString withNul(OdString const& path)
{
    return path + L'\0' + L"rest";
}

std::string deepPath(TempFolder const& folder, std::size_t length)
{
    std::string path = folder.path();
    while (path.size() + 202 < length) {
        path += "/" + std::string(200, 'd');
    }
    return path + "/" + std::string(length - path.size() - 1, 'e');
}

TEST(DirExists, IsTrueForFoldersOnly)
{
    TempFolder const folder;
    folder.makeFolder("sub");
    folder.write("file", "");
    folder.makeLink("link to folder", "sub");
    folder.makeLink("link to file", "file");
    folder.makeLink("dangling", "nowhere");
    folder.makeLink("loop", "loop");
    EXPECT_TRUE(Dir::exists(folder.widePathTo("sub")));
    EXPECT_TRUE(Dir::exists(folder.widePathTo("sub/")));
    EXPECT_TRUE(Dir::exists(folder.widePathTo("link to folder")));
    EXPECT_FALSE(Dir::exists(folder.widePathTo("file")));
    EXPECT_FALSE(Dir::exists(folder.widePathTo("link to file")));
    EXPECT_FALSE(Dir::exists(folder.widePathTo("dangling")));
    EXPECT_FALSE(Dir::exists(folder.widePathTo("loop")));
    EXPECT_FALSE(Dir::exists(folder.widePathTo("missing")));
    EXPECT_FALSE(Dir::exists(L""));
    EXPECT_TRUE(Dir::exists(L"."));
}

TEST(DirExists, IsFalseForAPathWithANul)
{
    TempFolder const folder;
    EXPECT_FALSE(Dir::exists(withNul(folder.widePath())));
}

TEST(DirExists, IsFalseForAPathThatIsTooLong)
{
    TempFolder const folder;
    EXPECT_FALSE(Dir::exists(support::fromUtf8(deepPath(folder, 5000))));
}

TEST(DirCreate, MakesTheFolder)
{
    TempFolder const folder;
    EXPECT_TRUE(Dir::create(folder.widePathTo("sub")));
    EXPECT_TRUE(Dir::create(folder.widePathTo("\xC3\xA4 \xFF/")));
    EXPECT_THAT(folder.list(), ElementsAre("sub/", "\xC3\xA4 \xFF/"));
}

TEST(DirCreate, FollowsTheUmask)
{
    TempFolder const folder;
    mode_t const before = umask(027);
    EXPECT_TRUE(Dir::create(folder.widePathTo("sub")));
    umask(before);
    struct stat status;
    ASSERT_EQ(stat(folder.pathTo("sub").c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0750U);
}

TEST(DirCreate, FailsWhenTheNameIsTaken)
{
    TempFolder const folder;
    folder.makeFolder("sub");
    folder.write("file", "content");
    folder.makeLink("dangling", "nowhere");
    EXPECT_FALSE(Dir::create(folder.widePathTo("sub")));
    EXPECT_FALSE(Dir::create(folder.widePathTo("file")));
    EXPECT_FALSE(Dir::create(folder.widePathTo("dangling")));
    EXPECT_EQ(folder.read("file"), "content");
}

TEST(DirCreate, FailsWithoutAParent)
{
    TempFolder const folder;
    folder.write("file", "");
    EXPECT_FALSE(Dir::create(folder.widePathTo("missing/sub")));
    EXPECT_FALSE(Dir::create(folder.widePathTo("file/sub")));
    EXPECT_FALSE(Dir::create(L""));
    EXPECT_THAT(folder.list(), ElementsAre("file"));
}

TEST(DirCreate, FailsForAPathThatTheSystemCannotTake)
{
    TempFolder const folder;
    EXPECT_FALSE(Dir::create(withNul(folder.widePathTo("sub"))));
    EXPECT_FALSE(Dir::create(folder.widePathTo(std::string(256, 'n'))));
    EXPECT_THAT(folder.list(), IsEmpty());
    EXPECT_TRUE(Dir::create(folder.widePathTo(std::string(255, 'n'))));
}

TEST(Dir, ListsFilesAndFoldersApart)
{
    TempFolder const folder;
    folder.write("plan.dwg", "");
    folder.write("sub/inner.dwg", "");
    EXPECT_THAT(listed(folder, Dir::kFiles), ElementsAre("plan.dwg"));
    EXPECT_THAT(listed(folder, Dir::kDirs), ElementsAre("sub"));
    EXPECT_THAT(listed(folder, Dir::kFiles | Dir::kDirs), ElementsAre("plan.dwg", "sub"));
    EXPECT_THAT(listed(folder, 0), IsEmpty());
    EXPECT_THAT(listed(folder, Dir::kHidden), IsEmpty());
}

TEST(Dir, NumbersOfTheFlagsAreFixed)
{
    EXPECT_EQ(static_cast<int>(Dir::kFiles), 1);
    EXPECT_EQ(static_cast<int>(Dir::kDirs), 2);
    EXPECT_EQ(static_cast<int>(Dir::kHidden), 4);
}

TEST(Dir, ListsHiddenEntriesOnlyWhenAskedTo)
{
    TempFolder const folder;
    for (char const* name : {".hidden", "..twice", "shown", "not.hidden"}) {
        folder.write(name, "");
    }
    folder.makeFolder(".tav");
    EXPECT_THAT(listed(folder, Dir::kFiles), ElementsAre("not.hidden", "shown"));
    EXPECT_THAT(listed(folder, Dir::kDirs), IsEmpty());
    EXPECT_THAT(files(folder), ElementsAre("..twice", ".hidden", "not.hidden", "shown"));
    EXPECT_THAT(dirs(folder), ElementsAre(".tav"));
}

TEST(Dir, SortsByBytes)
{
    TempFolder const folder;
    for (char const* name : {"b", "B", "a", "a b", "ab", "a-b", "\xC3\xA4", "\xFF", "\xF0\x9F\x98\x80", "10", "9"}) {
        folder.write(name, "");
    }
    EXPECT_THAT(
        files(folder),
        ElementsAre("10", "9", "B", "a", "a b", "a-b", "ab", "b", "\xC3\xA4", "\xF0\x9F\x98\x80", "\xFF"));
}

TEST(Dir, ListsLinksToFilesAsFiles)
{
    TempFolder const folder;
    folder.write("file", "");
    folder.makeLink("link", "file");
    folder.makeLink("link to link", "link");
    EXPECT_THAT(files(folder), ElementsAre("file", "link", "link to link"));
    EXPECT_THAT(dirs(folder), IsEmpty());
}

TEST(Dir, LeavesOutLinksToFoldersAndLinksToNothing)
{
    TempFolder const folder;
    folder.makeFolder("sub");
    folder.makeLink("link to folder", "sub");
    folder.makeLink("link to itself", ".");
    folder.makeLink("dangling", "nowhere");
    folder.makeLink("loop", "loop");
    EXPECT_THAT(files(folder), IsEmpty());
    EXPECT_THAT(dirs(folder), ElementsAre("sub"));
}

TEST(Dir, LeavesOutWhatIsNeitherFileNorFolder)
{
    TempFolder const folder;
    ASSERT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    int const handle = socket(AF_UNIX, SOCK_STREAM, 0);
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    folder.pathTo("socket").copy(address.sun_path, sizeof address.sun_path - 1);
    ASSERT_EQ(bind(handle, reinterpret_cast<sockaddr*>(&address), sizeof address), 0);
    close(handle);
    folder.makeLink("link to pipe", "pipe");
    folder.makeLink("link to device", "/dev/null");
    EXPECT_THAT(folder.list(), ElementsAre("link to device", "link to pipe", "pipe", "socket"));
    EXPECT_THAT(files(folder), IsEmpty());
    EXPECT_THAT(dirs(folder), IsEmpty());
}

TEST(Dir, NamesOfAnyBytesComeBackToTheDisk)
{
    TempFolder const folder;
    std::vector<std::string> const names{"\x01 \n", "\x80", "\xC0\x80", "\xED\xA0\x80", "\xF0\x9F\x98\x80", "\xFF\xFE"};
    for (std::string const& name : names) {
        folder.write(name, "");
    }
    EXPECT_EQ(files(folder), names);
}

TEST(Dir, ListsEverySingleByteAsAName)
{
    TempFolder const folder;
    std::vector<std::string> names;
    for (int byte = 1; byte < 256; ++byte) {
        if (byte != '/' && byte != '.') {
            names.emplace_back(1, static_cast<char>(byte));
            folder.write(names.back(), "");
        }
    }
    EXPECT_EQ(files(folder), names);
}

TEST(Dir, ListsTheLongestNames)
{
    TempFolder const folder;
    std::string const name(255, 'n');
    folder.write(name, "");
    EXPECT_THAT(files(folder), ElementsAre(name));
}

TEST(Dir, LeavesTheNameAloneAtTheEnd)
{
    TempFolder const folder;
    folder.write("plan.dwg", "");
    Dir dir;
    ASSERT_TRUE(dir.open(folder.widePath()));
    OdString name = L"before";
    EXPECT_FALSE(dir.getFirst(name, L"", Dir::kDirs));
    EXPECT_EQ(name, OdString(L"before"));
    ASSERT_TRUE(dir.getFirst(name, L"", Dir::kFiles));
    EXPECT_FALSE(dir.getNext(name));
    EXPECT_FALSE(dir.getNext(name));
    EXPECT_EQ(name, OdString(L"plan.dwg"));
}

TEST(Dir, ServesEveryEnumerationFromTheOneReading)
{
    TempFolder const folder;
    folder.write("first", "");
    folder.makeFolder("sub");
    Dir dir;
    ASSERT_TRUE(dir.open(folder.widePath()));
    folder.write("second", "");
    ASSERT_EQ(rmdir(folder.pathTo("sub").c_str()), 0);
    EXPECT_THAT(listed(dir, Dir::kFiles), ElementsAre("first"));
    EXPECT_THAT(listed(dir, Dir::kDirs), ElementsAre("sub"));
    EXPECT_THAT(listed(dir, Dir::kFiles), ElementsAre("first"));
}

TEST(Dir, ReadsAnewWhenOpenedAgain)
{
    TempFolder const folder;
    folder.write("a/first", "");
    folder.write("b/second", "");
    Dir dir;
    ASSERT_TRUE(dir.open(folder.widePathTo("a")));
    ASSERT_TRUE(dir.open(folder.widePathTo("b")));
    EXPECT_THAT(listed(dir, Dir::kFiles), ElementsAre("second"));
}

TEST(Dir, ListsNothingBeforeItIsOpenedOrAsked)
{
    Dir dir;
    OdString name = L"before";
    EXPECT_THAT(listed(dir, Dir::kFiles | Dir::kDirs | Dir::kHidden), IsEmpty());
    EXPECT_FALSE(dir.getNext(name));
    EXPECT_EQ(dir.getName(), OdString());

    TempFolder const folder;
    folder.write("plan.dwg", "");
    ASSERT_TRUE(dir.open(folder.widePath()));
    EXPECT_FALSE(dir.getNext(name));
    EXPECT_EQ(name, OdString(L"before"));
}

TEST(Dir, KeepsThePathAsItWasGiven)
{
    TempFolder const folder;
    folder.makeFolder("sub");
    OdString const path = folder.widePathTo("./sub/../sub//");
    Dir dir;
    ASSERT_TRUE(dir.open(path));
    EXPECT_EQ(dir.getName(), path);
}

TEST(Dir, OpensThroughALink)
{
    TempFolder const folder;
    folder.write("sub/inner", "");
    folder.makeLink("link", "sub");
    Dir dir;
    ASSERT_TRUE(dir.open(folder.widePathTo("link")));
    EXPECT_THAT(listed(dir, Dir::kFiles), ElementsAre("inner"));
}

TEST(Dir, OpensNothingButFolders)
{
    TempFolder const folder;
    folder.write("file", "");
    folder.makeLink("loop", "loop");
    ASSERT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    for (char const* name : {"file", "loop", "pipe", "missing", "file/"}) {
        EXPECT_FALSE(Dir().open(folder.widePathTo(name))) << name;
    }
    EXPECT_FALSE(Dir().open(L""));
    EXPECT_FALSE(Dir().open(withNul(folder.widePath())));
    EXPECT_FALSE(Dir().open(support::fromUtf8(deepPath(folder, 5000))));
}

TEST(Dir, ListsNothingAfterAFailedOpening)
{
    TempFolder const folder;
    folder.write("plan.dwg", "");
    Dir dir;
    ASSERT_TRUE(dir.open(folder.widePath()));
    EXPECT_FALSE(dir.open(folder.widePathTo("missing")));
    EXPECT_THAT(listed(dir, Dir::kFiles), IsEmpty());
    EXPECT_EQ(dir.getName(), OdString());
}

TEST(Dir, DoesNotOpenAFolderThatMayNotBeRead)
{
    TempFolder const folder;
    folder.write("shut/plan.dwg", "");
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(folder.pathTo("shut").c_str(), 0311), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return Dir().open(folder.widePathTo("shut")) ? "opened" : "refused"; }),
        "refused");
}

TEST(Dir, ListsAFolderThatMayBeReadButNotEntered)
{
    TempFolder const folder;
    folder.write("shut/plan.dwg", "");
    folder.makeFolder("shut/sub");
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(folder.pathTo("shut").c_str(), 0444), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] {
            Dir dir;
            if (!dir.open(folder.widePathTo("shut"))) {
                return std::string("refused");
            }
            std::vector<std::string> const names = listed(dir, Dir::kFiles | Dir::kDirs);
            return names.empty() ? "nothing" : names.front() + " " + names.back();
        }),
        "plan.dwg sub");
}

TEST(Dir, WalksFoldersDownToTheLongestPathThatTheSystemTakes)
{
    TempFolder const folder;
    std::string const path = deepPath(folder, 4095);
    folder.makeFolder(path.substr(folder.path().size() + 1));
    EXPECT_TRUE(Dir().open(support::fromUtf8(path)));
    EXPECT_FALSE(Dir().open(support::fromUtf8(path + "/")));
}

} // namespace
