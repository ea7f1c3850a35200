#include "host/database/sqlite.h"

#include "tests/host_server/server_test.h"
#include "tests/support/as_ordinary_user.h"

#include <gmock/gmock.h>

#include <csignal>
#include <sys/resource.h>
#include <sys/stat.h>

namespace {

using server::commit;

class ServerFolder : public server::ServerTest {
protected:
    ServerFolder() { ask("commit <id>", commit('a', "", {"plan 1"}, {"branch main a"})); }

    std::string databasePath() const { return serverFolder() + "/server.db"; }
    std::string askAnother(std::string const& verb, std::string const& document)
    {
        tav::EmbeddedServer other(serverFolder());
        return ask(other, verb, document);
    }
};

TEST_F(ServerFolder, HoldsOneFileWhenNothingIsGoingOn)
{
    EXPECT_THAT(folder().list(), testing::ElementsAre("server/", "server/server.db"));
}

TEST_F(ServerFolder, IsMadeWithTheFirstRequest)
{
    tav::EmbeddedServer deep(folder().pathTo("a/b/c"));
    EXPECT_FALSE(folder().has("a"));
    EXPECT_EQ(ask(deep, "repositories", ""), "[]");
    EXPECT_TRUE(folder().has("a/b/c/server.db"));
}

TEST_F(ServerFolder, ShowsAnotherServerEverything)
{
    EXPECT_EQ(askAnother("fetch <id>", "[]"), ask("fetch <id>", "[]"));
    EXPECT_EQ(askAnother("commit <id>", commit('b', "a", {}, {"branch main b"})), R"([{"commitNo":2,"hash":"<b>"}])");
    EXPECT_EQ(ask("references <id>", "[]"), server::references({"branch main b"}));
}

TEST_F(ServerFolder, OfAnEarlierVersionCountsAllCommitsAsHandedOut)
{
    ask("commit <id>", commit('b', "a", {}, {"branch main b"}));
    {
        tav::Database database(databasePath());
        database.run("DROP TABLE delivered; DROP TABLE contents; DROP TABLE awaited; DROP TABLE uploads");
        database.setVersion(1);
    }
    EXPECT_EQ(askAnother("references <id>", "[]"), server::references({"branch main b"}));
    askAnother("fetch <id>", "[]");
    EXPECT_EQ(tav::Database(databasePath()).version(), 1); // Who reads leaves it as it is.
    EXPECT_EQ(
        askAnother("references <id>", server::references({"branch main a b"})),
        "error: Commit 2 cannot be taken back: it may be in other working folders. Make another commit that puts "
        "things right.");
    ask("commit <id>", commit('c', "b", {}, {"branch main c b"}));
    EXPECT_EQ(
        askAnother("references <id>", server::references({"branch main b c"})), server::references({"branch main b"}));
}

TEST_F(ServerFolder, OfANewerVersionIsRefused)
{
    tav::Database(databasePath()).setVersion(4);
    EXPECT_EQ(
        askAnother("repositories", ""),
        "error: The database '" + databasePath() +
            "' was made by a newer tav. Install that one, or name another folder for the server.");
}

TEST_F(ServerFolder, WithADamagedFileIsRefused)
{
    folder().write("server/server.db", std::string(8192, 'x'));
    EXPECT_EQ(
        askAnother("fetch <id>", "[]"),
        "error: The database '" + databasePath() +
            "' cannot be used: file is not a database. Put a copy of it from a backup in its place.");
}

TEST_F(ServerFolder, ThatIsAFileIsRefused)
{
    folder().write("file", "");
    tav::EmbeddedServer server(folder().pathTo("file"));
    EXPECT_EQ(
        ask(server, "repositories", ""), "error: The folder '" + folder().pathTo("file") +
                                             "' cannot be made: Not a directory. Check your permissions there, or name "
                                             "another folder for the server.");
}

TEST_F(ServerFolder, WithoutANameIsRefused)
{
    tav::EmbeddedServer server("");
    EXPECT_EQ(
        ask(server, "repositories", ""), "error: The folder '' cannot be made: No such file or directory. Check your "
                                         "permissions there, or name another folder for the server.");
}

TEST_F(ServerFolder, ThatMayOnlyBeReadAnswersAndTakesNothing)
{
    std::string const before = ask("fetch <id>", "[]");
    ASSERT_EQ(chmod(folder().path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(databasePath().c_str(), 0444), 0);
    ASSERT_EQ(chmod(serverFolder().c_str(), 0555), 0);
    EXPECT_EQ(support::asOrdinaryUser([&] { return askAnother("fetch <id>", "[]"); }), before);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return askAnother("commit <id>", commit('b', "a", {}, {})); }),
        "error: The database '" + databasePath() +
            "' cannot be used: attempt to write a readonly database. Check the free space and your rights in the "
            "folder of '" +
            databasePath() + "'.");
    ASSERT_EQ(chmod(serverFolder().c_str(), 0755), 0);
}

TEST_F(ServerFolder, OnAFullDiskKeepsWhatItHad)
{
    ASSERT_EQ(chmod(folder().path().c_str(), 0777), 0);
    ASSERT_EQ(chmod(databasePath().c_str(), 0666), 0);
    ASSERT_EQ(chmod(serverFolder().c_str(), 0777), 0);
    std::string const before = ask("fetch <id>", "[]");
    std::vector<std::string> files;
    for (int i = 0; i < 5000; ++i) {
        files.push_back("folder/file" + std::to_string(i) + " 2");
    }
    std::string const answer = support::asOrdinaryUser([&] {
        std::signal(SIGXFSZ, SIG_IGN); // Beyond the limit a write fails as on a full disk.
        rlimit const limit{100000, 100000};
        return setrlimit(RLIMIT_FSIZE, &limit) == 0 ? askAnother("commit <id>", commit('b', "a", files, {})) : "";
    });
    EXPECT_EQ(
        answer, "error: The database '" + databasePath() +
                    "' cannot be used: disk I/O error. Check the free space and your rights in the folder of '" +
                    databasePath() + "'.");
    EXPECT_EQ(askAnother("fetch <id>", "[]"), before);
}

TEST_F(ServerFolder, GivesAnIdentifierOnce)
{
    std::string const repositories = ask("repositories", "");
    EXPECT_EQ(
        ask("init", R"({"id":")" + id() + R"(","name":"tunnel"})"),
        "error: The server has a repository '<id>' already. Nothing has changed on the server.");
    EXPECT_EQ(ask("repositories", ""), repositories);
}

TEST_F(ServerFolder, KeepsRepositoriesWithTheirNames)
{
    std::string const second = init("bridge");
    EXPECT_EQ(second.size(), 32u);
    EXPECT_EQ(second.find_first_not_of("0123456789abcdef"), std::string::npos) << second;
    EXPECT_NE(second, id());
    EXPECT_EQ(
        askAnother("repositories", ""),
        R"([{"id":"<id>","name":"bridge"},{"id":")" + second + R"(","name":"bridge"}])");
}

} // namespace
