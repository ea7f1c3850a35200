// What commands leave behind when a call of the system fails, or the process dies in it.
#include "tests/host/run_here.h"
#include "tests/host/tav_test.h"
#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/rows.h"

#include <cerrno>
#include <csignal>
#include <sys/stat.h>
#include <unistd.h>

namespace host_tests {
namespace {

constexpr int kAllCallsWorked = 77;

struct CommandRow {
    char const* name;
    Arguments arguments;
    std::string fileAfter;
    std::string stateAfter;
};

/// Every row changes the file "a.dwg" or the state, or both.
class FailingDisk
    : public TavTest
    , public testing::WithParamInterface<CommandRow> {
protected:
    FailingDisk() { begin(); }

    void begin() const
    {
        repo.write("a.dwg", "drawing");
        unlink(repo.pathTo("b.dwg").c_str());
        repo.write(".tav/tav.state", stateBefore_);
    }

    /// Runs the command with its n-th call failing with `error`.
    Outcome fail(int n, int error) const
    {
        Process process(setting(), [&] {
            support::FailingCall const failing(n, error);
            int const code = runHere(GetParam().arguments);
            return failing.hasFailed() ? code : kAllCallsWorked;
        });
        return process.wait();
    }

    bool isOld() const { return hasFile("a.dwg") && state() == stateBefore_; }
    bool isNew() const { return hasFile(GetParam().fileAfter) && state() == GetParam().stateAfter; }

    /// Whether the drawing is there, whole, under this name and no other.
    bool hasFile(std::string const& name) const
    {
        return repo.has("a.dwg") != repo.has("b.dwg") && repo.has(name) && repo.read(name) == "drawing";
    }

    std::string const stateBefore_ = stateWithAdded({"z.dwg"});
};

TEST_P(FailingDisk, LeavesTheOldStateOrTheNewOneAndTellsWhich)
{
    for (int const error : {ENOSPC, EIO, EACCES}) {
        int n = 0;
        for (;; ++n) {
            begin();
            Outcome const outcome = fail(n, error);
            if (outcome.code == kAllCallsWorked) {
                break;
            }
            EXPECT_TRUE(outcome.code == 0 ? isNew() : isOld())
                << "call " << n << " fails with error " << error << ": " << testing::PrintToString(outcome) << state();
            EXPECT_EQ(outcome.code == 0, outcome.err.empty()) << outcome.err;
        }
        EXPECT_GT(n, 5);
    }
}

TEST_P(FailingDisk, LeavesAWholeStateAndAWholeDrawingWhenTheProcessDies)
{
    int n = 0;
    for (;; ++n) {
        begin();
        Outcome const outcome = fail(n, support::FailingCall::kKillProcess);
        if (outcome.code == kAllCallsWorked) {
            break;
        }
        EXPECT_EQ(outcome.code, -SIGKILL);
        EXPECT_TRUE(state() == stateBefore_ || state() == GetParam().stateAfter)
            << "dead in call " << n << ": " << state();
        EXPECT_TRUE(hasFile("a.dwg") || hasFile("b.dwg")) << "dead in call " << n;
        Process next(setting(), [] { return runHere({"unstage", "--all"}); });
        EXPECT_EQ(next.wait().code, 0) << "after death in call " << n;
    }
    EXPECT_GT(n, 5);
}

std::string const kRenamed = R"({
    "head" : {
        "reference" : "master"
    },
    "renames" : [
        {
            "new" : "b.dwg",
            "previous" : "a.dwg"
        }
    ],
    "staged_files" : [
        {
            "file_change" : "added",
            "path" : "z.dwg"
        },
        {
            "file_change" : "added",
            "path" : "b.dwg"
        }
    ]
})";

INSTANTIATE_TEST_SUITE_P(
    Commands, FailingDisk,
    testing::Values(
        CommandRow{"Add", {"add", "a.dwg"}, "a.dwg", stateWithAdded({"z.dwg", "a.dwg"})},
        CommandRow{"Unstage", {"unstage", "z.dwg"}, "a.dwg", kFreshState},
        CommandRow{"Mv", {"mv", "a.dwg", "b.dwg"}, "b.dwg", kRenamed}),
    support::rowName);

/// A repository of somebody else.
class WithoutRights : public TavTest {
protected:
    WithoutRights()
    {
        repo.write("a.dwg", "drawing");
        repo.ignore("^old$\n");
        for (std::string const& name : repo.list()) {
            chmod(repo.pathTo(name).c_str(), name.back() == '/' ? 0555 : 0444);
        }
        chmod(repo.path().c_str(), 0555);
    }

    ~WithoutRights() override { chmod(repo.path().c_str(), 0755); }

    std::string asOrdinaryUser(Arguments const& arguments) const
    {
        return support::asOrdinaryUser([&] {
            Process process(setting(), [&] { return runHere(arguments); });
            return testing::PrintToString(process.wait());
        });
    }

    static std::string text(Outcome const& outcome) { return testing::PrintToString(outcome); }
};

TEST_F(WithoutRights, ReadsAsUsual)
{
    EXPECT_EQ(asOrdinaryUser({"files"}), text(done("a.dwg\n.tav/properties/ignore\n")));
    EXPECT_EQ(asOrdinaryUser({"ignore"}), text(done("^old$\n")));
    EXPECT_EQ(asOrdinaryUser({"status"}), text(done(R"(On branch master

New, not staged:
  (use 'tav add NAME' or 'tav add --all' to stage)
        .tav/properties/ignore
        a.dwg

)")));
}

TEST_F(WithoutRights, CannotChangeAnything)
{
    std::string const refused = text(failed(
        "tav: The repository cannot be locked: Permission denied. Check your permissions for '" + repo.pathTo(".tav") +
        "'.\n"));
    for (Arguments const& arguments :
         {Arguments{"init", repo.path()},
          {"add", "a.dwg"},
          {"unstage", "--all"},
          {"mv", "a.dwg", "b.dwg"},
          {"rm", "a.dwg"},
          {"ignore", "--add", "x"}}) {
        EXPECT_EQ(asOrdinaryUser(arguments), refused) << arguments.front();
    }
}

TEST_F(WithoutRights, MovesTheFileBackWhenTheStateCannotBeWritten)
{
    chmod(repo.path().c_str(), 0777);
    chmod(repo.pathTo(".tav").c_str(), 0755);
    repo.write(".tav/tav.lock", "");
    chmod(repo.pathTo(".tav/tav.lock").c_str(), 0666);
    chmod(repo.pathTo(".tav").c_str(), 0555);
    EXPECT_EQ(
        asOrdinaryUser({"mv", "a.dwg", "b.dwg"}),
        text(failed(
            "tav: Error writing to file '" + repo.pathTo(".tav/tav.state") +
            "'. The old state is unchanged; check the free space and your rights, and try again.\n")));
    EXPECT_EQ(repo.read("a.dwg"), "drawing");
    EXPECT_FALSE(repo.has("b.dwg"));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(WithoutRights, CannotMoveAFileInAFolderOfSomebodyElse)
{
    for (char const* const name : {".tav", ".tav/tav.state"}) {
        chmod(repo.pathTo(name).c_str(), 0777);
    }
    EXPECT_EQ(
        asOrdinaryUser({"mv", "a.dwg", "b.dwg"}),
        text(failed(
            "tav: '" + repo.pathTo("a.dwg") + "' cannot be moved to '" + repo.pathTo("b.dwg") +
            "': Permission denied. Check that the folder exists and that you may write there.\n")));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(WithoutRights, ReportsEveryFileThatCannotBeDigested)
{
    chmod(repo.path().c_str(), 0755);
    repo.write("b\xff\n.dwg", "abc");
    repo.write("c.dwg", "abc");
    chmod(repo.pathTo("a.dwg").c_str(), 0);
    chmod(repo.pathTo("b\xff\n.dwg").c_str(), 0);
    chmod(repo.pathTo(".tav/properties/ignore").c_str(), 0444);
    std::string const errors = "tav: 'a.dwg' cannot be read. Check your permissions for it.\n"
                               "tav: 'b\\xFF .dwg' cannot be read. Check your permissions for it.\n"
                               "tav: 2 of 4 files could not be read. Correct that and run the command again.\n";
    std::string const answer = asOrdinaryUser({"files", "--hash"});
    EXPECT_EQ(answer.substr(answer.find("--- err ---\n")), "--- err ---\n" + errors + "---");
    EXPECT_NE(
        answer.find("--- out ---\nba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad  c.dwg\n"),
        std::string::npos);
    EXPECT_EQ(answer.substr(0, 7), "code 1\n");
}

TEST_F(WithoutRights, LeavesTheDigestOutOfADocumentWhereAFileCannotBeRead)
{
    chmod(repo.pathTo("a.dwg").c_str(), 0);
    chmod(repo.pathTo(".tav/properties").c_str(), 0111);
    chmod(repo.pathTo(".tav/properties/ignore").c_str(), 0444);
    EXPECT_EQ(
        asOrdinaryUser({"files", "--hash", "--json"}),
        text(
            {1, R"([
    {
        "path" : "a.dwg",
        "sha256" : null
    }
]
)",
             "tav: 'a.dwg' cannot be read. Check your permissions for it.\n"
             "tav: 1 of 1 files could not be read. Correct that and run the "
             "command again.\n"}));
}

TEST_F(WithoutRights, CannotMakeARepository)
{
    support::TempFolder const place;
    chmod(place.path().c_str(), 0555);
    Setting there = setting();
    there.folder = place.path();
    std::string const answer = support::asOrdinaryUser([&] {
        Process process(there, [] { return runHere({"init", "north/wing"}); });
        return testing::PrintToString(process.wait());
    });
    EXPECT_EQ(
        answer,
        text(failed(
            "tav: Not able to create the version control folder: north/wing. Check that the folder is one and that "
            "you may write there.\n")));
    EXPECT_TRUE(place.list().empty());
}

} // namespace
} // namespace host_tests
