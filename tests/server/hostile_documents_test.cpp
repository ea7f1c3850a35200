#include "tests/server/outcome.h"
#include "tests/support/allocations.h"

#include "tests/support/small_stack.h"
#include "tests/support/utf8.h"

namespace {

using namespace common;
using namespace server;

/// `count` commits of `files` files each. Every object and array carries `ballast` that no reader asks for.
Object largeFetch(std::size_t count, std::size_t files, std::wstring const& ballast)
{
    auto const loaded = [&](std::string_view text) {
        Object result = object(text);
        result[L"ballast"] = ballast;
        return result;
    };
    Object commit = loaded(R"({"hash": "0123456789abcdef", "commitNo": 7, "parentsHashes": ["p"]})");
    commit[L"annotation"] = loaded(R"({"author": "ann", "date": 1.5, "message": "why"})");
    commit[L"files"] = Array(files, loaded(R"({"path": "house/plan.dwg", "storagePath": "tf:plan#1"})"));
    Object fetch = loaded(R"({"references": []})");
    fetch[L"repository"] = loaded(R"({"id": "42", "name": "bridge"})");
    Object reference = loaded(R"({"commitHash": "a", "name": "z", "refType": "tag"})");
    reference[L"annotation"] = commit[L"annotation"];
    fetch[L"references"] = Array(10, reference);
    fetch[L"commits"] = Array(count, commit);
    return fetch;
}

TEST(LargeFetch, IsReadWhole)
{
    Object const document = largeFetch(10'000, 20, L"");
    Expected<FetchData> const data = deserializeFetchData(document);
    ASSERT_TRUE(data.hasValue()) << inWords(data.error());
    ASSERT_EQ(data.value().commits.size(), 10'000U);
    for (Commit const& commit : data.value().commits) {
        ASSERT_EQ(commit.files.size(), 20U);
    }
    EXPECT_EQ(inWords(data.value().commits.back().files.back()), "house/plan.dwg in tf:plan#1");
}

TEST(LargeFetch, IsReadWithoutACopyOfAnyObjectOrArray)
{
    std::wstring const ballast(10'000, L'x');
    Object const document = largeFetch(100, 20, ballast);
    support::WatchedMemory const memory;
    ASSERT_TRUE(deserializeFetchData(document).hasValue());
    std::size_t const ballastOfOneInTen = (100 * 22 + 22) / 10 * ballast.size() * sizeof(wchar_t);
    EXPECT_LT(memory.asked(), ballastOfOneInTen);
    EXPECT_GT(memory.asked(), 100 * 20 * sizeof(L"house/plan.dwg")) << "the library's are not counted";
}

TEST(LargeFetch, ReadsEachKindOfObjectWithoutACopy)
{
    std::wstring const ballast(1'000'000, L'x');
    Object const document = largeFetch(1, 1, ballast);
    support::WatchedMemory const memory;
    ASSERT_TRUE(deserializeFetchData(document).hasValue());
    EXPECT_LT(memory.asked(), ballast.size());
}

TEST(LargeCommit, IsWrittenWithoutACopyOfItsTexts)
{
    OdString const text(std::wstring(1'000'000, L'x').c_str(), 1'000'000);
    std::size_t const sizeOfText = text.getLength() * sizeof(wchar_t);
    CommitInfo info;
    info.files.emplace_back(text, L"po1");
    info.message = text;
    support::WatchedMemory const memory;
    Value const document = serializeCommitInfo(info);
    EXPECT_LT(memory.asked(), 3 * sizeOfText) << "two texts go into the document, and no part of it moves twice";
    EXPECT_EQ(document.type(), Value_type::object);
}

TEST(GiganticArray, IsReadToItsEnd)
{
    Array parents(1'000'000, Value(L"p"));
    EXPECT_EQ(deserializeParentHashes(parents).value().size(), 1'000'000U);
    parents.back() = 5;
    EXPECT_EQ(
        outcomeOf([&] { return deserializeParentHashes(parents); }),
        "error: Could not parse parent hash, int type found.");
}

TEST(GiganticArray, OfWrongElementsEndsAtTheFirst)
{
    std::string text = "[0";
    for (int i = 0; i < 1'000'000; ++i) {
        text += ",0";
    }
    OdString const document = support::fromUtf8(text + "]");
    EXPECT_EQ(outcomeOf([&] { return deserializeReferences(document); }), noObject("int"));
}

std::string nested(std::size_t depth, char open, char close)
{
    return std::string(depth, open) + std::string(depth, close);
}

TEST(NestedDocument, IsRefusedOnASmallStack)
{
    OdString const arrays = support::fromUtf8(nested(200'000, '[', ']'));
    OdString const openArrays = support::fromUtf8(std::string(200'000, '['));
    std::string outcomes;
    support::onSmallStack([&] {
        outcomes += outcomeOf([&] { return deserializeReferences(arrays); }) + "\n";
        outcomes += outcomeOf([&] { return deserializeRepoData(arrays); }) + "\n";
        outcomes += outcomeOf([&] { return deserializeRepoDatas(openArrays); }) + "\n";
        outcomes += outcomeOf([&] { return deserializeServerVersion(openArrays); });
    });
    EXPECT_EQ(
        outcomes, noObject("array") + "\n" + mismatch("object", "array", "") + "\n" + mismatch("array", "null", "") +
                      "\n" + mismatch("object", "null", ""));
}

TEST(NestedMember, IsPassedOverOnASmallStack)
{
    std::string const deep = nested(200'000, '[', ']');
    std::string const reference = R"({"commitHash": "a", "name": "z", "refType": "tag", "annotation": )";
    Object const inArray = object(reference + deep + "}");
    Object const inObject = object(reference + R"({"author": "ann", "date": 1.0, "more": )" + deep + "}}");
    Object const inFile = object(R"({"path": "a", "storagePath": "b", "previousPath": )" + deep + "}");
    std::string outcomes;
    support::onSmallStack([&] {
        outcomes += outcomeOf([&] { return deserializeReference(inArray); }) + "\n";
        outcomes += outcomeOf([&] { return deserializeReference(inObject); }) + "\n";
        outcomes += outcomeOf([&] { return deserializeRepoFile(inFile, {}); });
    });
    EXPECT_EQ(outcomes, "tag z -> a\ntag z -> a\n" + mismatch("string", "array", ""));
}

} // namespace
