// A history that somebody else has written into the database of a repository.
#include "host/database/sqlite.h"
#include "host/errors/failure.h"
#include "host/history/tracked_path.h"
#include "host/text/utf8.h"

#include "tests/host/history_test.h"
#include "tests/support/rows.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <unistd.h>

namespace host_tests {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

/// Two commits of "a.dwg" and "b.dwg"; "a.dwg" was "one" and is "two".
class ForeignHistory : public HistoryTest {
protected:
    ForeignHistory()
    {
        repo.write("a.dwg", "one");
        repo.write("b.dwg", "same");
        commitAll("first");
        repo.write("a.dwg", "two");
        commitAll("second");
        elsewhere.write("victim.dwg", "two");
    }

    void change(std::string const& statement) const
    {
        try {
            tav::Database database(repo.pathTo(".tav/tav.db"));
            database.run(("PRAGMA foreign_keys = OFF; " + statement).c_str());
        } catch (tav::Failure const& failure) {
            FAIL() << failure.what;
        }
    }

    /// Gives the file "a.dwg" another path in the database, in all commits.
    void callIt(OdString const& path) const
    {
        tav::Database database(repo.pathTo(".tav/tav.db"));
        database.prepare("UPDATE changes SET path = ? WHERE path = 'a.dwg'").with(path).run();
    }

    void expectNothingElsewhere() const
    {
        EXPECT_THAT(elsewhere.list(), ElementsAre("victim.dwg"));
        EXPECT_EQ(elsewhere.read("victim.dwg"), "two");
    }

    std::string wayOut() const
    {
        return "../" + std::filesystem::path(elsewhere.path()).filename().string() + "/victim.dwg";
    }

    support::TempFolder const elsewhere;
};

struct PathRow {
    char const* name;
    OdString path;
};

class ForeignPath
    : public ForeignHistory
    , public testing::WithParamInterface<PathRow> {
protected:
    Outcome refused(std::string const& next) const
    {
        return failed("tav: " + tav::whyUnsafe(GetParam().path).value_or("nothing is wrong") + " " + next + "\n");
    }
};

TEST_P(ForeignPath, IsWrittenByNoCommand)
{
    callIt(GetParam().path);
    std::string const state = repo.read(".tav/tav.state");
    for (Arguments const& command :
         {Arguments{"checkout", "1"},
          {"checkout", "1", "--force"},
          {"restore", ".", "--from", "1"},
          {"restore", ".", "--from", "1", "--force"},
          {"export", "1", elsewhere.pathTo("out")}}) {
        EXPECT_EQ(tav(command), refused("Nothing has been written.")) << command.front();
    }
    EXPECT_EQ(repo.read("a.dwg"), "two");
    EXPECT_EQ(repo.read(".tav/tav.state"), state);
    expectNothingElsewhere();
}

TEST_P(ForeignPath, StopsNoCommandThatOnlyReads)
{
    callIt(GetParam().path);
    for (Arguments const& command : {Arguments{"status"}, {"diff"}, {"log"}, {"show", "1"}, {"verify"}}) {
        EXPECT_EQ(tav(command).code, 0) << command.front();
    }
    expectNothingElsewhere();
}

INSTANTIATE_TEST_SUITE_P(
    Paths, ForeignPath,
    testing::Values(
        PathRow{"Empty", L""}, PathRow{"Up", L"../victim.dwg"}, PathRow{"UpInside", L"sub/../../victim.dwg"},
        PathRow{"Absolute", L"/tmp/victim.dwg"}, PathRow{"Drive", L"C:victim.dwg"},
        PathRow{"Backslash", L"..\\victim.dwg"}, PathRow{"EmptyPart", L"sub//victim.dwg"},
        PathRow{"State", L".tav/tav.state"}, PathRow{"StateInCapitals", L".TAV/tav.state"},
        PathRow{"StateBehindAJoiner", L".t\u200Dav/tav.state"}, PathRow{"StateInWideLetters", L".\uFF54av/tav.state"},
        PathRow{"ShortName", L"TAV~1/tav.state"}, PathRow{"Stream", L".tav::$INDEX_ALLOCATION/tav.state"},
        PathRow{"OutOfProperties", L".tav/properties/../tav.state"}, PathRow{"LineFeed", L"victim\n.dwg"},
        PathRow{"Escape", L"\x1B[2Jvictim.dwg"}),
    support::rowName);

TEST_F(ForeignHistory, RemovesNothingOutsideOfTheRepository)
{
    callIt(tav::fromUtf8(wayOut()));
    std::string const why = *tav::whyUnsafe(tav::fromUtf8(wayOut()));
    EXPECT_EQ(tav({"rm", "victim.dwg"}), failed("tav: " + why + " Nothing has been removed.\n"));
    EXPECT_EQ(tav({"rm", "."}), failed("tav: " + why + " Nothing has been removed.\n"));
    EXPECT_TRUE(repo.has("b.dwg"));
    expectNothingElsewhere();
}

TEST_F(ForeignHistory, RemovesNothingBehindALink)
{
    callIt(L"link/victim.dwg");
    repo.makeLink("link", elsewhere.path());
    EXPECT_EQ(tav({"rm", "link/victim.dwg"}), done("Removed 1 file; the next commit takes that.\n"));
    expectNothingElsewhere();
}

TEST_F(ForeignHistory, WritesNothingBehindALink)
{
    callIt(L"link/victim.dwg");
    repo.makeLink("link", elsewhere.path());
    for (Arguments const& command :
         {Arguments{"checkout", "1"}, {"checkout", "1", "--force"}, {"restore", "link", "--from", "1", "--force"}}) {
        EXPECT_EQ(
            tav(command), failed("tav: 'link' is a symbolic link, which may lead out of the working folder. Nothing "
                                 "has been written; move that away first.\n"));
    }
    expectNothingElsewhere();
}

TEST_F(ForeignHistory, LeavesNoCommitBehindThatCannotBeCompleted)
{
    callIt(tav::fromUtf8(wayOut()));
    repo.write("b.dwg", "changed");
    EXPECT_EQ(tav({"add", "b.dwg"}).code, 0);
    EXPECT_EQ(tav({"commit", "-m", "third"}).code, 1);
    EXPECT_THAT(tav({"status"}).err, Not(HasSubstr("interrupted")));
    EXPECT_EQ(tav({"unstage", "--all"}).code, 0);
    expectNothingElsewhere();
}

TEST_F(ForeignHistory, OfCommitsThatAreTheirOwnAncestorsEnds)
{
    change("UPDATE parents SET parent = 2 WHERE number = 2; INSERT INTO parents VALUES (1, 1, 0, 2);");
    for (Arguments const& command : {Arguments{"status"}, {"log"}, {"show", "2"}, {"diff"}, {"verify"}}) {
        EXPECT_EQ(tav(command).code, 0) << command.front();
    }
    tav({"checkout", "1"});
    tav({"gc"});
}

constexpr char const* kElsewhere = "Read 3 stored versions; nothing is damaged.\n"
                                   "Not here: 1 version of commits that were made in other folders.\n";

struct UrlRow {
    char const* name;
    std::string url;
    bool mayBeElsewhere = false; ///< a content that is in the storage of another folder, as far as can be known
};

class ForeignUrl
    : public ForeignHistory
    , public testing::WithParamInterface<UrlRow> {};

TEST_P(ForeignUrl, LeadsToNoFileOutsideOfTheStorage)
{
    change("UPDATE changes SET url = '" + GetParam().url + "' WHERE path = 'a.dwg' AND number = 1");
    repo.write("a.dwg", "two");
    for (Arguments const& command :
         {Arguments{"checkout", "1", "--force"}, {"restore", "a.dwg", "--from", "1", "--force"}, {"verify"}}) {
        bool const isMissed = command.front() != "verify" || !GetParam().mayBeElsewhere;
        Outcome const outcome = tav(command);
        EXPECT_EQ(outcome.code, isMissed ? 1 : 0) << command.front();
        EXPECT_EQ(outcome.out, isMissed ? "" : kElsewhere);
        std::string const told = GetParam().mayBeElsewhere ? "its content is not here" : GetParam().url;
        EXPECT_THAT(outcome.err, HasSubstr(isMissed ? told : "")) << command.front();
    }
    EXPECT_EQ(repo.read("a.dwg"), "two");
    expectNothingElsewhere();
}

INSTANTIATE_TEST_SUITE_P(
    Urls, ForeignUrl,
    testing::Values(
        UrlRow{"Nonsense", "nonsense"}, UrlRow{"OfAnObjectUp", "po:../../a.dwg"},
        UrlRow{"OfAStoreUp", "tf:../../a#" + std::string(64, 'a')},
        UrlRow{"OfAStoreInAFolder", "tf:a/b#" + std::string(64, 'a')},
        UrlRow{"OfAnObjectThatIsNotThere", "po:" + std::string(64, 'a'), true},
        UrlRow{"OfAStoreThatIsNotThere", "tf:a#" + std::string(64, 'a'), true}),
    support::rowName);

/// Files in the place of what the tables hold.
TEST_F(ForeignHistory, InAnotherShapeIsToldAndChangesNothing)
{
    change("ALTER TABLE changes RENAME TO other;");
    std::string const broken = "tav: The database '" + repo.pathTo(".tav/tav.db") +
                               "' cannot be used: SQL logic error. Check the free space and your rights in the folder "
                               "of '" +
                               repo.pathTo(".tav/tav.db") + "'.\n";
    for (Arguments const& command : {Arguments{"status"}, {"checkout", "1"}, {"restore", "a.dwg"}, {"rm", "a.dwg"}}) {
        EXPECT_EQ(tav(command), failed(broken)) << command.front();
    }
    EXPECT_EQ(repo.read("a.dwg"), "two");
}

} // namespace
} // namespace host_tests
