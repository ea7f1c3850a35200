// Servers that were moved, lost or put back, and a database that was lost: what is whole somewhere comes back.
#include "host/database/sqlite.h"

#include "tests/host/earlier_database.h"
#include "tests/host/history_test.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <sys/stat.h>

namespace host_tests {
namespace {

namespace fs = std::filesystem;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

constexpr char const* kNothingToGc = "Removed 0 stored versions that no commit needs; 0 bytes freed.\n";

/// Two commits, a tag and a branch of the repository "repository", with the server in "server".
class ServerPlace : public testing::Test {
protected:
    ServerPlace()
    {
        place.makeFolder("repository");
        EXPECT_EQ(tav({"init", "--server", server()}).code, 0);
        commitFile("plan.dwg", "one", "first");
        EXPECT_EQ(tav({"tag", "as built"}).code, 0);
        EXPECT_EQ(tav({"mv", "plan.dwg", "roof.dwg"}).code, 0);
        commitFile("note.txt", "text", "second");
        EXPECT_EQ(tav({"branch", "side", "1"}).code, 0);
    }

    Outcome tav(Arguments const& arguments) const
    {
        Setting setting;
        setting.folder = place.pathTo("repository");
        return run(setting, arguments);
    }

    void commitFile(std::string const& name, std::string const& content, std::string const& message) const
    {
        place.write("repository/" + name, content);
        EXPECT_EQ(tav({"add", "--all"}).code, 0);
        EXPECT_EQ(tav({"commit", "-m", message, "--author", "ann@studio"}).code, 0);
    }

    void move(std::string const& from, std::string const& to) const
    {
        ASSERT_EQ(rename(place.pathTo(from).c_str(), place.pathTo(to).c_str()), 0);
    }

    /// Everything that is known of the history.
    std::string history() const
    {
        return tav({"log", "--json"}).out + tav({"branch"}).out + tav({"tag"}).out + tav({"show", "2"}).out;
    }

    std::string hashes() const
    {
        tav::Database const database(place.pathTo("repository/.tav/tav.db"));
        tav::Statement rows = database.prepare("SELECT number || ' ' || message FROM commits ORDER BY number");
        std::string text;
        while (rows.next()) {
            text += rows.text(0).ansi_str() + "\n";
        }
        return text;
    }

    std::string server() const { return place.pathTo("server"); }

    support::TempFolder const place;
};

TEST_F(ServerPlace, IsShown)
{
    EXPECT_THAT(tav({"server"}).out, StartsWith("The history is kept in '" + server() + "', as the repository "));
    EXPECT_THAT(tav({"server"}).out, HasSubstr("\nIt has exactly the commits known here.\n"));
}

TEST_F(ServerPlace, FollowsAMovedServer)
{
    move("server", "moved");
    EXPECT_EQ(
        tav({"fetch"}), failed(
                            "tav: The server folder '" + server() +
                            "' is missing. Connect its drive or move the folder back. If it has a new place, run 'tav "
                            "server FOLDER'.\n"));
    EXPECT_EQ(tav({"server", "../moved"}), done("The history is kept in '" + place.pathTo("moved") + "' now.\n"));
    commitFile("note.txt", "more", "third");
    EXPECT_EQ(tav({"gc"}), done(kNothingToGc));
    EXPECT_FALSE(place.has("server"));
}

TEST_F(ServerPlace, IsNoServerWithAnotherHistory)
{
    place.makeFolder("other");
    Setting setting;
    setting.folder = place.pathTo("other");
    ASSERT_EQ(run(setting, {"init", "--server", place.pathTo("strange")}).code, 0);
    Outcome const outcome = tav({"server", place.pathTo("strange")});
    EXPECT_THAT(outcome.err, StartsWith("tav: The server has no repository "));
    EXPECT_THAT(
        outcome.err, HasSubstr(
                         "The folder of the server is '" + place.pathTo("strange") +
                         "'. Run 'tav server FOLDER' with the one that has it, or add --send to make it "
                         "there.\n"));
    EXPECT_THAT(tav({"server", place.pathTo("nowhere")}).err, StartsWith("tav: The server folder '"));
    EXPECT_THAT(tav({"server", "https://tav.example.org"}).err, HasSubstr(" is a URL"));
    EXPECT_THAT(tav({"server", "."}).err, HasSubstr("is inside the working folder"));
    EXPECT_THAT(tav({"server"}).out, StartsWith("The history is kept in '" + server() + "'"));
}

class OlderServer : public ServerPlace {
protected:
    /// A server as it was after the second of four commits.
    OlderServer()
    {
        std::string const old = place.read("server/server.db");
        commitFile("note.txt", "three", "third");
        commitFile("note.txt", "four", "fourth");
        EXPECT_EQ(tav({"tag", "late"}).code, 0);
        place.write("server/server.db", old);
    }

    std::string lacks() const { return "The server in '" + server() + "' lacks commits that are known here. "; }
};

constexpr char const* kSendThem =
    "An older copy of it may have been put back: run 'tav server --send' to send them again.\n";

TEST_F(OlderServer, IsNoticedBeforeAnythingHappens)
{
    place.write("repository/note.txt", "five");
    ASSERT_EQ(tav({"add", "--all"}).code, 0);
    EXPECT_EQ(tav({"commit", "-m", "fifth"}), failed("tav: " + lacks() + kSendThem));
    EXPECT_EQ(tav({"fetch"}), failed("tav: " + lacks() + kSendThem));
    EXPECT_EQ(
        tav({"gc"}),
        (Outcome{
            0, kNothingToGc,
            "tav: Only leftovers are removed: the server does not say what its commits need. " + lacks() + kSendThem}));
    EXPECT_THAT(tav({"verify"}).err, StartsWith("tav: The server lacks 2 commits that are known here. An older copy"));
    EXPECT_THAT(tav({"server"}).out, HasSubstr("\nIt lacks 2 commits that are known here. 'tav server --send' sends"));
    EXPECT_THAT(tav({"status"}).out, HasSubstr("modified: note.txt"));
}

TEST_F(OlderServer, GetsWhatItLacks)
{
    std::string const before = history();
    EXPECT_EQ(tav({"server", "--send"}), done("Sent 2 commits.\nThe history is kept in '" + server() + "' now.\n"));
    EXPECT_EQ(history(), before);
    EXPECT_EQ(tav({"fetch"}), done("Nothing is new on the server.\n"));
    EXPECT_EQ(tav({"verify"}).code, 0);
    commitFile("note.txt", "five", "fifth");
    EXPECT_EQ(tav({"tag"}), done("  as built  (commit 1)\n  late  (commit 4)\n"));
}

TEST_F(OlderServer, GetsItUnderNewNumbersWhereOthersHaveCommitted)
{
    ASSERT_EQ(tav({"server"}).code, 0);
    fs::copy(place.pathTo("repository"), place.pathTo("copy"), fs::copy_options::recursive);
    tav::Database(place.pathTo("copy/.tav/tav.db"))
        .run("PRAGMA foreign_keys = OFF; DELETE FROM refs WHERE number > 2; DELETE FROM changes WHERE number > 2;"
             "DELETE FROM parents WHERE number > 2; DELETE FROM commits WHERE number > 2;"
             "UPDATE settings SET value = (SELECT hash FROM commits WHERE number = 1) WHERE key = 'base'");
    Setting setting;
    setting.folder = place.pathTo("copy");
    ASSERT_EQ(run(setting, {"fetch"}).code, 0);
    ASSERT_EQ(run(setting, {"switch", "side", "--force"}).code, 0);
    place.write("copy/side.txt", "text");
    ASSERT_EQ(run(setting, {"add", "side.txt"}).code, 0);
    ASSERT_EQ(run(setting, {"commit", "-m", "aside"}).code, 0);
    EXPECT_EQ(tav({"fetch"}), failed("tav: " + lacks() + kSendThem));
    EXPECT_EQ(tav({"server", "--send"}).code, 0);
    EXPECT_EQ(hashes(), "1 first\n2 second\n3 aside\n4 third\n5 fourth\n");
    EXPECT_EQ(tav({"branch"}), done("* master  (commit 5)\n  side  (commit 3)\n"));
    EXPECT_EQ(tav({"tag"}), done("  as built  (commit 1)\n  late  (commit 5)\n"));
    EXPECT_THAT(tav({"status"}).out, HasSubstr("Nothing has changed since the last commit."));
    EXPECT_EQ(tav({"checkout", "4"}).code, 0);
    EXPECT_EQ(place.read("repository/note.txt"), "three");
    EXPECT_EQ(run(setting, {"fetch"}).code, 0);
}

TEST_F(ServerPlace, KeepsItsIdentifierOnAnotherServer)
{
    std::string const shown = tav({"server"}).out;
    std::string const id = shown.substr(shown.find(" as the repository "), 52);
    EXPECT_EQ(tav({"server", place.pathTo("wrong"), "--send"}).code, 0);
    EXPECT_THAT(tav({"server"}).out, HasSubstr(id));
    EXPECT_EQ(
        tav({"server", server(), "--send"}), done("Sent 0 commits.\nThe history is kept in '" + server() + "' now.\n"));
    EXPECT_THAT(tav({"server"}).out, HasSubstr(id));
}

TEST_F(ServerPlace, IsFoundAgainUnderAnotherIdentifier)
{
    std::string const first = place.read("repository/.tav/identity");
    tav::Database(place.pathTo("server/server.db"))
        .run("UPDATE repositories SET id = '5f0c1d2e3b4a59687766554433221100'");
    EXPECT_EQ(tav({"server", "--send"}).out.substr(0, 16), "Sent 0 commits.\n");
    EXPECT_THAT(tav({"server"}).out, HasSubstr("5f0c1d2e3b4a59687766554433221100"));
    EXPECT_EQ(place.read("repository/.tav/identity"), first + "5f0c1d2e3b4a59687766554433221100\n");
    EXPECT_EQ(tav({"fetch"}).code, 0);
}

TEST_F(ServerPlace, SaysWhichCommitsNoNameLeadsToWhenOthersHaveMovedTheBranch)
{
    fs::copy(server(), place.pathTo("copy"), fs::copy_options::recursive);
    fs::copy(place.pathTo("repository"), place.pathTo("theirs"), fs::copy_options::recursive);
    commitFile("note.txt", "ours", "third");
    Setting theirs;
    theirs.folder = place.pathTo("theirs");
    ASSERT_EQ(run(theirs, {"server", place.pathTo("copy")}).code, 0);
    place.write("theirs/note.txt", "theirs");
    ASSERT_EQ(run(theirs, {"add", "note.txt"}).code, 0);
    ASSERT_EQ(run(theirs, {"commit", "-m", "theirs"}).code, 0);
    EXPECT_EQ(
        tav({"server", place.pathTo("copy"), "--send"}).err,
        "tav: The server's 'master' does not follow yours. Yours ends at commit 4; run 'tav branch NAME 4' to keep "
        "it.\n");
    EXPECT_EQ(hashes(), "1 first\n2 second\n3 theirs\n4 third\n");
    EXPECT_EQ(tav({"branch", "mine", "4"}).code, 0);
}

TEST_F(ServerPlace, IsNotTakenForMovedOnWhenItFails)
{
    tav::Database(place.pathTo("server/server.db"))
        .run("CREATE TRIGGER full BEFORE INSERT ON commits BEGIN SELECT RAISE(ABORT, 'the disk is full'); END");
    place.write("repository/note.txt", "three");
    EXPECT_EQ(tav({"add", "--all"}).code, 0);
    EXPECT_THAT(tav({"commit", "-m", "third"}).err, testing::Not(HasSubstr("branch of your own")));
}

class NoRepository : public ServerPlace {
protected:
    NoRepository()
    {
        tav::Database(place.pathTo("server/server.db"))
            .run("DELETE FROM refs; DELETE FROM changes; DELETE FROM parents; DELETE FROM commits;"
                 "DELETE FROM repositories;");
    }
};

TEST_F(NoRepository, LetsEverythingGoOnThatNeedsNoServer)
{
    EXPECT_EQ(tav({"status"}).code, 0);
    EXPECT_EQ(tav({"log"}).code, 0);
    EXPECT_EQ(tav({"switch", "side"}).code, 0);
    EXPECT_EQ(place.read("repository/plan.dwg"), "one");
    place.write("repository/.tav/restoring/0", "left");
    Outcome const cleaned = tav({"gc"});
    EXPECT_EQ(cleaned.out, "Removed 0 stored versions that no commit needs; 4 bytes freed.\n");
    EXPECT_THAT(
        cleaned.err, StartsWith("tav: Only leftovers are removed: the server does not say what its commits need. "
                                "The server has no repository '"));
    Outcome const verified = tav({"verify"});
    EXPECT_EQ(verified.code, 0);
    EXPECT_THAT(verified.err, StartsWith("tav: The history could not be compared with the server's. "));
}

TEST_F(NoRepository, IsMadeAgainFromWhatIsKnown)
{
    std::string const before = history();
    EXPECT_EQ(tav({"server", "--send"}), done("Sent 2 commits.\nThe history is kept in '" + server() + "' now.\n"));
    EXPECT_EQ(history(), before);
    commitFile("note.txt", "more", "third");
    EXPECT_EQ(tav({"verify"}).code, 0);
}

TEST_F(ServerPlace, IsMadeAnewWhereTheServerIsLost)
{
    std::string const before = history();
    fs::remove_all(server());
    EXPECT_THAT(tav({"server", "--send"}).err, StartsWith("tav: The server folder '"));
    EXPECT_FALSE(place.has("server"));
    EXPECT_EQ(
        tav({"server", place.pathTo("new"), "--send"}),
        done("Sent 2 commits.\nThe history is kept in '" + place.pathTo("new") + "' now.\n"));
    EXPECT_EQ(history(), before);
    commitFile("note.txt", "more", "third");
    EXPECT_EQ(tav({"gc"}), done(kNothingToGc));
}

/// A commit whose note was written before the server went away.
class WaitingCommit : public ServerPlace {
protected:
    WaitingCommit()
    {
        std::string const old = place.read("server/server.db");
        place.write("repository/note.txt", "three");
        EXPECT_EQ(tav({"add", "--all"}).code, 0);
        std::string const state = place.read("repository/.tav/tav.state");
        std::string const database = place.read("repository/.tav/tav.db");
        EXPECT_EQ(tav({"commit", "-m", "third", "--author", "ann@studio"}).code, 0);
        std::string const document = documentOfLastCommit();
        place.write("server/server.db", old);
        place.write("repository/.tav/tav.db", database);
        place.write("repository/.tav/tav.state", state);
        makeSecondVersion(place.pathTo("repository/.tav/tav.db"), OdString(document.c_str(), CP_UTF_8));
    }

private:
    /// The note as the commit wrote it: the server keeps all that is in its document.
    std::string documentOfLastCommit() const
    {
        tav::Database const database(place.pathTo("repository/.tav/tav.db"));
        auto const one = [&](char const* statement) {
            tav::Statement row = database.prepare(statement);
            return row.next() ? row.text(0).ansi_str() : std::string();
        };
        std::string files;
        tav::Statement rows = database.prepare("SELECT path, url FROM changes WHERE number = 3");
        std::string const roof = one("SELECT url FROM changes WHERE path = 'roof.dwg'");
        std::string const ignore = one("SELECT url FROM changes WHERE path = '.tav/properties/ignore'");
        std::string const note = one("SELECT url FROM changes WHERE number = 3");
        for (auto const& [path, url] : std::vector<std::pair<std::string, std::string>>{
                 {".tav/properties/ignore", ignore}, {"note.txt", note}, {"roof.dwg", roof}}) {
            files +=
                (files.empty() ? "" : ",") + (R"({\"path\":\")" + path + R"(\",\"storagePath\":\")") + url + R"(\"})";
        }
        std::string const hash = one("SELECT hash FROM commits WHERE number = 3");
        std::string const parent = one("SELECT hash FROM commits WHERE number = 2");
        struct stat status;
        EXPECT_EQ(stat(place.pathTo("repository/note.txt").c_str(), &status), 0);
        std::string const time = std::to_string(status.st_mtim.tv_sec * 1'000'000'000 + status.st_mtim.tv_nsec);
        return R"({"contents":[],"files":[{"path":"note.txt","modified":false,"time":)" + time +
               R"(}],"document":"{\"commits\":[{\"annotation\":{\"author\":\"ann@studio\",)"
               R"(\"date\":\"2024-03-05T14:07:09Z\",\"message\":\"third\"},\"files\":[)" +
               files + R"(],\"hash\":\")" + hash + R"(\",\"parentsHashes\":[\")" + parent +
               R"(\"]}],\"references\":[{\"commitHash\":\")" + hash +
               R"(\",\"name\":\"master\",\"refType\":\"branch\"}]}"})";
    }
};

TEST_F(WaitingCommit, IsSentWhenTheServerIsFoundAgain)
{
    move("server", "moved");
    EXPECT_EQ(
        tav({"log"}).err, "tav: A commit was interrupted. The next command that changes something completes it.\n");
    EXPECT_THAT(tav({"switch", "side"}).err, HasSubstr("run 'tav server FOLDER'"));
    EXPECT_EQ(tav({"server", place.pathTo("moved")}).code, 0);
    Outcome const repeated = tav({"commit", "-m", "third", "--author", "ann@studio"});
    EXPECT_EQ(repeated.out.substr(0, 18), "Completed commit 3");
    EXPECT_EQ(repeated.err, "");
    EXPECT_EQ(tav({"log"}).err, "");
}

TEST_F(WaitingCommit, IsTakenBackWhereTheServerHasNoSuchRepository)
{
    tav::Database(place.pathTo("server/server.db"))
        .run("DELETE FROM refs; DELETE FROM changes; DELETE FROM parents; DELETE FROM commits;"
             "DELETE FROM repositories;");
    EXPECT_THAT(tav({"switch", "side"}).err, HasSubstr("The files are still staged."));
    EXPECT_EQ(tav({"log"}).err, "");
    EXPECT_THAT(tav({"status"}).out, HasSubstr("modified: note.txt"));
    EXPECT_EQ(tav({"server", "--send"}).code, 0);
    EXPECT_EQ(tav({"commit", "-m", "third", "--author", "ann@studio"}).out.substr(0, 13), "Made commit 3");
}

TEST_F(WaitingCommit, LeavesWhatWasStagedMeanwhile)
{
    place.write("repository/note.txt", "four");
    place.write("repository/new.txt", "new");
    move("server", "away");
    EXPECT_EQ(tav({"add", "--all"}), done("Staged 1 file.\n"));
    move("away", "server");
    EXPECT_THAT(
        tav({"fetch"}).err, testing::MatchesRegex("tav: Completed commit 3 \\([0-9a-f]+\\), which was interrupted.\n"));
    EXPECT_THAT(tav({"status"}).out, HasSubstr("        new:      new.txt\n        modified: note.txt\n\n"));
    EXPECT_THAT(tav({"status"}).out, testing::Not(HasSubstr("not staged")));
}

TEST_F(WaitingCommit, LeavesNothingStagedThatItHas)
{
    EXPECT_EQ(tav({"fetch"}).code, 0);
    EXPECT_THAT(tav({"status"}).out, HasSubstr("Nothing has changed since the last commit."));
}

TEST_F(WaitingCommit, IsSaidToBeGivenUpWhenTheServerRefusesIt)
{
    tav::Database(place.pathTo("server/server.db"))
        .run("DELETE FROM refs; DELETE FROM changes; DELETE FROM parents; DELETE FROM commits;"
             "DELETE FROM repositories;");
    EXPECT_THAT(
        tav({"gc"}).err, StartsWith("tav: A commit that was interrupted was abandoned because the server refused it. "
                                    "Its files are still staged.\n"));
}

class LostDatabase : public ServerPlace {
protected:
    void loseDatabase() const { fs::remove(place.pathTo("repository/.tav/tav.db")); }

    /// What remains is a folder of an earlier version of tav.
    void loseIdentity() const { fs::remove(place.pathTo("repository/.tav/identity")); }
};

TEST_F(LostDatabase, IsMadeAgainFromTheServer)
{
    std::string const before = history();
    loseDatabase();
    EXPECT_EQ(
        tav({"status"}), failed(
                             "tav: The database '" + place.pathTo("repository/.tav/tav.db") +
                             "' is missing or empty, though versions are stored here. Run 'tav init', with --server "
                             "FOLDER where the history is not in the default place.\n"));
    EXPECT_EQ(
        tav({"init", "--server", server()}),
        done("Made the database again from the server, with 2 commits. The folder is assumed to be at commit 2; see "
             "'tav status'.\n"
             "The repository in '.' was there already; it is complete.\n"));
    EXPECT_EQ(history(), before);
    EXPECT_THAT(tav({"status"}).out, HasSubstr("Nothing has changed since the last commit."));
    EXPECT_EQ(tav({"gc"}), done(kNothingToGc));
    EXPECT_EQ(tav({"verify"}), done("Read 3 stored versions; nothing is damaged.\n"));
    commitFile("note.txt", "more", "third");
    EXPECT_FALSE(place.has("repository/.tav/tav.db.new"));
}

TEST_F(LostDatabase, ReplacesADamagedOneThatWasMovedAway)
{
    std::string const before = history();
    std::string const database = place.read("repository/.tav/tav.db");
    constexpr char const* kAdvice = "Put a copy of it from a backup in its place, or move it away and run 'tav init', "
                                    "which makes it again from the server.\n";
    for (std::string const& damaged : {std::string("no database"), database.substr(0, 3 * 4096)}) {
        place.write("repository/.tav/tav.db", damaged);
        Outcome const outcome = tav({"verify"});
        EXPECT_EQ(outcome.code, 1);
        EXPECT_THAT(outcome.err, testing::EndsWith(kAdvice));
        move("repository/.tav/tav.db", "damaged.db");
        EXPECT_EQ(tav({"init", "--server", server()}).code, 0);
        EXPECT_EQ(history(), before);
    }
}

/// The database of another repository, which has no commit, in the place of the own one.
class ForeignDatabase : public ServerPlace {
protected:
    ForeignDatabase()
    {
        place.makeFolder("other");
        EXPECT_EQ(tav({"-C", place.pathTo("other"), "init", "--server", server()}).code, 0);
        fs::copy_file(
            place.pathTo("other/.tav/tav.db"), place.pathTo("repository/.tav/tav.db"),
            fs::copy_options::overwrite_existing);
    }
};

TEST_F(ForeignDatabase, IsRefusedByEveryCommand)
{
    std::vector<std::string> const before = place.list();
    for (Arguments const& arguments :
         {Arguments{"status"}, {"log"}, {"verify"}, {"gc"}, {"add", "--all"}, {"commit", "-m", "x"}, {"fetch"}}) {
        EXPECT_EQ(
            tav(arguments), failed(
                                "tav: The database '" + place.pathTo("repository/.tav/tav.db") +
                                "' belongs to another repository. Put the right one in its place, or move it away and "
                                "run 'tav init', which makes it again from the server.\n"))
            << arguments.front();
    }
    EXPECT_THAT(tav({"init"}).err, HasSubstr("' belongs to another repository."));
    EXPECT_EQ(place.list(), before);
}

TEST_F(ForeignDatabase, IsReplacedByTheOwnOne)
{
    move("repository/.tav/tav.db", "foreign.db");
    EXPECT_EQ(tav({"init", "--server", server()}).code, 0);
    EXPECT_EQ(hashes(), "1 first\n2 second\n");
    EXPECT_EQ(tav({"gc"}), done(kNothingToGc));
}

TEST_F(ForeignDatabase, IsNoticedInAFolderOfAnEarlierVersionFromTheNextCommandOn)
{
    move("repository/.tav/tav.db", "foreign.db");
    EXPECT_EQ(tav({"init", "--server", server()}).code, 0);
    fs::remove(place.pathTo("repository/.tav/identity"));
    EXPECT_EQ(tav({"status"}).code, 0);
    EXPECT_FALSE(place.has("repository/.tav/identity"));
    EXPECT_EQ(tav({"unstage", "--all"}).code, 0);
    EXPECT_TRUE(place.has("repository/.tav/identity"));
}

TEST_F(LostDatabase, IsThatOfTheRepositoryWhoseVersionsAreHere)
{
    place.makeFolder("other");
    place.write("other/note.txt", "text");
    Setting setting;
    setting.folder = place.pathTo("other");
    ASSERT_EQ(run(setting, {"init", "--server", server()}).code, 0);
    ASSERT_EQ(run(setting, {"add", "--all"}).code, 0);
    ASSERT_EQ(run(setting, {"commit", "-m", "another"}).code, 0);
    std::string const before = history();
    loseDatabase();
    EXPECT_EQ(tav({"init", "--server", server()}).code, 0);
    EXPECT_EQ(history(), before);
}

TEST_F(LostDatabase, IsNotTakenFromAServerThatHasNothingOfIt)
{
    place.makeFolder("other");
    Setting setting;
    setting.folder = place.pathTo("other");
    ASSERT_EQ(run(setting, {"init", "--server", place.pathTo("strange")}).code, 0);
    loseDatabase();
    EXPECT_EQ(
        tav({"init", "--server", place.pathTo("strange")}),
        failed(
            "tav: The server in '" + place.pathTo("strange") +
            "' has no repository to which the versions here belong. Name the folder of the right one with "
            "--server.\n"));
    EXPECT_FALSE(place.has("repository/.tav/tav.db"));
}

/// A server in "other", whose only repository has committed the file "h.txt" of the folder "project".
class OtherServer : public LostDatabase {
protected:
    OtherServer()
    {
        place.write("project/h.txt", "hello");
        EXPECT_EQ(tavInProject({"init", "--server", other()}).code, 0);
        EXPECT_EQ(tavInProject({"add", "--all"}).code, 0);
        EXPECT_EQ(tavInProject({"commit", "-m", "another"}).code, 0);
    }

    Outcome tavInProject(Arguments const& arguments) const
    {
        Setting setting;
        setting.folder = place.pathTo("project");
        return run(setting, arguments);
    }

    std::string other() const { return place.pathTo("other"); }

    std::string hasNone() const
    {
        return "tav: The server in '" + other() +
               "' has no repository to which the versions here belong. Name the folder of the right one with "
               "--server.\n";
    }
};

TEST_F(OtherServer, IsNotTakenForTheIgnoreRulesThatAllRepositoriesHave)
{
    loseDatabase();
    EXPECT_EQ(tav({"init", "--server", other()}), failed(hasNone()));
    move("repository", "unlisted");
    Setting setting;
    setting.folder = place.pathTo("unlisted");
    EXPECT_EQ(run(setting, {"init", "--server", other()}), failed(hasNone()));
    EXPECT_FALSE(place.has("unlisted/.tav/tav.db"));
    EXPECT_EQ(run(setting, {"init", "--server", server()}).code, 0) << "knows all that is here";
}

TEST_F(OtherServer, IsNotTakenForSomeVersionsInCommon)
{
    commitFile("h.txt", "hello", "the same");
    loseDatabase();
    loseIdentity();
    move("repository", "unlisted");
    Setting setting;
    setting.folder = place.pathTo("unlisted");
    EXPECT_EQ(
        run(setting, {"init", "--server", other()}),
        failed(
            "tav: The server in '" + other() +
            "' does not know 2 of the 3 versions that are here. Name the folder of the right one with --server.\n"));
}

TEST_F(OtherServer, LosesNothingToTheDatabaseOfItsFolder)
{
    loseIdentity();
    fs::copy(
        place.pathTo("project/.tav/tav.db"), place.pathTo("repository/.tav/tav.db"),
        fs::copy_options::overwrite_existing);
    EXPECT_EQ(
        tav({"gc"}),
        (Outcome{
            0, kNothingToGc,
            "tav: Only leftovers are removed: 1 committed version that should be here cannot be found. Run 'tav "
            "verify' to see what is missing; if '.tav/tav.db' is of another folder, put the right one in its place, or "
            "move it away and run 'tav init'.\n"}));
    EXPECT_FALSE(place.has("repository/.tav/identity"));
}

/// The server of the project was copied to "moved" after the first commits, and is used there since.
class ServerLeftBehind : public LostDatabase {
protected:
    ServerLeftBehind()
    {
        fs::create_directories(defaultServer());
        fs::copy(server(), place.pathTo("moved"), fs::copy_options::recursive);
        EXPECT_EQ(tav({"server", place.pathTo("moved")}).code, 0);
        commitFile("note.txt", "three", "third");
        commitFile("note.txt", "four", "fourth");
        loseDatabase();
        fs::copy(server(), defaultServer(), fs::copy_options::recursive | fs::copy_options::overwrite_existing);
    }

    /// Other tests have the default server of the home.
    std::string defaultServer() const { return place.pathTo("data/tav/server"); }

    Outcome tavHere(Arguments const& arguments) const
    {
        Setting setting;
        setting.folder = place.pathTo("repository");
        setting.environment = {"XDG_DATA_HOME=" + place.pathTo("data")};
        return run(setting, arguments);
    }
};

TEST_F(ServerLeftBehind, DoesNotHideTheLaterCommits)
{
    EXPECT_EQ(
        tavHere({"init"}), failed(
                               "tav: The server in '" + defaultServer() +
                               "' does not know 2 of the 4 versions that are here. Name the folder of the right one "
                               "with --server.\n"));
    EXPECT_EQ(tavHere({"init", "--server", place.pathTo("moved")}).code, 0);
    EXPECT_EQ(hashes(), "1 first\n2 second\n3 third\n4 fourth\n");
    EXPECT_EQ(tav({"gc"}), done(kNothingToGc));
}

TEST_F(ServerLeftBehind, IsTakenWhenItIsNamed)
{
    EXPECT_EQ(
        tavHere({"init", "--server", defaultServer()}).err,
        "tav: The server in '" + defaultServer() +
            "' does not know 2 of the versions that are here; 'tav gc' would remove them.\n");
    EXPECT_EQ(hashes(), "1 first\n2 second\n");
}

TEST_F(LostDatabase, IsMadeAgainAfterAnInterruption)
{
    std::string const before = history();
    loseDatabase();
    place.write("repository/.tav/tav.db.new", "left of a killed command");
    place.write("repository/.tav/tav.db-journal", "of the lost one");
    EXPECT_EQ(tav({"init", "--server", server()}).code, 0);
    EXPECT_EQ(history(), before);
    EXPECT_FALSE(place.has("repository/.tav/tav.db-journal"));
}

} // namespace
} // namespace host_tests
