#include "tests/server/examples.h"
#include "tests/server/outcome.h"
#include "tests/server/test_clock.h"
#include "tests/support/utf8.h"

#include <memory>

namespace {

using namespace common;
using namespace server;

/// The example of a document that docs/formats/server-documents.md gives.
std::string documented(char const* title)
{
    return example("server-documents.md", std::string("## ") + title);
}

TEST(DocumentedExample, OfAReference)
{
    EXPECT_EQ(outcomeOf([] { return deserializeReference(object(documented("Reference"))); }), "branch main -> 4f0a");
}

TEST(DocumentedExample, OfReferences)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeReferences(support::fromUtf8(documented("References"))); }),
        "[branch main -> 4f0a, tag as built -> 11c2]");
}

TEST(DocumentedExample, OfARepository)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeRepoData(support::fromUtf8(documented("Repository"))); }), "bridge is 42 ''");
}

TEST(DocumentedExample, OfRepositories)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeRepoDatas(support::fromUtf8(documented("Repositories"))); }),
        "[bridge is 42 '', house is 43 '']");
}

TEST(DocumentedExample, OfAnAnnotation)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeAnnotation(object(documented("Annotation"))); }),
        "ann@example.org said 'moves the stairs' at 1709647629");
}

TEST(DocumentedExample, OfACommitFile)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeRepoFile(object(documented("Commit file")), {}); }),
        "house/plan.dwg in tf:plan#7");
}

TEST(DocumentedExample, OfParentHashes)
{
    EXPECT_EQ(outcomeOf([] { return deserializeParentHashes(array(documented("Parent hashes"))); }), "[4f0a, 11c2]");
}

TEST(DocumentedExample, OfACommit)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeCommit(object(documented("Commit"))); }),
        "12 4f0a of [11c2]: ann@example.org said 'moves the stairs' at 1709647629 [house/plan.dwg in tf:plan#7]");
}

TEST(DocumentedExample, OfACommitInfo)
{
    CommitInfo info;
    info.files.emplace_back(L"house/plan.dwg", L"tf:plan#7", std::make_unique<BaseFile>(L"house/draft.dwg"));
    info.files.emplace_back(L"notes.txt", L"po1");
    info.references.emplace_back(L"main", L"4f0a", EType::branch);
    info.parents = {L"11c2"};
    info.hash = L"4f0a";
    info.author = L"ann@example.org";
    info.message = L"moves the stairs";
    TestClock const clock(1709647629000);
    EXPECT_EQ(pretty(serializeCommitInfo(info)), documented("Commit info"));
}

TEST(DocumentedExample, OfAFetch)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeFetchData(object(documented("Fetch"))); }),
        "bridge is 42 ''; commits [12 4f0a of []: ann@example.org said '' at 1709647629 []]; "
        "references [branch main -> 4f0a]");
}

TEST(DocumentedExample, OfCommitNumbers)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeCommitNumbers(array(documented("Commit numbers"))); }),
        "[4f0a is 12, 11c2 is 11]");
}

TEST(DocumentedExample, OfTheAnswerToMakingARepository)
{
    EXPECT_EQ(outcomeOf([] { return deserializeInitData(object(documented("Init"))); }), "42");
}

TEST(DocumentedExample, OfAServerVersion)
{
    EXPECT_EQ(
        outcomeOf([] { return deserializeServerVersion(support::fromUtf8(documented("Server version"))); }), "1.2");
}

} // namespace
