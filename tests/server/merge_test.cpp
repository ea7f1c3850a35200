#include "tests/server/outcome.h"
#include "tests/server/translations.h"

#include "common/mu_common_file_storage.h"

#include "tests/support/recording_io.h"

#include <gmock/gmock.h>
#include <type_traits>

namespace {

using namespace common;
using namespace server;
using support::RecordingIo;
using testing::ElementsAre;
using testing::IsEmpty;

static_assert(std::has_virtual_destructor_v<FileStorage> && std::is_abstract_v<FileStorage>);
static_assert(sizeof(FileStorage) == sizeof(void*), "no data but the table of operations");

/// Answers each merge as it was told and writes the calls down.
class Storage final : public FileStorage {
public:
    explicit Storage(Expected<bool> const& answer) : answer_(answer) {}

    Expected<OdString> store(RootPath const&, OdString const&) override { return called("store"); }
    WriteOutcome restore(RootPath const&, OdString const&, OdString const&) override { return called("restore"); }
    Expected<bool> contains(RootPath const&, OdString const&) override { return called("contains"); }
    WriteOutcome remove(RootPath const&, OdString const&) override { return called("remove"); }
    Expected<std::vector<OdString>> revisions(RootPath const&, OdString const&) override { return called("revisions"); }
    WriteOutcome verify(RootPath const&, OdString const&) override { return called("verify"); }

    Expected<bool> mergeFromStorage(RootPath const& root, OdString const& target, OdString const& url) override
    {
        calls.push_back("merge " + inWords(url) + " into " + inWords(target) + " of " + inWords(root.path()));
        return answer_;
    }

    std::vector<std::string> calls;

private:
    ErrorMessage called(char const* name)
    {
        calls.emplace_back(name);
        return ErrorMessage(L"not to be called");
    }

    Expected<bool> answer_;
};

std::string merged(FileStorage& storage, IoInterface const& io)
{
    WriteOutcome const outcome = storage.merge(L"first", L"second", L"third", L"fourth", RootPath(L"/bridge"), io);
    return outcome.hasValue() ? "success" : inWords(outcome.error());
}

TEST(Merge, AsksTheHostAndMergesTheSecondIntoTheFourth)
{
    Storage storage(true);
    RecordingIo const io;
    EXPECT_EQ(merged(storage, io), "success");
    EXPECT_THAT(io.calls(), ElementsAre("accept first"));
    EXPECT_THAT(storage.calls, ElementsAre("merge second into fourth of /bridge"));
}

TEST(Merge, LeavesTheStorageAloneWhenTheHostDeclines)
{
    Storage storage(ErrorMessage(L"broken"));
    RecordingIo const io(0);
    EXPECT_EQ(merged(storage, io), "success");
    EXPECT_THAT(io.calls(), ElementsAre("accept first"));
    EXPECT_THAT(storage.calls, IsEmpty());
}

TEST(Merge, TakesAnyAnswerButZeroForYes)
{
    for (std::int32_t const answer : {1, 2, -1, 256, 65536}) {
        Storage storage(true);
        EXPECT_EQ(merged(storage, RecordingIo(answer)), "success");
        EXPECT_EQ(storage.calls.size(), 1U) << answer;
    }
}

TEST(Merge, NamesTheVersionThatIsNotInTheStorage)
{
    Storage storage(false);
    EXPECT_EQ(merged(storage, RecordingIo()), "error: Could not find second in the storage");
}

TEST(Merge, GivesTheErrorOfTheStorageOnUnchanged)
{
    ErrorMessage error(L"%ls is broken");
    error.code = 5;
    Storage storage(error);
    EXPECT_EQ(merged(storage, RecordingIo()), "error 5: %ls is broken");
}

TEST(Merge, SpeaksTheLanguageOfTheUser)
{
    Translations const translations({"Could not find %ls in the storage", "second", "broken"});
    Storage storage(false);
    EXPECT_EQ(merged(storage, RecordingIo()), "error: {Could not find second in the storage}");
    Storage broken{ErrorMessage(L"broken")};
    EXPECT_EQ(merged(broken, RecordingIo()), "error: broken");
}

TEST(Merge, DoesNotLookAtTheTexts)
{
    Storage storage(true);
    RecordingIo const io;
    EXPECT_TRUE(storage.merge(L"", L"", L"", L"", RootPath(L""), io).hasValue());
    EXPECT_THAT(io.calls(), ElementsAre("accept "));
    EXPECT_THAT(storage.calls, ElementsAre("merge  into  of "));
}

/// Merges in its own way.
class OwnMerge : public FileStorage {
public:
    Expected<OdString> store(RootPath const&, OdString const&) override { return OdString(L"po1"); }
    WriteOutcome restore(RootPath const&, OdString const&, OdString const&) override { return std::monostate(); }
    Expected<bool> contains(RootPath const&, OdString const&) override { return true; }
    WriteOutcome merge(
        OdString const&, OdString const&, OdString const& third, OdString, RootPath const&, IoInterface const&) override
    {
        return ErrorMessage(third);
    }
    WriteOutcome remove(RootPath const&, OdString const&) override { return std::monostate(); }
    Expected<bool> mergeFromStorage(RootPath const&, OdString const&, OdString const&) override { return true; }
    Expected<std::vector<OdString>> revisions(RootPath const&, OdString const&) override
    {
        return std::vector<OdString>{L"tf:plan#1"};
    }
    WriteOutcome verify(RootPath const&, OdString const&) override { return std::monostate(); }
};

TEST(Merge, MayBeReplacedByTheHost)
{
    std::unique_ptr<FileStorage> const storage = std::make_unique<OwnMerge>();
    EXPECT_EQ(merged(*storage, RecordingIo()), "error: third");
}

TEST(FileStorage, IsDestroyedAsWhatItIs)
{
    class Counted : public OwnMerge {
    public:
        explicit Counted(int& destroyed) : destroyed_(destroyed) {}
        ~Counted() override { ++destroyed_; }

    private:
        int& destroyed_;
    };
    int destroyed = 0;
    std::unique_ptr<FileStorage> storage = std::make_unique<Counted>(destroyed);
    storage.reset();
    EXPECT_EQ(destroyed, 1);
}

} // namespace
