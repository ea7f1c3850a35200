// Names of files that a command line, a terminal or another file system may take for something else.
#include "tests/host/history_test.h"
#include "tests/host/run_here.h"
#include "tests/support/rows.h"

#include "platform/os/os_calls.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <functional>
#include <map>
#include <unistd.h>
#include <utility>

namespace host_tests {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

class Names : public HistoryTest {
protected:
    using Contents = std::map<std::string, std::string>;

    void write(Contents const& contents) const
    {
        for (auto const& [name, content] : contents) {
            repo.write(name, content);
        }
    }

    /// What the folder `place` holds, without `.tav`; folders count by what is in them.
    static Contents contentsOf(support::TempFolder const& place, std::string const& folder = "")
    {
        Contents contents;
        for (std::string const& name : place.list()) {
            bool const isInside = name.compare(0, folder.size(), folder) == 0;
            if (isInside && name.back() != '/' && name.compare(0, 5, ".tav/") != 0) {
                contents[name.substr(folder.size())] = place.read(name);
            }
        }
        return contents;
    }
};

struct Form {
    char const* name;
    Arguments before; ///< the file
    std::string file;
    std::string other;
};

class NameWithADash
    : public HistoryTest
    , public testing::WithParamInterface<Form> {
protected:
    Outcome with(Arguments words, bool toOther = false) const
    {
        Form const& form = GetParam();
        words.insert(words.end(), form.before.begin(), form.before.end());
        words.push_back(form.file);
        if (toOther) {
            words.push_back(form.other);
        }
        return tav(words);
    }
};

TEST_P(NameWithADash, IsTakenByEveryCommand)
{
    repo.write("-rf.dwg", "one");
    EXPECT_EQ(with({"add"}), done("Staged 1 file.\n"));
    EXPECT_EQ(with({"unstage"}).code, 0);
    EXPECT_EQ(with({"add"}), done("Staged 1 file.\n"));
    EXPECT_EQ(tav({"commit", "-m", "-first"}).code, 0);
    repo.write("-rf.dwg", "changed");
    EXPECT_THAT(with({"diff"}).out, HasSubstr("modified: -rf.dwg"));
    EXPECT_EQ(with({"restore", "--force"}), done("1 file as in commit 1, 1 written.\n"));
    EXPECT_EQ(repo.read("-rf.dwg"), "one");
    EXPECT_EQ(with({"rm"}), done("Removed 1 file; the next commit takes that.\n"));
    EXPECT_FALSE(repo.has("-rf.dwg"));
    EXPECT_EQ(with({"restore"}), done("1 file as in commit 1, 1 written.\n"));
    EXPECT_EQ(with({"mv"}, true), done("Renamed '-rf.dwg' to '-v.dwg'.\n"));
    EXPECT_EQ(repo.read("-v.dwg"), "one");
}

INSTANTIATE_TEST_SUITE_P(
    Forms, NameWithADash,
    testing::Values(
        Form{"BehindTwoDashes", {"--"}, "-rf.dwg", "-v.dwg"}, Form{"WithItsFolder", {}, "./-rf.dwg", "./-v.dwg"}),
    support::rowName);

TEST_F(Names, ThatAreNoTextComeBackByteForByte)
{
    Contents const first = {
        {"\xff\xfe.dwg", "stray bytes"},
        {"caf\xe9/\x80", "another character set"},
        {"\xed\xa0\x80.txt", "half a character"},
        {"\xc0\xaf", "a slash of two bytes"},
        {"caf\xc3\xa9.dwg", "composed"},
        {"cafe\xcc\x81.dwg", "decomposed"},
        {"Plan.dwg", "one capital"},
        {"plan.dwg", "small"},
        {"PLAN.DWG", "capitals"},
        {std::string(255, 'x'), "longest"},
        {std::string(250, 'y') + "/" + std::string(251, 'z') + ".dwg", "long in long"},
        {"$(rm -rf x) `y` 'z' \"q\" %ls%n.dwg", "quotes"},
        {" *?~#;&|<>! ", "blanks around"},
        {"-", "a dash"},
        {"\xe2\x81\xa6.dwg\xe2\x81\xa9", "a direction"}};
    write(first);
    ASSERT_EQ(commitAll("first").code, 0);
    EXPECT_EQ(status(), kClean);
    Contents second;
    for (auto const& [name, content] : first) {
        second[name] = content + ", changed";
    }
    write(second);
    ASSERT_EQ(commitAll("second").code, 0);

    EXPECT_EQ(tav({"checkout", "1"}).code, 0);
    EXPECT_EQ(contentsOf(repo), first);
    EXPECT_EQ(tav({"restore", "--from", "2", "."}).code, 0);
    EXPECT_EQ(contentsOf(repo), second);
    support::TempFolder const target;
    EXPECT_EQ(tav({"export", "1", target.pathTo("out")}).code, 0);
    EXPECT_EQ(contentsOf(target, "out/"), first);
}

TEST_F(Names, ThatDifferInWhatOthersPassOverAreTakenApart)
{
    repo.write("caf\xc3\xa9.dwg", "composed");
    repo.write("cafe\xcc\x81.dwg", "decomposed");
    repo.write("Plan.dwg", "capital");
    repo.write("plan.dwg", "small");
    ASSERT_EQ(commitAll("all").code, 0);
    EXPECT_EQ(tav({"rm", "cafe\xcc\x81.dwg", "plan.dwg"}), done("Removed 2 files; the next commit takes that.\n"));
    EXPECT_EQ(contentsOf(repo), (Contents{{"caf\xc3\xa9.dwg", "composed"}, {"Plan.dwg", "capital"}}));
    EXPECT_EQ(tav({"restore", "plan.dwg"}), done("1 file as in commit 1, 1 written.\n"));
    EXPECT_EQ(repo.read("plan.dwg"), "small");
    EXPECT_EQ(repo.read("Plan.dwg"), "capital");
}

class NameWithControls : public Names {
protected:
    NameWithControls() { repo.write(kName, "content"); }

    static constexpr char const* kName = "a\n\x1b]0;b\a\r\x7f.dwg";
    static constexpr char const* kShown = "a\\x0A\\x1B]0;b\\x07\\x0D\\x7F.dwg";
};

TEST_F(NameWithControls, IsOneLineWithoutThemOnATerminalAndInAPipe)
{
    std::string const lines = "New, not staged:\n  (use 'tav add NAME' or 'tav add --all' to stage)\n"
                              "        .tav/properties/ignore\n        " +
                              std::string(kShown) + "\n\n";
    EXPECT_EQ(status(), lines);
    EXPECT_EQ(tavOnTerminal({"status"}, {"NO_COLOR=1"}).out, "On branch master\n\n" + lines);
    EXPECT_EQ(tav({"files"}), done(std::string(kShown) + "\n.tav/properties/ignore\n"));
    EXPECT_EQ(tavOnTerminal({"files"}), done(std::string(kShown) + "\n.tav/properties/ignore\n"));
}

TEST_F(NameWithControls, IsWholeInADocument)
{
    EXPECT_EQ(tav({"files", "--json"}), done(R"([
    {
        "path" : "a\n\u001B]0;b\u0007\r\u007F.dwg"
    },
    {
        "path" : ".tav/properties/ignore"
    }
]
)"));
}

TEST_F(NameWithControls, IsTakenByNoCommit)
{
    repo.write("b.dwg", "content");
    EXPECT_EQ(
        tav({"add", "--all"}),
        failed("tav: No commit can keep these names. Nothing has been staged; rename the files, or leave them out with "
               "'tav ignore':\n"
               "  The path 'a\\x0A\\x1B]0;b\\x07\\x0D\\x7F.dwg' holds a control character or a line end.\n"));
    EXPECT_EQ(tav({"add", "b.dwg", ".tav/properties/ignore"}).code, 0);
    EXPECT_EQ(tav({"commit", "-m", "the rest"}).code, 0);
    EXPECT_EQ(tav({"mv", kName, "c.dwg"}), done("Renamed '" + std::string(kShown) + "' to 'c.dwg'.\n"));
    EXPECT_EQ(tav({"commit", "-m", "renamed"}).code, 0);
    EXPECT_EQ(status(), kClean);
}

/// Two commits of one file, and a second name of it outside of the repository.
class HardLink : public Names {
protected:
    HardLink()
    {
        repo.write("a.dwg", "one");
        commitAll("first");
        repo.write("a.dwg", "two");
        commitAll("second");
    }

    void giveSecondName(std::string const& file) const
    {
        ASSERT_EQ(link(repo.pathTo(file).c_str(), elsewhere.pathTo("other").c_str()), 0);
    }

    support::TempFolder const elsewhere;
};

TEST_F(HardLink, IsReplacedByCheckout)
{
    giveSecondName("a.dwg");
    EXPECT_EQ(tav({"checkout", "1"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "one");
    EXPECT_EQ(elsewhere.read("other"), "two");
}

TEST_F(HardLink, IsReplacedByRestore)
{
    giveSecondName("a.dwg");
    EXPECT_EQ(tav({"restore", "a.dwg", "--from", "1"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "one");
    EXPECT_EQ(elsewhere.read("other"), "two");
}

TEST_F(HardLink, IsLeftByRemoval)
{
    giveSecondName("a.dwg");
    EXPECT_EQ(tav({"rm", "a.dwg"}).code, 0);
    EXPECT_EQ(elsewhere.read("other"), "two");
}

TEST_F(HardLink, IsReplacedWhereTheStateAndTheRulesStand)
{
    giveSecondName(".tav/tav.state");
    std::string const state = repo.read(".tav/tav.state");
    repo.write("a.dwg", "three");
    EXPECT_EQ(tav({"add", "a.dwg"}).code, 0);
    EXPECT_NE(repo.read(".tav/tav.state"), state);
    EXPECT_EQ(elsewhere.read("other"), state);

    ASSERT_EQ(unlink(elsewhere.pathTo("other").c_str()), 0);
    giveSecondName(".tav/properties/ignore");
    std::string const rules = repo.read(".tav/properties/ignore");
    EXPECT_EQ(tav({"ignore", "--add", "^x$"}).code, 0);
    EXPECT_EQ(elsewhere.read("other"), rules);
}

TEST_F(HardLink, OfTheDatabaseStopsAllCommands)
{
    giveSecondName(".tav/tav.db");
    std::string const before = elsewhere.read("other");
    repo.write("a.dwg", "changed");
    std::string const complaint = ".tav/tav.db' has another hard link, which would change too. Put a copy in its "
                                  "place.\n";
    for (Arguments const& command : {Arguments{"status"}, {"log"}, {"add", "--all"}, {"commit", "-m", "x"}, {"gc"}}) {
        EXPECT_EQ(tav(command), failed("tav: '" + repo.pathTo("") + complaint)) << command.front();
    }
    EXPECT_EQ(tav({"init"}), failed("tav: './" + complaint));
    EXPECT_EQ(elsewhere.read("other"), before);
}

TEST_F(HardLink, OfARevisionStoreStopsCommits)
{
    std::string const store =
        ".tav/tf/" + std::filesystem::directory_iterator(repo.pathTo(".tav/tf"))->path().filename().string();
    giveSecondName(store);
    std::string const before = elsewhere.read("other");
    repo.write("a.dwg", "changed");
    std::string const name = std::filesystem::path(store).stem();
    EXPECT_EQ(
        commitAll("second"),
        failed(
            "tav: The revision store '" + name +
            "' has another name, and what is written would show there too: put a copy in its place. Nothing has been "
            "committed; correct that and run the command again.\n"));
    EXPECT_EQ(elsewhere.read("other"), before);
    std::filesystem::remove(elsewhere.pathTo("other"));
    EXPECT_EQ(commitAll("second").code, 0);
}

TEST_F(HardLink, BesideTheDatabaseIsNotWrittenThrough)
{
    repo.write("a.dwg", "changed");
    for (std::string const end : {"-journal", "-shm", "-wal"}) {
        elsewhere.write("other", std::string("\0precious", 9));
        std::filesystem::create_hard_link(elsewhere.pathTo("other"), repo.pathTo(".tav/tav.db" + end));
        EXPECT_EQ(tav({"commit", "-m", "x"}).code, 1) << end;
        EXPECT_EQ(elsewhere.read("other"), std::string("\0precious", 9)) << end;
        std::filesystem::remove(repo.pathTo(".tav/tav.db" + end));
    }
}

TEST_F(Names, OfRevisionStoresThatAreLinksAreNotCleaned)
{
    repo.write("a.dwg", "one");
    commitAll("first");
    std::filesystem::path const store = std::filesystem::directory_iterator(repo.pathTo(".tav/tf"))->path();
    support::TempFolder const elsewhere;
    std::filesystem::rename(store, elsewhere.pathTo("store"));
    elsewhere.write("store", elsewhere.read("store") + "torn");
    std::filesystem::create_symlink(elsewhere.pathTo("store"), store);
    std::string const before = elsewhere.read("store");
    EXPECT_EQ(tav({"gc"}).code, 1);
    EXPECT_EQ(elsewhere.read("store"), before);
}

TEST_F(HardLink, IsNoLock)
{
    ASSERT_EQ(unlink(repo.pathTo(".tav/tav.lock").c_str()), 0);
    repo.write("mine", "precious content that is longer than the note of any command of tav would ever be");
    ASSERT_EQ(link(repo.pathTo("mine").c_str(), repo.pathTo(".tav/tav.lock").c_str()), 0);
    std::string const before = repo.read("mine");
    tav({"add", "--all"});
    EXPECT_EQ(repo.read("mine"), before);
}

TEST_F(Names, OfLinksThatNameThemselvesOrTheirFolderAreLeftOut)
{
    repo.makeFolder("sub");
    repo.makeLink("loop.dwg", "loop.dwg");
    repo.makeLink("there", "back");
    repo.makeLink("back", "there");
    repo.makeLink("sub/up", "..");
    repo.write("sub/a.dwg", "content");
    EXPECT_EQ(tav({"files"}), done("sub/a.dwg\n.tav/properties/ignore\n"));
    EXPECT_EQ(commitAll("all").code, 0);
    EXPECT_EQ(status(), kClean);
}

/// What happens in the middle of a command. The changes die with the copy of the process that runs it.
struct Meanwhile {
    static inline os::Calls real;
    static inline std::function<void()> act;

    static void once()
    {
        if (std::function<void()> const todo = std::exchange(act, nullptr)) {
            todo();
        }
    }

    static void whenFlushed(std::function<void()> const& what)
    {
        act = what;
        real = os::calls();
        os::calls().syncfs = [](int file) {
            once();
            return real.syncfs(file);
        };
    }

    static void whenMoved(std::function<void()> const& what)
    {
        act = what;
        real = os::calls();
        os::calls().renameat2 = [](int fromFolder, char const* from, int toFolder, char const* to, unsigned flags) {
            once();
            return real.renameat2(fromFolder, from, toFolder, to, flags);
        };
    }

    static void whenRenamed(std::function<void()> const& what)
    {
        act = what;
        real = os::calls();
        os::calls().renameat = [](int fromFolder, char const* from, int toFolder, char const* to) {
            once();
            return real.renameat(fromFolder, from, toFolder, to);
        };
    }
};

using When = void (*)(std::function<void()> const& what);

struct SwapRow {
    char const* name;
    Arguments command;
    When when;
};

/// The folder of a committed file gives way to a link, after it has been looked at.
class SwappedFolder
    : public HistoryTest
    , public testing::WithParamInterface<SwapRow> {
protected:
    SwappedFolder()
    {
        repo.write("sub/a.dwg", "one");
        repo.write("sub/b.dwg", "one");
        commitAll("first");
        repo.write("sub/a.dwg", "two");
        repo.write("sub/b.dwg", "two");
        commitAll("second");
        elsewhere.write("a.dwg", "two");
        elsewhere.write("b.dwg", "two");
    }

    support::TempFolder const elsewhere;
};

TEST_P(SwappedFolder, LeadsNobodyOutOfTheRepository)
{
    auto const swap = [&] {
        std::filesystem::rename(repo.pathTo("sub"), repo.pathTo("aside"));
        repo.makeLink("sub", elsewhere.path());
    };
    SwapRow const& row = GetParam();
    Process process(setting(), [&] {
        row.when(swap);
        return runHere(row.command);
    });
    process.wait();
    EXPECT_TRUE(repo.has("aside/a.dwg"));
    EXPECT_THAT(elsewhere.list(), ElementsAre("a.dwg", "b.dwg"));
    EXPECT_EQ(elsewhere.read("a.dwg") + elsewhere.read("b.dwg"), "twotwo");
}

INSTANTIATE_TEST_SUITE_P(
    Commands, SwappedFolder,
    testing::Values(
        SwapRow{"CheckoutWhenItFlushes", {"checkout", "1"}, Meanwhile::whenFlushed},
        SwapRow{"CheckoutWhenItRenames", {"checkout", "1"}, Meanwhile::whenRenamed},
        SwapRow{"CheckoutByForce", {"checkout", "1", "--force"}, Meanwhile::whenRenamed},
        SwapRow{"RestoreWhenItFlushes", {"restore", "sub", "--from", "1"}, Meanwhile::whenFlushed},
        SwapRow{"RestoreWhenItRenames", {"restore", "sub", "--from", "1"}, Meanwhile::whenRenamed}),
    support::rowName);

class MovedFromSwappedFolder
    : public HistoryTest
    , public testing::WithParamInterface<Arguments> {};

TEST_P(MovedFromSwappedFolder, TouchesNothingElsewhere)
{
    repo.write("sub/a.dwg", "one");
    commitAll("first");
    support::TempFolder const elsewhere;
    elsewhere.write("a.dwg", "precious");
    auto const swap = [&] {
        std::filesystem::rename(repo.pathTo("sub"), repo.pathTo("aside"));
        repo.makeLink("sub", elsewhere.path());
    };
    Process process(setting(), [&] {
        Meanwhile::whenMoved(swap);
        return runHere(GetParam());
    });
    process.wait();
    EXPECT_TRUE(repo.has("aside"));
    EXPECT_THAT(elsewhere.list(), ElementsAre("a.dwg"));
    EXPECT_EQ(elsewhere.read("a.dwg"), "precious");
}

INSTANTIATE_TEST_SUITE_P(
    Commands, MovedFromSwappedFolder,
    testing::Values(
        Arguments{"mv", "sub/a.dwg", "sub/b.dwg"}, Arguments{"mv", "sub/a.dwg", "b.dwg"},
        Arguments{"rm", "sub/a.dwg"}));

TEST_F(Names, AreExportedThroughNoLinkThatComesMeanwhile)
{
    repo.write("sub/a.dwg", "one");
    repo.write("sub/b.dwg", "one");
    commitAll("first");
    support::TempFolder const target;
    support::TempFolder const elsewhere;
    auto const swap = [&] {
        std::filesystem::rename(target.pathTo("sub"), target.pathTo("aside"));
        target.makeLink("sub", elsewhere.path());
    };
    Process process(setting(), [&] {
        Meanwhile::whenRenamed(swap);
        return runHere({"export", "1", target.path()});
    });
    process.wait();
    EXPECT_TRUE(target.has("aside"));
    EXPECT_THAT(elsewhere.list(), testing::IsEmpty());
}

} // namespace
} // namespace host_tests
