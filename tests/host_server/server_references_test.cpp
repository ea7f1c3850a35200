#include "tests/host_server/server_test.h"

#include <gtest/gtest.h>

namespace {

using server::commit;
using server::references;
using server::replaced;

constexpr char const* kRemoveMain = R"([{"commitHash":"","expected":"<b>","name":"main","refType":"branch"}])";

class ServerReferences : public server::ServerTest {
protected:
    ServerReferences()
    {
        ask("commit <id>", commit('a', "", {}, {"branch main a", "tag v1 a"}));
        ask("commit <id>", commit('b', "a", {}, {}));
        ask("commit <id>", commit('c', "a", {"plan 1"}, {}));
    }

    std::string move(std::string const& document) { return ask("references <id>", document); }
    std::string force(std::string const& document) { return ask("force-references <id>", document); }
};

TEST_F(ServerReferences, AreListedInTheOrderOfTheirNames)
{
    EXPECT_EQ(move("[]"), references({"branch main a", "tag v1 a"}));
    EXPECT_EQ(force("[]"), references({"branch main a", "tag v1 a"}));
}

TEST_F(ServerReferences, AreMadeAndMovedForward)
{
    EXPECT_EQ(
        move(references({"branch side c", "branch main b a", "tag v2 b -"})),
        references({"branch main b", "branch side c", "tag v1 a", "tag v2 b"}));
}

TEST_F(ServerReferences, AreNotMovedByWhoDoesNotSayWhereTheyAre)
{
    EXPECT_EQ(move(references({"branch main b"})), "error: There is a branch 'main' already. Choose another name.");
    EXPECT_EQ(move(references({"branch main b -"})), "error: There is a branch 'main' already. Choose another name.");
    EXPECT_EQ(move(references({"tag v1 b"})), "error: There is a tag 'v1' already. Choose another name.");
    EXPECT_EQ(move("[]"), references({"branch main a", "tag v1 a"}));
}

TEST_F(ServerReferences, MoveOnlyFromWhereTheyAreExpectedAlsoWhenForced)
{
    std::string const refusal =
        "error: The branch 'main' now names a different commit. Fetch what others have done, and try again.";
    EXPECT_EQ(move(references({"branch main b c"})), refusal);
    EXPECT_EQ(force(references({"branch main b c"})), refusal);
    EXPECT_EQ(move(references({"branch other b a"})), replaced(refusal, "main", "other"));
    EXPECT_EQ(move(references({"branch main b a"})), references({"branch main b", "tag v1 a"}));
    EXPECT_EQ(move(references({"branch main b a"})), references({"branch main b", "tag v1 a"})) << "repeated";
}

TEST_F(ServerReferences, MayStayWhereTheyAre)
{
    EXPECT_EQ(move(references({"branch main a", "tag v1 a"})), references({"branch main a", "tag v1 a"}));
}

TEST_F(ServerReferences, MoveAllOrNone)
{
    EXPECT_EQ(
        move(references({"branch main b a", "tag v1 b a"})),
        "error: The tag 'v1' names another commit already. Choose another name.");
    EXPECT_EQ(move("[]"), references({"branch main a", "tag v1 a"}));
}

TEST_F(ServerReferences, MoveBackOrAsideWhileNobodyHasWhatTheyLeave)
{
    move(references({"branch main b a"}));
    EXPECT_EQ(move(references({"branch main a b"})), references({"branch main a", "tag v1 a"}));
    EXPECT_EQ(move(references({"branch main b a"})), references({"branch main b", "tag v1 a"}));
    EXPECT_EQ(move(references({"branch main c b"})), references({"branch main c", "tag v1 a"}));
}

TEST_F(ServerReferences, DoNotLeaveWhatOthersHaveUnlessForced)
{
    move(references({"branch main b a", "tag v2 b -"}));
    ask("history <id>", R"([{"commitNo":1,"hash":""}])");
    std::string const refusal = "error: Commit 2 cannot be taken back: 'v2' has it, and it may be in other working "
                                "folders. Make another commit that puts things right.";
    EXPECT_EQ(move(references({"branch main a b"})), refusal);
    EXPECT_EQ(move(references({"branch main c b"})), refusal);
    EXPECT_EQ(force(references({"branch main c", "tag v1 b"})), references({"branch main c", "tag v1 b", "tag v2 b"}));
}

TEST_F(ServerReferences, DoNotLeaveWhatAFetchHasBrought)
{
    move(references({"branch main b a"}));
    ask("fetch <id>", "[]");
    EXPECT_EQ(
        move(references({"branch main a b"})),
        "error: Commit 2 cannot be taken back: it may be in other working folders. Make another commit that puts "
        "things right.");
}

TEST_F(ServerReferences, GoOnlyWhileNoOtherHasTheirCommits)
{
    force(references({"tag v1 b"}));
    force(references({"branch main b", "branch side b"}));
    EXPECT_EQ(
        move(kRemoveMain), "error: Commit 1 cannot be taken back: 'side' has it, and 'v1' has it. Make another commit "
                           "that puts things right.");
}

TEST_F(ServerReferences, GoOnlyFromWhereTheyAreExpected)
{
    std::string const document = R"([{"commitHash":"",MORE"name":"main","refType":"branch"}])";
    std::string const refusal = "error: '[0].commitHash' must be a hash of 64 lower-case hexadecimal digits. Nothing "
                                "has changed on the server.";
    EXPECT_EQ(move(replaced(document, "MORE", "")), refusal);
    EXPECT_EQ(move(replaced(document, "MORE", R"("expected":"",)")), refusal);
    EXPECT_EQ(
        move(kRemoveMain),
        "error: The branch 'main' now names a different commit. Fetch what others have done, and try again.");
}

TEST_F(ServerReferences, KeepTheirTypeAlsoWhenForced)
{
    EXPECT_EQ(force(references({"tag main a"})), "error: 'main' is the name of a branch already. Choose another name.");
}

TEST_F(ServerReferences, NameCommitsThatAreThereAlsoWhenForced)
{
    EXPECT_EQ(
        force(references({"branch new d"})),
        "error: The server does not have the commit '<d>' of 'new'. Nothing has changed on the server.");
}

TEST_F(ServerReferences, AreCheckedLikeThoseOfACommit)
{
    EXPECT_EQ(move("{}"), "error: The document must be of type array, not object. Nothing has changed on the server.");
    EXPECT_EQ(move("[1]"), "error: '[0]' must be of type object, not int. Nothing has changed on the server.");
    EXPECT_EQ(
        move(references({"branch main b", "branch -f b"})),
        "error: '[1].name' begins with a dash. Nothing has changed on the server.");
    EXPECT_EQ(
        move(references({"branch new b", "tag new b"})),
        "error: The document must not hold the name 'new' twice. Nothing has changed on the server.");
    EXPECT_EQ(
        move(R"([{"commitHash":"<b>","expected":"b","name":"new","refType":"tag"}])"),
        "error: '[0].expected' must be a hash of 64 lower-case hexadecimal digits. Nothing has changed on the server.");
    EXPECT_EQ(move(""), "error: The document is not valid JSON. Nothing has changed on the server.");
}

} // namespace
