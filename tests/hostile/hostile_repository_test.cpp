// Repositories whose own files are something else than a command expects, or may not be written.
#include "tests/host/history_test.h"
#include "tests/host/run_here.h"
#include "tests/support/as_ordinary_user.h"
#include "tests/support/rows.h"

#include "common/mu_common_versions.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <filesystem>
#include <functional>
#include <sched.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

namespace host_tests {
namespace {

using testing::MatchesRegex;

std::string toldBy(Outcome const& outcome)
{
    return std::to_string(outcome.code) + "\n" + outcome.err;
}

/// A repository with a commit and a new file.
class OddRepository : public HistoryTest {
protected:
    OddRepository()
    {
        repo.write("a.dwg", "one");
        commitAll("first");
        repo.write("a.dwg", "two");
        repo.write("new.dwg", "new");
    }

    void takeAway(std::string const& name) const { std::filesystem::remove_all(repo.pathTo(name)); }

    void putFolder(std::string const& name) const
    {
        takeAway(name);
        repo.write(name + "/inside", "mine");
    }

    void putPipe(std::string const& name) const
    {
        takeAway(name);
        ASSERT_EQ(mkfifo(repo.pathTo(name).c_str(), 0666), 0);
    }

    /// Files and links with their contents, one line each.
    static std::vector<std::string> imageOf(support::TempFolder const& place)
    {
        std::vector<std::string> image;
        for (std::string const& name : place.list()) {
            if (name == ".tav/restoring/") { // Made once, and left empty.
                continue;
            }
            struct stat status;
            EXPECT_EQ(lstat(place.pathTo(name).c_str(), &status), 0);
            bool const isFile = S_ISREG(status.st_mode) && name != ".tav/tav.lock";
            std::string const content = isFile ? place.read(name) : "";
            image.push_back(name + " " + generateSha(content.data(), static_cast<int>(content.size())).ansi_str());
        }
        return image;
    }
};

struct OddRow {
    char const* name;
    std::string file; ///< what stands in its place
    std::vector<Arguments> commands;
    char const* message; ///< an expression for the whole of what is told
};

class OddFile
    : public OddRepository
    , public testing::WithParamInterface<OddRow> {
protected:
    void expectRefusals(char const* message)
    {
        std::vector<std::string> const before = imageOf(repo);
        for (Arguments const& command : GetParam().commands) {
            Outcome const outcome = tav(command);
            EXPECT_EQ(outcome.code, 1) << command.front();
            EXPECT_EQ(outcome.out, "") << command.front();
            EXPECT_THAT(outcome.err, MatchesRegex(std::string("tav: ") + message + "\n")) << command.front();
        }
        EXPECT_EQ(imageWithoutKept(before), before);
    }

private:
    /// Without the contents that were to be overwritten, and are kept by then: 'tav gc' removes them.
    std::vector<std::string> imageWithoutKept(std::vector<std::string> const& before) const
    {
        std::vector<std::string> image = imageOf(repo);
        auto const isKept = [&](std::string const& line) {
            return line.rfind(".tav/tf/", 0) == 0 && std::find(before.begin(), before.end(), line) == before.end();
        };
        image.erase(std::remove_if(image.begin(), image.end(), isKept), image.end());
        return image;
    }
};

using FolderInItsPlace = OddFile;
using PipeInItsPlace = OddFile;

TEST_P(FolderInItsPlace, IsToldAndLeft)
{
    putFolder(GetParam().file);
    expectRefusals(GetParam().message);
}

TEST_P(PipeInItsPlace, IsToldAndHoldsNobodyUp)
{
    putPipe(GetParam().file);
    expectRefusals(GetParam().message);
}

std::vector<Arguments> const kAll = {
    {"status"},     {"add", "--all"}, {"commit", "-m", "x"}, {"checkout", "1"}, {"restore", "a.dwg", "--force"},
    {"rm", "a.dwg"}};
std::vector<Arguments> const kChanging = {
    {"add", "--all"}, {"commit", "-m", "x"}, {"checkout", "1"}, {"restore", "a.dwg", "--force"}, {"rm", "a.dwg"}};
std::vector<Arguments> const kScanning = {{"status"}, {"files"}, {"add", "--all"}, {"ignore"}};

INSTANTIATE_TEST_SUITE_P(
    Own, FolderInItsPlace,
    testing::Values(
        OddRow{"State", ".tav/tav.state", {{"status"}, {"add", "--all"}, {"commit", "-m", "x"}}, ".*tav\\.state.*"},
        OddRow{"Database", ".tav/tav.db", kAll, ".*tav\\.db.*"},
        OddRow{"Lock", ".tav/tav.lock", kChanging, ".*locked.*"},
        OddRow{"Rules", ".tav/properties/ignore", kScanning, ".*ignore.*"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    Own, PipeInItsPlace,
    testing::Values(
        OddRow{"State", ".tav/tav.state", {{"status"}, {"add", "--all"}, {"commit", "-m", "x"}}, ".*tav\\.state.*"},
        OddRow{"Database", ".tav/tav.db", kAll, ".*tav\\.db.*"},
        OddRow{"Lock", ".tav/tav.lock", kChanging, ".*locked.*"},
        OddRow{"Rules", ".tav/properties/ignore", kScanning, ".*ignore.*"},
        OddRow{"Objects", ".tav/objects", {{"verify"}, {"gc"}}, ".*"},
        OddRow{"Stores", ".tav/tf", {{"restore", "a.dwg", "--force"}, {"verify"}}, ".*"},
        OddRow{"Restoring", ".tav/restoring", {{"restore", "a.dwg", "--force"}, {"checkout", "1", "--force"}}, ".*"},
        OddRow{"Folder", ".tav", kAll, ".*is not a tav directory.*"}),
    support::rowName);

TEST_F(OddRepository, WithAPipeAmongItsFilesIsNotHeldUp)
{
    putPipe("new.dwg");
    EXPECT_EQ(tav({"files"}), done("a.dwg\n.tav/properties/ignore\n"));
    putPipe("a.dwg");
    EXPECT_EQ(tav({"status"}).code, 0);
    EXPECT_EQ(tav({"diff"}).code, 0);
    EXPECT_EQ(tav({"add", "a.dwg"}).code, 0);
    EXPECT_EQ(
        tav({"restore", "a.dwg", "--force"}),
        failed("tav: 'a.dwg' is not a regular file. Nothing has been written; move it away first.\n"));
}

TEST_F(OddRepository, CommitsNoRemovalWhereSomethingElseHasThePlaceOfAFile)
{
    std::string const complaint =
        "tav: 'a.dwg' is staged, but it is not a regular file any more. Move what is there away, "
        "or run 'tav unstage' for it.\n";
    putPipe("a.dwg");
    EXPECT_EQ(tav({"add", "a.dwg"}).code, 0);
    EXPECT_EQ(tav({"commit", "-m", "x"}), failed(complaint));
    ASSERT_EQ(unlink(repo.pathTo("a.dwg").c_str()), 0);
    repo.makeLink("a.dwg", "nowhere");
    EXPECT_EQ(tav({"commit", "-m", "x"}), failed(complaint));
    ASSERT_EQ(unlink(repo.pathTo("a.dwg").c_str()), 0);
    EXPECT_EQ(tav({"commit", "-m", "x"}).code, 0);
}

TEST_F(OddRepository, WhoseRulesMayNotBeReadOffersNothingForACommit)
{
    chmod(repo.path().c_str(), 0777);
    chmod(repo.pathTo(".tav/properties/ignore").c_str(), 0);
    std::string const told = support::asOrdinaryUser([&] { return toldBy(tav({"status"})); });
    EXPECT_EQ(
        told, "1\ntav: The ignore file '" + repo.pathTo(".tav/properties/ignore") +
                  "' cannot be read: Permission denied. Check it and your permissions for it.\n");
    EXPECT_EQ(support::asOrdinaryUser([&] { return toldBy(tav({"log"})); }), "0\n");
}

TEST_F(OddRepository, WhoseFolderIsAFileIsNone)
{
    takeAway(".tav");
    repo.write(".tav", "mine");
    EXPECT_EQ(
        tav({"status"}), failed(
                             "tav: Path: " + repo.path() +
                             " is not a tav directory. Run 'tav init' in the folder of your drawings to make it "
                             "one.\n"));
    EXPECT_EQ(
        tav({"init"}), failed("tav: Not able to create a tav directory in . Check that the folder is one and that you "
                              "may write there.\n"));
    EXPECT_EQ(repo.read(".tav"), "mine");
}

struct LinkRow {
    char const* name;
    char const* folder;
};

/// A folder of the repository is a link to a folder of somebody else.
class LinkInItsPlace
    : public OddRepository
    , public testing::WithParamInterface<LinkRow> {};

TEST_P(LinkInItsPlace, IsFollowedByNoCommand)
{
    std::string const folder = GetParam().folder;
    support::TempFolder const elsewhere;
    bool const isThere = repo.has(folder);
    if (isThere) {
        std::filesystem::rename(repo.pathTo(folder), elsewhere.pathTo("kept"));
    }
    std::string const name = std::string(64, 'a');
    elsewhere.write("kept/" + name, "precious");
    elsewhere.write("kept/0", "precious");
    repo.makeLink(folder, elsewhere.pathTo("kept"));
    std::vector<std::string> const before = imageOf(elsewhere);
    for (Arguments const& command :
         {Arguments{"status"},
          {"add", "--all"},
          {"commit", "-m", "x"},
          {"checkout", "1", "--force"},
          {"restore", "a.dwg", "--force"},
          {"gc"},
          {"ignore", "--add", "^x$"}}) {
        EXPECT_EQ(
            tav(command), failed(
                              "tav: '" + repo.pathTo(folder) +
                              "' is a link, and may lead to another repository. Put the folder itself in its "
                              "place.\n"))
            << command.front();
    }
    EXPECT_EQ(
        tav({"init"}), failed(
                           "tav: './" + folder +
                           "' is a link, and may lead to another repository. Put the folder itself in its "
                           "place.\n"));
    EXPECT_EQ(imageOf(elsewhere), before);
    EXPECT_EQ(repo.read("a.dwg"), "two");
}

INSTANTIATE_TEST_SUITE_P(
    Folders, LinkInItsPlace,
    testing::Values(
        LinkRow{"Own", ".tav"}, LinkRow{"Objects", ".tav/objects"}, LinkRow{"Stores", ".tav/tf"},
        LinkRow{"Incoming", ".tav/objects/incoming"}, LinkRow{"Restoring", ".tav/restoring"},
        LinkRow{"Properties", ".tav/properties"}, LinkRow{"Conflicts", ".tav/conflict"}),
    support::rowName);

/// A file of the repository is a link to a file of somebody else.
class LinkInAFilesPlace
    : public OddRepository
    , public testing::WithParamInterface<char const*> {};

TEST_P(LinkInAFilesPlace, IsFollowedByNoCommand)
{
    std::string const file = std::string(".tav/") + GetParam();
    support::TempFolder const elsewhere;
    elsewhere.write("kept", "precious");
    if (repo.has(file)) {
        std::filesystem::rename(repo.pathTo(file), elsewhere.pathTo("kept"));
    }
    repo.makeLink(file, elsewhere.pathTo("kept"));
    std::vector<std::string> const before = imageOf(elsewhere);
    std::string const complaint =
        "' is a link, and may lead to another repository. Put the file itself in its place.\n";
    for (Arguments const& command :
         {Arguments{"status"}, {"add", "--all"}, {"commit", "-m", "x"}, {"checkout", "1", "--force"}, {"gc"}}) {
        EXPECT_EQ(tav(command), failed("tav: '" + repo.pathTo(file) + complaint)) << command.front();
    }
    EXPECT_EQ(tav({"init"}), failed("tav: './" + file + complaint));
    EXPECT_EQ(imageOf(elsewhere), before);
    EXPECT_EQ(repo.read("a.dwg"), "two");
}

INSTANTIATE_TEST_SUITE_P(
    Files, LinkInAFilesPlace,
    testing::Values("tav.state", "tav.db", "tav.db-journal", "tav.db-shm", "tav.db-wal", "properties/ignore"));

/// Takes the right to write away from everybody, in `folder` and below.
void makeReadOnly(std::string const& folder)
{
    namespace fs = std::filesystem;
    constexpr fs::perms kWrite = fs::perms::owner_write | fs::perms::group_write | fs::perms::others_write;
    for (auto const& entry : fs::recursive_directory_iterator(folder)) {
        fs::permissions(entry.path(), fs::perms::others_read | fs::perms::others_exec, fs::perm_options::add);
        fs::permissions(entry.path(), kWrite, fs::perm_options::remove);
    }
    fs::permissions(folder, fs::perms::others_read | fs::perms::others_exec, fs::perm_options::add);
    fs::permissions(folder, kWrite, fs::perm_options::remove);
}

/// What a test may change and remove again.
void makeWritable(std::string const& folder)
{
    namespace fs = std::filesystem;
    fs::permissions(folder, fs::perms::owner_all, fs::perm_options::add);
    for (auto const& entry : fs::recursive_directory_iterator(folder)) {
        fs::permissions(entry.path(), fs::perms::owner_all, fs::perm_options::add);
    }
}

struct Command {
    Arguments words;
    bool onlyReads;
};

std::vector<Command> const kCommands = {
    {{"status"}, true},
    {{"files"}, true},
    {{"log"}, true},
    {{"diff"}, true},
    {{"verify"}, true},
    {{"add", "--all"}, false},
    {{"unstage", "--all"}, false},
    {{"mv", "a.dwg", "b.dwg"}, false},
    {{"commit", "-m", "x"}, false},
    {{"checkout", "1", "--force"}, false},
    {{"restore", "a.dwg", "--force"}, false},
    {{"rm", "a.dwg"}, false},
    {{"gc"}, false},
    {{"ignore", "--add", "^x$"}, false},
    {{"branch", "b"}, false},
    {{"init"}, false}};

void expectItOnlyReads(Command const& command, std::string const& told)
{
    std::string const oneLine = "1\ntav: [^\n]*\\. [^\n]*\\.\n";
    std::string const noServer = "(tav: The history could not be compared with the server's\\. [^\n]*\n)?";
    EXPECT_THAT(told, MatchesRegex(command.onlyReads ? "0\n" + noServer : oneLine)) << command.words.front();
}

class ReadOnlyRepository : public OddRepository {
protected:
    ~ReadOnlyRepository() override { makeWritable(repo.path()); }
};

TEST_F(ReadOnlyRepository, IsReadAndNotChanged)
{
    makeReadOnly(repo.path());
    std::vector<std::string> const before = imageOf(repo);
    for (Command const& command : kCommands) {
        std::string const told = support::asOrdinaryUser([&] { return toldBy(tav(command.words)); });
        expectItOnlyReads(command, told);
    }
    EXPECT_EQ(imageOf(repo), before);
}

/// Mounts the folder once more over itself, read-only, in a space of mounts of its own. False where that is not
/// allowed.
bool mountReadOnly(std::string const& folder)
{
    return geteuid() == 0 && unshare(CLONE_NEWNS) == 0 &&
           mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0 &&
           mount(folder.c_str(), folder.c_str(), nullptr, MS_BIND, nullptr) == 0 &&
           mount(nullptr, folder.c_str(), nullptr, MS_BIND | MS_REMOUNT | MS_RDONLY, nullptr) == 0 &&
           chdir(folder.c_str()) == 0;
}

using ReadOnlyFileSystem = OddRepository;

TEST_F(ReadOnlyFileSystem, IsReadAndNotChanged)
{
    constexpr int kNotAllowed = 77;
    std::vector<std::string> const before = imageOf(repo);
    for (Command const& command : kCommands) {
        Process process(setting(), [&] { return mountReadOnly(repo.path()) ? runHere(command.words) : kNotAllowed; });
        Outcome const outcome = process.wait();
        if (outcome.code == kNotAllowed) {
            GTEST_SKIP() << "nothing can be mounted here";
        }
        expectItOnlyReads(command, toldBy(outcome));
    }
    EXPECT_EQ(imageOf(repo), before);
}

} // namespace
} // namespace host_tests
