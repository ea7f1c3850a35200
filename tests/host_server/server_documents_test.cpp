#include "tests/host_server/server_test.h"
#include "tests/server/examples.h"
#include "tests/server/outcome.h"
#include "tests/support/rows.h"
#include "tests/support/utf8.h"

#include "host/protocol/history_document.h"

#include <gtest/gtest.h>

namespace {

using namespace common;
using server::commit;

class ServerDocuments : public server::ServerTest {
protected:
    ServerDocuments()
    {
        ask("commit <id>", commit('a', "", {"plan 1"}, {"branch main a"}));
        ask("commit <id>", commit('b', "a", {"new 1 plan"}, {"branch main b", "tag v1 a"}));
    }

    std::string answerTo(std::string const& verb, std::string const& document)
    {
        return server::expanded(ask(verb, document));
    }
    static std::string words(std::string const& text) { return server::shortened(text); }
};

TEST_F(ServerDocuments, AreReadByTheLibrary)
{
    EXPECT_EQ(
        words(server::outcomeOf([&] { return deserializeFetchData(server::object(answerTo("fetch <id>", "[]"))); })),
        "bridge is <id> ''; commits [1 <a> of []: ann said 'moves the stairs' at 1709647629 [plan in po:<1>], "
        "2 <b> of [<a>]: ann said 'moves the stairs' at 1709647629 [new in po:<1>]]; "
        "references [branch main -> <b>, tag v1 -> <a>]");
    EXPECT_EQ(
        words(server::outcomeOf(
            [&] { return deserializeReferences(support::fromUtf8(answerTo("references <id>", "[]"))); })),
        "[branch main -> <b>, tag v1 -> <a>]");
    EXPECT_EQ(
        server::outcomeOf([&] { return deserializeRepoDatas(support::fromUtf8(answerTo("repositories", ""))); }),
        "[bridge is <id> '']");
    EXPECT_EQ(
        server::outcomeOf([&] { return deserializeServerVersion(support::fromUtf8(answerTo("version", ""))); }), "1");
    EXPECT_EQ(
        words(server::outcomeOf([&] {
            std::string const again = commit('b', "a", {"new 1 plan"}, {});
            return deserializeCommitNumbers(server::array(answerTo("commit <id>", again)));
        })),
        "[<b> is 2]");
    EXPECT_EQ(
        server::outcomeOf([&] {
            return deserializeInitData(server::object(answerTo("init", R"({"name":"a"})")));
        }).size(),
        32u);
}

TEST_F(ServerDocuments, ThatTheLibraryWritesAreTaken)
{
    CommitInfo info;
    tav::CommitRecord commit;
    commit.author = L"ann@example.org";
    commit.message = L"moves the stairs";
    commit.parents = {server::wideText(server::hashNamed('b'))};
    OdString const url = server::wideText("tf:plan#" + std::string(64, '7'));
    OdString const hash = tav::commitHash(commit, {{L"house/plan.dwg", url, L"new"}});
    server::commitHashes()['c'] = hash.ansi_str();
    info.files.emplace_back(L"house/plan.dwg", url, std::make_unique<BaseFile>(L"new"));
    info.references.emplace_back(L"main", hash, EType::branch);
    info.parents = commit.parents;
    info.hash = hash;
    info.author = commit.author;
    info.message = commit.message;
    EXPECT_EQ(ask("commit <id>", server::pretty(serializeCommitInfo(info))), R"([{"commitNo":3,"hash":"<c>"}])");
}

struct Row {
    char const* name;
    char const* verb;
    char const* document;
    char const* message;
};

class ServerRequest
    : public server::ServerTest
    , public testing::WithParamInterface<Row> {};

TEST_P(ServerRequest, IsRefusedWithAReason)
{
    EXPECT_EQ(
        ask(GetParam().verb, GetParam().document),
        std::string("error: ") + GetParam().message + " Nothing has changed on the server.");
}

INSTANTIATE_TEST_SUITE_P(
    Requests, ServerRequest,
    testing::Values(
        Row{"Empty", "", "", "The server does not know the request ''."},
        Row{"Unknown", "delete <id>", "", "The server does not know the request 'delete'."},
        Row{"Capitals", "Version", "", "The server does not know the request 'Version'."},
        Row{"UnknownRepository", "fetch 12", "[]", "The server has no repository '12'."},
        Row{"RepositoryAndMore", "fetch <id> 1", "[]", "The server has no repository '<id> 1'."},
        Row{"NoRepository", "fetch", "[]", "The request 'fetch' must name a repository."},
        Row{"EmptyRepository", "commit ", "{}", "The request 'commit' must name a repository."},
        Row{"NeedlessRepository", "init <id>", "{}", "The request 'init' does not take a repository."},
        Row{"InitOfNoJson", "init", "", "The document is not valid JSON."},
        Row{"InitOfAnArray", "init", "[]", "The document must be of type object, not array."},
        Row{"InitWithoutName", "init", "{}", "The document lacks the member 'name'."},
        Row{"InitWithNumber", "init", R"({"name":1})", "'name' must be of type string, not int."},
        Row{"InitWithEmptyName", "init", R"({"name":""})", "'name' is empty."},
        Row{"InitWithLineEnd", "init", R"({"name":"a\nb"})", "'name' holds a control character."},
        Row{"InitWithBlank", "init", R"({"name":"a "})", "'name' begins or ends with a blank."},
        Row{"InitWithShortId", "init", R"({"name":"a","id":"5f"})",
            "'id' must be an identifier of 32 lower-case hexadecimal digits."}),
    support::rowName);

class ServerRequestOfHostileText : public server::ServerTest {};

TEST_F(ServerRequestOfHostileText, IsAnErrorAndNoMore)
{
    std::string deep(100000, '[');
    for (char const* const verb :
         {"init", "commit <id>", "force-commit <id>", "references <id>", "force-references <id>", "fetch <id>"}) {
        for (std::string const& text :
             {deep, deep + std::string(100000, ']'), std::string("null"), std::string("\xFF"), std::string("1e999"),
              std::string("{\"commits\":[{}],\"references\":[[]]}"), std::string(1, '\0')}) {
            std::string const answer = ask(verb, text);
            EXPECT_EQ(answer.rfind("error: ", 0), 0u) << verb << " answered " << answer;
        }
    }
}

TEST_F(ServerRequestOfHostileText, CutOffAnywhereIsAnError)
{
    std::string const whole = server::expanded(commit('a', "", {"plan.dwg 1 old.dwg"}, {"branch main a"}));
    for (std::size_t length = 0; length < whole.size(); ++length) {
        ASSERT_EQ(
            ask("commit <id>", whole.substr(0, length)),
            "error: The document is not valid JSON. Nothing has changed on the server.")
            << "cut at " << length;
    }
}

/// The example below a heading of the description of the protocol, with its blanks taken out.
std::string documented(char const* heading, int number)
{
    return server::shortened(OdString(kutils::json::write_string(
                                          server::parsed(server::example("server-protocol.md", heading, number)), false)
                                          .c_str())
                                 .ansi_str());
}

class DocumentedProtocol : public server::ServerTest {};

TEST_F(DocumentedProtocol, IsTheServers)
{
    EXPECT_EQ(ask("version", ""), documented("## version", 0));
    EXPECT_EQ(ask("commit <id>", documented("## commit", 0)), documented("## commit", 1));
    EXPECT_EQ(ask("references <id>", documented("## references", 0)), documented("## references", 1));
    std::string const id = server::example("server-protocol.md", "## Requests");
    EXPECT_EQ(id, "fetch 5f0c1d2e3b4a59687766554433221100");
    std::string const fetched = documented("## fetch", 1);
    EXPECT_EQ(ask("fetch <id>", documented("## fetch", 0)), server::replaced(fetched, id.substr(6), "<id>"));
    EXPECT_EQ(ask("numbers <id>", R"([{"commitNo":1,"hash":""}])"), documented("## numbers", 0));
    EXPECT_EQ(tav::readHistoryPage(server::wideText(server::expanded(documented("## history", 0)))).size(), 1u);
    EXPECT_EQ(init("bridge").size(), 32u);
    EXPECT_EQ(documented("## init", 0), R"({"name":"bridge"})");
    EXPECT_EQ(documented("## init", 1), R"({"id":"5f0c1d2e3b4a59687766554433221100"})");
    EXPECT_EQ(documented("## repositories", 0), R"([{"id":"5f0c1d2e3b4a59687766554433221100","name":"bridge"}])");
}

} // namespace
