#include "tests/host_server/server_test.h"

#include <gtest/gtest.h>

namespace {

using server::commit;
using server::replaced;

class ServerFetch : public server::ServerTest {
protected:
    void send(std::string const& document)
    {
        std::string const answer = ask("commit <id>", document);
        EXPECT_EQ(answer.find("error"), std::string::npos) << answer;
    }
    std::string fetch(std::string const& document) { return ask("fetch <id>", document); }

    /// One commit as a fetch answers it.
    static std::string
    received(int number, char hash, std::string const& parents, std::vector<std::string> const& fileLines)
    {
        std::vector<std::string> hashes;
        for (char const parent : parents) {
            hashes.push_back(std::string("\"<") + parent + ">\"");
        }
        return R"({"annotation":{"author":"ann","date":1709647629.0000000000000000,"message":"moves the stairs"},)"
               R"("commitNo":)" +
               std::to_string(number) + R"(,"files":)" + server::files(fileLines) + R"(,"hash":"<)" + hash +
               R"(>","parentsHashes":)" + server::joined(hashes) + "}";
    }

    static std::string answer(std::vector<std::string> const& commits, std::vector<std::string> const& references)
    {
        return R"({"commits":)" + server::joined(commits) + R"(,"references":)" + server::references(references) +
               R"(,"repository":{"id":"<id>","name":"bridge"}})";
    }
};

TEST_F(ServerFetch, OfANewRepositoryHasNoCommits)
{
    EXPECT_EQ(fetch("[]"), answer({}, {}));
}

TEST_F(ServerFetch, BringsWholeTreesThroughRenamesRemovalsBranchesAndMerges)
{
    send(commit('a', "", {"notes 1", "old 2", "plan 3"}, {"branch main a"}));
    send(commit('b', "a", {"new 2 old", "notes 4", "plan 3"}, {"branch main b"}));
    send(commit('c', "a", {"notes 1", "old 5"}, {"branch side c"}));
    send(commit('d', "b", {"new 6", "plan 3"}, {}));
    send(commit('e', "dc", {"new 6", "old 5", "plan 7"}, {"branch main e", "tag v1 b"}));
    send(commit('f', "c", {"sub/old 5 old"}, {}));
    std::string const whole = answer(
        {received(1, 'a', "", {"notes 1", "old 2", "plan 3"}),
         received(2, 'b', "a", {"new 2 old", "notes 4", "plan 3"}), received(3, 'c', "a", {"notes 1", "old 5"}),
         received(4, 'd', "b", {"new 6", "plan 3"}), received(5, 'e', "dc", {"new 6", "old 5", "plan 7"}),
         received(6, 'f', "c", {"sub/old 5 old"})},
        {"branch main e", "branch side c", "tag v1 b"});
    EXPECT_EQ(fetch("[]"), whole);
    EXPECT_EQ(
        fetch(R"([{"commitNo":4,"hash":"<d>"},{"commitNo":2,"hash":"<b>"}])"),
        answer(
            {received(5, 'e', "dc", {"new 6", "old 5", "plan 7"}), received(6, 'f', "c", {"sub/old 5 old"})},
            {"branch main e", "branch side c", "tag v1 b"}));
}

TEST_F(ServerFetch, BringsNothingTwice)
{
    send(commit('a', "", {"plan 1"}, {"branch main a"}));
    EXPECT_EQ(fetch(R"([{"commitNo":1,"hash":"<a>"}])"), answer({}, {"branch main a"}));
    EXPECT_EQ(fetch(R"([{"commitNo":18446744073709551615,"hash":""}])"), answer({}, {"branch main a"}));
    EXPECT_EQ(fetch(R"([{"commitNo":-1,"hash":""}])"), answer({received(1, 'a', "", {"plan 1"})}, {"branch main a"}));
}

TEST_F(ServerFetch, PutsTreesOfManyOpenBranchesTogether)
{
    send(commit('0', "", {"plan 0", "notes 0"}, {}));
    std::string const first = "123456789abc";
    std::vector<std::string> commits = {received(1, '0', "", {"notes 0", "plan 0"})};
    int number = 1;
    for (char const c : first) {
        std::vector<std::string> const tree = {"notes 0", std::string("plan ") + c};
        send(commit(c, "0", tree, {}));
        commits.push_back(received(++number, c, "0", tree));
    }
    std::vector<std::string> const tree = {"notes d", "plan 1"};
    send(commit('d', "1", tree, {}));
    commits.push_back(received(++number, 'd', "1", tree));
    std::vector<std::string> const merged = {"notes 0", "plan c", "plans/b b"};
    send(commit('e', "cb", merged, {}));
    commits.push_back(received(++number, 'e', "cb", merged));
    EXPECT_EQ(fetch("[]"), answer(commits, {}));
    EXPECT_EQ(
        fetch(R"([{"commitNo":2,"hash":"<1>"}])"),
        answer(std::vector<std::string>(commits.begin() + 2, commits.end()), {}));
}

TEST_F(ServerFetch, GivesTextsBackAsTheyWere)
{
    std::string const path = R"(\u041F\uD83D\uDE00 \"\uDCFF\/\u00E9)";
    std::string document = replaced(commit('a', "", {"plan.dwg 1 old.dwg"}, {"branch main a"}), "plan.dwg", path);
    document = replaced(document, "old.dwg", path + "x");
    document = replaced(document, "\"ann\"", "\"\\uD83D\\uDE00\"");
    document = replaced(document, "moves the stairs", "one\\ntwo \\u202E");
    server::renameCommit('a', document);
    send(replaced(document, "main", "\\uD83D\\uDE00"));
    std::string expected = answer({received(1, 'a', "", {"plan.dwg 1 old.dwg"})}, {"branch main a"});
    std::string const back = R"(\u041F\uD83D\uDE00 \"\uDCFF/\u00E9)";
    expected = replaced(expected, "plan.dwg", back);
    expected = replaced(expected, "old.dwg", back + "x");
    expected = replaced(expected, "\"ann\"", "\"\\uD83D\\uDE00\"");
    expected = replaced(expected, "moves the stairs", "one\\ntwo \\u202E");
    EXPECT_EQ(fetch("[]"), replaced(expected, "main", "\\uD83D\\uDE00"));
}

TEST_F(ServerFetch, DropsAPreviousPathThatIsThePath)
{
    send(commit('a', "", {"plan 1 plan"}, {}));
    EXPECT_EQ(fetch("[]"), answer({received(1, 'a', "", {"plan 1"})}, {}));
}

TEST_F(ServerFetch, RefusesWhatIsNoListOfNumbers)
{
    std::string const end = " Nothing has changed on the server.";
    EXPECT_EQ(fetch("{}"), "error: The document must be of type array, not object." + end);
    EXPECT_EQ(fetch(R"([{"hash":""}])"), "error: '[0]' lacks the member 'commitNo'." + end);
    EXPECT_EQ(fetch(R"([{"commitNo":1}])"), "error: '[0]' lacks the member 'hash'." + end);
    EXPECT_EQ(fetch(R"([{"commitNo":1.0,"hash":""}])"), "error: '[0].commitNo' must be of type int, not real." + end);
}

} // namespace
