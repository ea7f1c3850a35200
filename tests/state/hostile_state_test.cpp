// State files that nothing of ours has written.
#include "tests/state/golden.h"
#include "tests/state/states.h"

#include "tests/support/small_stack.h"

#include <gmock/gmock.h>
#include <string>
#include <unistd.h>

namespace {

using namespace states;
using testing::AnyOf;
using testing::IsEmpty;
using testing::StartsWith;

/// A document of all parts that loads.
std::string wholeDocument()
{
    std::string document = golden("full.json");
    std::string const commit = "        \"commit\" : 17,\n";
    return document.erase(document.find(commit), commit.size());
}

/// What a repository comes to that has this state file; the file stays as it is.
std::string loadedUntouched(Repository const& repository, std::string const& document)
{
    unlink(repository.statePath().c_str()); // Some file systems flush a file that is written anew in its place.
    repository.writeState(document);
    std::string const outcome = repository.loaded();
    return repository.stateFile() == document ? outcome : "another file";
}

std::string repeated(std::string const& text, std::size_t count)
{
    std::string result;
    for (std::size_t i = 0; i < count; ++i) {
        result += text;
    }
    return result;
}

TEST(HostileState, CutOffAnywhereIsRefused)
{
    std::string const whole = wholeDocument();
    Repository const repository(whole);
    ASSERT_THAT(repository.loaded(), StartsWith("HEAD feature\n"));
    for (std::size_t length = 0; length < whole.size(); ++length) {
        ASSERT_EQ(loadedUntouched(repository, whole.substr(0, length)), kNoJson) << "cut at " << length;
    }
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(HostileState, WithAnyCharacterChangedLoadsOrIsRefused)
{
    std::string const whole = wholeDocument();
    Repository const repository;
    for (std::size_t i = 0; i < whole.size(); ++i) {
        for (char const c : {'\0', '"', '}', ']', '9', '\x80'}) {
            std::string document = whole;
            document[i] = c;
            ASSERT_THAT(loadedUntouched(repository, document), AnyOf(StartsWith("HEAD "), StartsWith("error: ")))
                << document;
        }
    }
    EXPECT_THAT(repository.calls(), IsEmpty());
}

/// Where a document can nest: in members that nobody reads, in those of another type, and instead of the document.
TEST(HostileState, NestedDeeplyIsAnsweredOnASmallStack)
{
    std::string const opened = repeated("[", 200'000);
    std::string const deep = opened + repeated("]", 200'000);
    std::string const deepObjects = repeated("{\"head\":", 200'000) + "1" + repeated("}", 200'000);
    std::string outcomes;
    support::onSmallStack([&] {
        Repository const repository;
        for (std::string const& document :
             {R"({"head": {"reference": "a"}, "more": )" + deep + "}",
              R"({"head": {"reference": "a", "more": )" + deep + "}}",
              R"({"head": {"reference": "a"}, "index": )" + deep + "}", R"({"head": {"reference": )" + deep + "}}",
              R"({"head": {"reference": "a"}, "renames": )" + opened, deep, deepObjects}) {
            repository.writeState(document);
            outcomes += repository.loaded() + "\n";
        }
    });
    EXPECT_EQ(
        outcomes, "HEAD a\n\nHEAD a\n\nerror: Encounterd 'object', found 'array. While parsing json map.'\n" +
                      mismatch("string", "array", "reference") + "\n" + kNoJson + "\n" +
                      mismatch("object", "array", "") + "\nerror: HEAD does not point to a branch\n");
}

TEST(HostileState, HugeNumbersAreAnswered)
{
    std::string const digits = repeated("9", 100'000);
    auto const outcome = [](std::string const& number) {
        std::string const entry = R"({"data": {"last_checked": )" + number + R"(, "modified": false}, "path": "a"})";
        return Repository(R"({"head": {"reference": "a"}, "index": [)" + entry + "]}").loaded();
    };
    EXPECT_EQ(outcome(digits), "HEAD a\nindex a 18446744073709551615\n");
    EXPECT_EQ(outcome("-" + digits), "HEAD a\nindex a 9223372036854775808\n");
    EXPECT_EQ(outcome(digits + ".0"), mismatch("int", "real", "last_checked"));
    EXPECT_EQ(outcome("1e" + digits), mismatch("int", "real", "last_checked"));
    EXPECT_EQ(outcome("0." + digits), mismatch("int", "real", "last_checked"));
    EXPECT_EQ(outcome("0" + digits), kNoJson);
    EXPECT_EQ(outcome("-"), kNoJson);
    EXPECT_EQ(outcome("+1"), kNoJson);
    EXPECT_EQ(outcome("NaN"), kNoJson);
    EXPECT_EQ(outcome("0x1"), kNoJson);
}

TEST(HostileState, LongTextsAreKeptWhole)
{
    std::string const name = repeated("0123456789abcdef", 100'000);
    Repository const repository(R"({"head": {"reference": ")" + name + R"("}})");
    EXPECT_EQ(repository.loaded(), "HEAD " + name + "\n");
}

TEST(HostileState, MessagesHoldTextsOfTheDocumentWhole)
{
    std::string const change = repeated("%ls %n %s ", 10'000);
    Repository const repository(
        R"({"head": {"reference": "a"}, "staged_files": [{"file_change": ")" + change + "\"}]}");
    EXPECT_EQ(repository.loaded(), "error: Unsupported file change enum: " + change);
}

TEST(HostileState, RepeatedMembersAndEntriesAreAnsweredInTime)
{
    std::string const entry = R"({"data": {"last_checked": 1, "modified": false}, "path": "a"},)";
    std::string const heads = repeated(R"("head": {"reference": "a"}, )", 10'000);
    Repository const repository("{" + heads + R"("index": [)" + repeated(entry, 100'000) + "]}");
    EXPECT_EQ(repository.loaded(), "HEAD a\nindex a 1\n");
}

TEST(HostileState, FileOfNulsIsRefused)
{
    EXPECT_EQ(Repository(std::string(1'000'000, '\0')).loaded(), kNoJson);
}

/// What loads can be saved, and then loads again.
TEST(HostileState, OddTextsSurviveSaving)
{
    Repository const repository(
        "{\"head\": {\"reference\": \"\\u0000\x01\\ud800\\udfff\xFF\xC3\"}, \"renames\": [{\"new\": "
        "\"\xED\xA0\x80\", \"previous\": \"\xF0\x9F\x98\"}]}");
    std::string const before = repository.loaded();
    ASSERT_THAT(before, StartsWith("HEAD "));
    repository.open()->write();
    EXPECT_EQ(repository.loaded(), before);
}

} // namespace
