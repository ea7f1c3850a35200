#include "tests/host_server/server_test.h"
#include "tests/support/rows.h"

#include "host/errors/failure.h"
#include "host/protocol/history_document.h"
#include "host/server/history_answers.h"

#include <gtest/gtest.h>

namespace {

using server::commit;

class ServerHistory : public server::ServerTest {
protected:
    ServerHistory()
    {
        ask("commit <id>", commit('a', "", {"plan.dwg 1", "note.txt 2"}, {"branch main a"}));
        ask("commit <id>", commit('b', "a", {"roof.dwg 1 plan.dwg"}, {"branch main b"}));
    }

    static std::string known(int number) { return R"([{"commitNo":)" + std::to_string(number) + R"(,"hash":""}])"; }
};

constexpr char const* kFirst =
    R"({"annotation":{"author":"ann","date":1709647629,"message":"moves the stairs"},"changes":)"
    R"([{"path":"note.txt","storagePath":"po:<2>"},{"path":"plan.dwg","storagePath":"po:<1>"}],)"
    R"("commitNo":1,"hash":"<a>","parentsHashes":[]})";
constexpr char const* kSecond =
    R"({"annotation":{"author":"ann","date":1709647629,"message":"moves the stairs"},"changes":)"
    R"([{"path":"note.txt"},{"path":"plan.dwg"},{"path":"roof.dwg","previousPath":"plan.dwg","storagePath":"po:<1>"}],)"
    R"("commitNo":2,"hash":"<b>","parentsHashes":["<a>"]})";

std::string page(std::vector<std::string> const& commits)
{
    return R"({"commits":)" + server::joined(commits) + "}";
}

TEST_F(ServerHistory, HasTheChangesOfEachCommit)
{
    EXPECT_EQ(ask("history <id>", "[]"), page({kFirst, kSecond}));
    EXPECT_EQ(ask("history <id>", known(1)), page({kSecond}));
    EXPECT_EQ(ask("history <id>", known(2)), page({}));
}

TEST_F(ServerHistory, NumbersBeginWithTheOneThatTheClientSends)
{
    std::string const first = R"({"commitNo":1,"hash":"<a>"})";
    std::string const second = R"({"commitNo":2,"hash":"<b>"})";
    EXPECT_EQ(ask("numbers <id>", "[]"), server::joined({first, second}));
    EXPECT_EQ(ask("numbers <id>", known(1)), server::joined({first, second}));
    EXPECT_EQ(ask("numbers <id>", known(2)), server::joined({second}));
    EXPECT_EQ(ask("numbers <id>", known(3)), "[]");
}

TEST_F(ServerHistory, ComesInPages)
{
    tav::SqliteHistory store(serverFolder() + "/server.db");
    auto const history = store.read(server::wideText(id()));
    auto const numbersIn = [&](std::int64_t from, std::size_t most) {
        std::vector<std::int64_t> numbers;
        for (tav::ChangedCommit const& next : tav::readHistoryPage(tav::historyPage(*history, from, most))) {
            numbers.push_back(next.commit.number);
        }
        return numbers;
    };
    EXPECT_EQ(numbersIn(0, 7), (std::vector<std::int64_t>{1, 2}));
    EXPECT_EQ(numbersIn(0, 6), (std::vector<std::int64_t>{1}));
    EXPECT_EQ(numbersIn(0, 0), (std::vector<std::int64_t>{1})) << "a commit never stops it";
    EXPECT_EQ(numbersIn(1, 0), (std::vector<std::int64_t>{2}));
}

struct Row {
    char const* name;
    char const* what;
    char const* with;
    char const* message;
};

class HistoryPage : public testing::TestWithParam<Row> {};

TEST_P(HistoryPage, IsRefusedWhereItIsNotClean)
{
    std::string const text =
        server::expanded(server::replaced(page({kFirst, kSecond}), GetParam().what, GetParam().with));
    try {
        [[maybe_unused]] auto const commits = tav::readHistoryPage(server::wideText(text));
        FAIL() << "it was read";
    } catch (tav::Failure const& failure) {
        EXPECT_EQ(failure.what, GetParam().message);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Rows, HistoryPage,
    testing::Values(
        Row{"PathThatLeadsOut", "note.txt", "../note.txt",
            "'commits[0].changes[0].path' cannot be recorded. The path '../note.txt' has a part that consists of "
            "dots and spaces, which may lead out of the working folder."},
        Row{"PreviousPathThatLeadsOut", R"("previousPath":"plan.dwg")", R"("previousPath":"/plan.dwg")",
            "'commits[1].changes[2].previousPath' cannot be recorded. The path '/plan.dwg' is absolute; a recorded "
            "path "
            "is relative to the working folder."},
        Row{"Url", "po:<2>", "po:2",
            "'commits[0].changes[0].storagePath' must name a content, such as 'po:' or 'tf:plan#' followed by a hash."},
        Row{"Hash", R"("hash":"<a>")", R"("hash":"a")",
            "'commits[0].hash' must be a hash of 64 lower-case hexadecimal digits."},
        Row{"PathTwice", "note.txt", "plan.dwg", "'commits[0].changes' must not hold the path 'plan.dwg' twice."},
        Row{"NumberThatDoesNotAscend", R"("commitNo":2)", R"("commitNo":1)",
            "'commits[1]' must have a higher number than the one before it."},
        Row{"NoCommits", "commits", "others", "The document lacks the member 'commits'."}),
    support::rowName);

} // namespace
