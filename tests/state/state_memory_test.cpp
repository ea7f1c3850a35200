// What states cost in memory, and what happens when there is none.
#include "tests/state/golden.h"
#include "tests/state/states.h"

#include "tests/server/translations.h"
#include "tests/support/allocations.h"
#include "tests/support/utf8.h"

#include <gmock/gmock.h>
#include <new>
#include <string>

namespace {

using namespace states;
using support::FailingAllocation;
using testing::ElementsAre;

constexpr std::uint64_t kFiles = 20'000;

State largeState()
{
    State state;
    for (std::uint64_t i = 0; i < kFiles; ++i) {
        std::string const number = std::to_string(i);
        state.index[support::fromUtf8(
            "houses/block-" + std::to_string(i % 2'000) + "/ground-floor-" + number + ".dwg")] = {
            1'700'000'000'123'456'789 + i, false};
    }
    return state;
}

class MemoryOfLargeState : public testing::Test {
protected:
    MemoryOfLargeState()
    {
        repository_.saved(largeState());
        fileSize_ = repository_.stateFile().size();
    }

    Repository const repository_;
    std::size_t fileSize_ = 0;
};

TEST_F(MemoryOfLargeState, ForLoadingIsAFewTimesTheFile)
{
    support::WatchedMemory const memory;
    ASSERT_EQ(repository_.open()->read().index.size(), kFiles);
    RecordProperty("times_the_file_in_percent", std::to_string(100 * memory.peak() / fileSize_));
    EXPECT_LT(memory.peak(), 7 * fileSize_);
}

TEST_F(MemoryOfLargeState, ForSavingIsAFewTimesTheFile)
{
    std::shared_ptr<Cache> cache = repository_.open();
    cache->write();
    support::WatchedMemory const memory;
    cache.reset();
    RecordProperty("times_the_file_in_percent", std::to_string(100 * memory.peak() / fileSize_));
    EXPECT_LT(memory.peak(), 12 * fileSize_);
}

std::string const kOld = golden("escaped.json");
std::string const kNew = "{\n    \"head\" : {\n        \"reference\" : \"a branch whose name needs memory\"\n    }\n}";

/// The report itself always finds memory.
class ThriftyIo final : public common::IoInterface {
public:
    explicit ThriftyIo(support::RecordingIo const& io) : io_(io) {}

    std::int32_t accept(OdString const& /*path*/) const override { return 0; }
    void report(WriteOutcome const& outcome) const override
    {
        FailingAllocation::pause();
        io_.report(outcome);
    }

private:
    support::RecordingIo const& io_;
};

TEST(ScarceMemory, LeavesTheOldOrTheNewStateAndOneReportWheneverItRunsOutInSaving)
{
    constexpr char const* kLibrarysOwn =
        "report error: An unexpected error occurred while deserializing the state file.";
    int exceptions = 0;
    bool more = true;
    for (long n = 0; more; ++n) {
        SCOPED_TRACE(n);
        Repository const repository(kOld);
        ThriftyIo const io(repository.io());
        State state;
        state.head = L"a branch whose name needs memory";
        auto cache = std::make_unique<Cache>(repository.root(), state, io);
        cache->write();
        {
            FailingAllocation const failing(n);
            cache.reset();
        }
        more = FailingAllocation::hasFailed();
        ASSERT_EQ(repository.calls().size(), 1U);
        std::string const told = repository.calls().front();
        EXPECT_EQ(told, more ? kLibrarysOwn : "report success");
        EXPECT_EQ(repository.stateFile(), more ? kOld : kNew);
        Cache(repository.root(), repository.io()).write();
        EXPECT_THAT(repository.list(), ElementsAre(".tav/", ".tav/tav.state"));
        exceptions += more ? 1 : 0;
    }
    EXPECT_GT(exceptions, 10);
}

TEST(ScarceMemory, InSavingIsReportedInTheUsersLanguage)
{
    server::Translations const translations({"An unexpected error occurred while deserializing the state file."});
    Repository const repository(kOld);
    ThriftyIo const io(repository.io());
    auto cache = std::make_unique<Cache>(repository.root(), io);
    FailingAllocation const failing(0);
    cache.reset();
    EXPECT_THAT(
        repository.calls(),
        ElementsAre("report error: {An unexpected error occurred while deserializing the state file.}"));
}

/// What is no `OdError` passes through.
TEST(ScarceMemory, IsThrownByLoadingWhichChangesNothing)
{
    Repository const repository(kOld);
    std::string const expected = repository.loaded();
    int exceptions = 0;
    bool more = true;
    for (long n = 0; more; ++n) {
        std::string outcome;
        try {
            FailingAllocation const failing(n);
            Expected<std::shared_ptr<Cache>> const cache = repository.load();
            FailingAllocation::pause();
            outcome = inWords(cache);
        } catch (std::bad_alloc const&) {
            outcome = "no memory";
            ++exceptions;
        }
        more = FailingAllocation::hasFailed();
        std::string const noMemory =
            "error: Could not read file '" + repository.statePath() + "': Cannot allocate memory";
        EXPECT_TRUE(outcome == (more ? "no memory" : expected) || (more && outcome == noMemory))
            << n << ": " << outcome;
        ASSERT_EQ(repository.stateFile(), kOld) << n;
    }
    EXPECT_GT(exceptions, 10);
    EXPECT_TRUE(repository.calls().empty());
}

} // namespace
