#include "tests/host/history_test.h"
#include "tests/host/run_here.h"
#include "tests/host/tav_test.h"
#include "tests/support/rows.h"

#include "platform/os/os_calls.h"

#include <functional>
#include <unistd.h>
#include <utility>

namespace host_tests {
namespace {

using Status = TavTest;

TEST_F(Status, SaysThatNothingHasChanged)
{
    EXPECT_EQ(tav({"status"}), done("On branch master\n\nNothing has changed since the last commit.\n"));
    EXPECT_EQ(tav({"status", "--json"}), done(R"({
    "at_end" : true,
    "branch" : "master",
    "commit" : 0,
    "conflicts" : [
    ],
    "modified" : [
    ],
    "removed" : [
    ],
    "renamed" : [
    ],
    "staged" : [
    ],
    "unreachable" : [
    ],
    "unreadable" : [
    ],
    "untracked" : [
    ]
}
)"));
}

/// Gone through once, and in the copy of the process that runs a command.
std::function<void()> meanwhile;
os::Calls realCalls;

int openMeanwhile(int folder, char const* path, int flags, mode_t mode)
{
    if (std::string(path).find("/tav.state") != std::string::npos) {
        if (auto const act = std::exchange(meanwhile, nullptr)) {
            act();
        }
    }
    return realCalls.openat(folder, path, flags, mode);
}

using StatusOfHistory = HistoryTest;

TEST_F(StatusOfHistory, IsOfOneMomentWhenACommitIsMadeMeanwhile)
{
    repo.write("a.dwg", "one");
    commitAll("first");
    repo.write("a.dwg", "two");
    repo.write("b.dwg", "two");
    EXPECT_EQ(tav({"add", "--all"}).code, 0);
    Process process(setting(), [&] {
        meanwhile = [&] { tav({"commit", "-m", "second"}); };
        realCalls = os::calls();
        os::calls().openat = openMeanwhile;
        return runHere({"status"});
    });
    EXPECT_EQ(process.wait(), done("On branch master\n\nNothing has changed since the last commit.\n"));
}

/// A repository in which there is something of every group that can be without a commit.
class StatusOfEverything : public TavTest {
protected:
    StatusOfEverything()
    {
        repo.add({"b.dwg", "a/z.dwg", "c.dwg", "moved.dwg", "x.bak", "a/y.bak", ".hidden.bak"});
        repo.addConflictCopies({"roof.theirs.dwg", "roof.base.dwg", "plans/ground.theirs.dwg"});
        repo.write(".tav/tav.state", R"({
            "head" : { "reference" : "north wing" },
            "renames" : [ { "new" : "moved.dwg", "previous" : "former.dwg" } ],
            "staged_files" : [
                { "file_change" : "removed", "path" : "removed.dwg" },
                { "file_change" : "added", "path" : "moved.dwg" },
                { "file_change" : "modified", "path" : "gone.dwg" },
                { "file_change" : "modified", "path" : "c.dwg" },
                { "file_change" : "added", "path" : "b.dwg" }
            ]
        })");
    }
};

TEST_F(StatusOfEverything, IsShownInGroupsWithHints)
{
    EXPECT_EQ(tav({"status"}), done(R"(On branch north wing

Drawings in conflict:
  (the other versions are in '.tav/conflict')
        plans/ground.dwg
        roof.dwg

Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        new:      b.dwg
        modified: c.dwg
        gone:     gone.dwg
        new:      moved.dwg
        removed:  removed.dwg

New, not staged:
  (use 'tav add NAME' or 'tav add --all' to stage)
        a/z.dwg

)"));
}

TEST_F(StatusOfEverything, ShowsIgnoredFilesWhenAsked)
{
    std::string const output = tav({"status", "--ignored"}).out;
    EXPECT_EQ(output.substr(output.find("New, not staged:")), R"(New, not staged:
  (use 'tav add NAME' or 'tav add --all' to stage)
        a/z.dwg

Ignored:
  (see 'tav ignore' for the rules)
        a/y.bak
        x.bak

)");
}

TEST_F(StatusOfEverything, IsADocumentForPrograms)
{
    EXPECT_EQ(tav({"status", "--json", "--ignored"}), done(R"({
    "at_end" : true,
    "branch" : "north wing",
    "commit" : 0,
    "conflicts" : [
        {
            "base" : "",
            "path" : "plans/ground.dwg",
            "theirs" : "plans/ground.theirs.dwg"
        },
        {
            "base" : "roof.base.dwg",
            "path" : "roof.dwg",
            "theirs" : "roof.theirs.dwg"
        }
    ],
    "ignored" : [
        "a/y.bak",
        "x.bak"
    ],
    "modified" : [
    ],
    "removed" : [
    ],
    "renamed" : [
    ],
    "staged" : [
        {
            "change" : "added",
            "missing" : false,
            "path" : "b.dwg"
        },
        {
            "change" : "modified",
            "missing" : false,
            "path" : "c.dwg"
        },
        {
            "change" : "modified",
            "missing" : true,
            "path" : "gone.dwg"
        },
        {
            "change" : "added",
            "missing" : false,
            "path" : "moved.dwg"
        },
        {
            "change" : "removed",
            "missing" : false,
            "path" : "removed.dwg"
        }
    ],
    "unreachable" : [
    ],
    "unreadable" : [
    ],
    "untracked" : [
        "a/z.dwg"
    ]
}
)"));
}

TEST_F(StatusOfEverything, IsColouredOnATerminal)
{
    EXPECT_EQ(
        tavOnTerminal({"status", "--ignored"}), done("On branch north wing\n"
                                                     "\n"
                                                     "Drawings in conflict:\n"
                                                     "  (the other versions are in '.tav/conflict')\n"
                                                     "        \x1b[31mplans/ground.dwg\x1b[m\n"
                                                     "        \x1b[31mroof.dwg\x1b[m\n"
                                                     "\n"
                                                     "Staged for the next commit:\n"
                                                     "  (use 'tav unstage NAME' to take a file out)\n"
                                                     "        \x1b[32mnew:      b.dwg\x1b[m\n"
                                                     "        \x1b[32mmodified: c.dwg\x1b[m\n"
                                                     "        \x1b[31mgone:     gone.dwg\x1b[m\n"
                                                     "        \x1b[32mnew:      moved.dwg\x1b[m\n"
                                                     "        \x1b[32mremoved:  removed.dwg\x1b[m\n"
                                                     "\n"
                                                     "New, not staged:\n"
                                                     "  (use 'tav add NAME' or 'tav add --all' to stage)\n"
                                                     "        \x1b[31ma/z.dwg\x1b[m\n"
                                                     "\n"
                                                     "Ignored:\n"
                                                     "  (see 'tav ignore' for the rules)\n"
                                                     "        a/y.bak\n"
                                                     "        x.bak\n"
                                                     "\n"));
}

TEST_F(StatusOfEverything, HasNoColoursOnATerminalThatWantsNone)
{
    Outcome const plain = tav({"status", "--ignored"});
    EXPECT_EQ(tavOnTerminal({"status", "--ignored"}, {"NO_COLOR=1"}), plain);
    EXPECT_EQ(tavOnTerminal({"status", "--ignored"}, {"NO_COLOR="}).out.find("\x1b[31m") == std::string::npos, false);
}

TEST_F(StatusOfEverything, HasNoColoursInADocumentOnATerminal)
{
    EXPECT_EQ(tavOnTerminal({"status", "--json"}), tav({"status", "--json"}));
}

TEST_F(StatusOfEverything, IsTheSameInEveryFolder)
{
    EXPECT_EQ(tavIn(repo.pathTo("a"), {"status"}), tav({"status"}));
}

TEST_F(StatusOfEverything, ChangesNothing)
{
    std::vector<std::string> const before = repo.list();
    std::string const stateBefore = state();
    tav({"status", "--ignored"});
    EXPECT_EQ(repo.list(), before);
    EXPECT_EQ(state(), stateBefore);
}

TEST_F(Status, ShowsNamesInAscendingOrderWhateverTheirFolders)
{
    repo.add({"b.dwg", "a/c.dwg", "a.dwg", "a/b/d.dwg", "B.dwg", "ä.dwg"});
    EXPECT_EQ(tav({"status"}), done(R"(On branch master

New, not staged:
  (use 'tav add NAME' or 'tav add --all' to stage)
        B.dwg
        a.dwg
        a/b/d.dwg
        a/c.dwg
        b.dwg
        ä.dwg

)"));
}

TEST_F(Status, ShowsTheIgnoreFileLikeAnyOther)
{
    repo.ignore("");
    EXPECT_EQ(tav({"status"}), done(R"(On branch master

New, not staged:
  (use 'tav add NAME' or 'tav add --all' to stage)
        .tav/properties/ignore

)"));
}

TEST_F(Status, SaysThatNothingHasChangedBesideIgnoredFiles)
{
    repo.add({"x.bak"});
    EXPECT_EQ(tav({"status", "--ignored"}), done(R"(On branch master

Ignored:
  (see 'tav ignore' for the rules)
        x.bak

Nothing has changed since the last commit.
)"));
}

TEST_F(Status, ShowsWhatLiesInAnIgnoredFolder)
{
    repo.add({"old/a/b.dwg", "old/.hidden"});
    repo.write(".tav/properties/ignore", "^old$\n^ignore$");
    EXPECT_EQ(tav({"status", "--ignored"}), done(R"(On branch master

Ignored:
  (see 'tav ignore' for the rules)
        old/a/b.dwg

Nothing has changed since the last commit.
)"));
}

TEST_F(Status, ShowsAFileThatIsInNoCommitAsNewWhateverItWasCalled)
{
    repo.add({"plan.dwg"});
    tav({"mv", "plan.dwg", "ground.dwg"});
    repo.add({"plan.dwg"});
    EXPECT_EQ(tav({"status"}), done(R"(On branch master

Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        new:      ground.dwg

New, not staged:
  (use 'tav add NAME' or 'tav add --all' to stage)
        plan.dwg

)"));
}

TEST_F(Status, EscapesNames)
{
    repo.add({"esc\x1b[31m\n\xff.dwg"});
    repo.write(".tav/tav.state", R"({ "head" : { "reference" : "a\u001B]b" } })");
    EXPECT_EQ(
        tavOnTerminal({"status"}, {"NO_COLOR=1"}),
        done("On branch a\\x1B]b\n\nNew, not staged:\n  (use 'tav add NAME' or 'tav add --all' to stage)\n"
             "        esc\\x1B[31m\\x0A\\xFF.dwg\n\n"));
    EXPECT_EQ(
        tav({"status"}),
        done("On branch a\\x1B]b\n\nNew, not staged:\n  (use 'tav add NAME' or 'tav add --all' to stage)\n"
             "        esc\\x1B[31m\\x0A\xff.dwg\n\n"));
}

TEST_F(Status, ShowsAStagedPathOutsideOfTheFolderAsItStands)
{
    repo.write(".tav/tav.state", R"({ "head" : { "reference" : "master" },
        "staged_files" : [ { "file_change" : "added", "path" : "../nowhere/a.dwg" } ] })");
    EXPECT_EQ(tav({"status"}), done(R"(On branch master

Staged for the next commit:
  (use 'tav unstage NAME' to take a file out)
        gone:     ../nowhere/a.dwg

)"));
}

struct BrokenRow {
    char const* name;
    char const* state;
    char const* message;
};

class BrokenState
    : public TavTest
    , public testing::WithParamInterface<BrokenRow> {};

TEST_P(BrokenState, IsToldAndLeftAsItIs)
{
    repo.add({"a.dwg"});
    repo.write(".tav/tav.state", GetParam().state);
    std::string const message = std::string("tav: ") + GetParam().message +
                                " '.tav/tav.state' is damaged: move it away and run 'tav init'; only staging and the "
                                "current branch are lost.\n";
    EXPECT_EQ(tav({"init"}), failed(message));
    EXPECT_EQ(tav({"status"}), failed(message));
    EXPECT_EQ(tav({"add", "a.dwg"}), failed(message));
    EXPECT_EQ(tav({"unstage", "a.dwg"}), failed(message));
    EXPECT_EQ(tav({"mv", "a.dwg", "b.dwg"}), failed(message));
    EXPECT_EQ(tav({"rm", "a.dwg"}), failed(message));
    EXPECT_EQ(state(), GetParam().state);
    EXPECT_TRUE(repo.has("a.dwg"));
}

constexpr char const* kNoJson = "Unable to parse json, please check if syntax is valid.";

INSTANTIATE_TEST_SUITE_P(
    States, BrokenState,
    testing::Values(
        BrokenRow{"Empty", "", kNoJson}, BrokenRow{"CutOff", "{ \"head\" : { \"reference\"", kNoJson},
        BrokenRow{"NotText", "\xff\xfe\x01", kNoJson}, BrokenRow{"NoHead", "{}", "State does not contain HEAD."},
        BrokenRow{"NoBranch", "{ \"head\" : {} }", "HEAD does not point to a branch."}),
    support::rowName);

TEST_F(Status, FailsWithoutAState)
{
    support::TempRepository const bare;
    bare.add({"a.dwg"});
    std::string const message =
        "tav: No state file found at " + bare.pathTo(".tav/tav.state") + ". Run 'tav init' to make it.\n";
    EXPECT_EQ(tavIn(bare.path(), {"status"}), failed(message));
    EXPECT_EQ(tavIn(bare.path(), {"mv", "a.dwg", "b.dwg"}), failed(message));
    EXPECT_TRUE(bare.has("a.dwg"));
    EXPECT_FALSE(bare.has(".tav/tav.state"));
}

TEST_F(Status, FailsForAnIgnoreFileThatCannotBeUsed)
{
    repo.add({"a.dwg"});
    repo.ignore("^a$\n(\n");
    Outcome const broken = failed("tav: The ignore file has a rule that is not a valid regular expression. "
                                  "Correct '.tav/properties/ignore'.\n");
    EXPECT_EQ(tav({"status"}), broken);
    EXPECT_EQ(tav({"status", "--ignored"}), broken);
    EXPECT_EQ(tav({"add", "a.dwg"}), broken);
    EXPECT_EQ(tav({"mv", "a.dwg", "b.dwg"}), broken);
    EXPECT_EQ(tav({"rm", "a.dwg"}), broken);
    EXPECT_EQ(state(), kFreshState);
    EXPECT_TRUE(repo.has("a.dwg"));
}

TEST_F(Status, GoesOnWhenTheIgnoreRulesTakeLong)
{
    repo.add({"aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa.dwg"});
    repo.write(".tav/properties/ignore", "(a*)*b\n^ignore$");
    EXPECT_EQ(tav({"status"}), done(R"(On branch master

New, not staged:
  (use 'tav add NAME' or 'tav add --all' to stage)
        aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa.dwg

)"));
}

TEST_F(Status, FailsInAFolderThatIsGone)
{
    repo.makeFolder("a");
    Process process(setting(), [this] {
        if (chdir(repo.pathTo("a").c_str()) != 0 || rmdir(repo.pathTo("a").c_str()) != 0) {
            return 99;
        }
        execl(TAV_PROGRAM, TAV_PROGRAM, "status", nullptr);
        return 98;
    });
    EXPECT_EQ(
        process.wait(), failed("tav: The current folder no longer exists. Change to another folder and try again.\n"));
}

} // namespace
} // namespace host_tests
