#include "tests/state/states.h"

#include "platform/ut/DateTime.h"

#include <cerrno>
#include <fcntl.h>
#include <gmock/gmock.h>
#include <string>
#include <sys/stat.h>
#include <type_traits>

namespace {

using namespace states;
using common::modifyTime;
using common::openForWrite;
using common::removeIndex;
using common::updateIndex;
using testing::IsEmpty;

constexpr std::uint64_t kSecond = 1'000'000'000;

/// A state file of one record, which is marked.
std::string const kOneRecord =
    R"({"head": {"reference": "master"}, "index": [{"data": {"last_checked": 1, "modified": true}, "path": "a.dwg"}]})";

class Index : public testing::Test {
protected:
    Index() : repository_(kOneRecord), cache_(repository_.open()) {}

    /// Makes the file or changes its time of modification.
    void touch(std::string const& name, std::int64_t seconds, long nanoseconds) const
    {
        if (!repository_.has(name)) {
            repository_.write(name, "drawing");
        }
        timespec const times[] = {{11, 22}, {static_cast<time_t>(seconds), nanoseconds}};
        ASSERT_EQ(utimensat(AT_FDCWD, repository_.pathTo(name).c_str(), times, 0), 0) << errno;
    }

    void stage(std::vector<StagedFile> const& files) const { cache_->write().stagedFiles = files; }

    std::string words() const
    {
        State state = cache_->read();
        state.stagedFiles.clear();
        return inWords(state);
    }

    /// Whether the cache writes its state when it goes.
    bool isChanged()
    {
        cache_.reset();
        return !repository_.calls().empty();
    }

    Repository const repository_;
    std::shared_ptr<Cache> cache_;
};

TEST_F(Index, TimeIsThatOfTheModificationInNanoseconds)
{
    touch("sub/pl\xC3\xA4ne.dwg", 1'700'000'000, 123'456'789);
    EXPECT_EQ(modifyTime(L"sub/pl\u00E4ne.dwg", repository_.root()), 1'700'000'000 * kSecond + 123'456'789);
}

TEST_F(Index, TimeOfAnUnchangedFileStays)
{
    repository_.write("b.dwg", "drawing");
    std::uint64_t const time = modifyTime(L"b.dwg", repository_.root());
    EXPECT_GT(time, 1'700'000'000 * kSecond);
    repository_.read("b.dwg");
    EXPECT_EQ(modifyTime(L"b.dwg", repository_.root()), time);
}

TEST_F(Index, TimeOfAFileThatIsNotThereIsThatOfAnUnsetDate)
{
    EXPECT_EQ(modifyTime(L"missing.dwg", repository_.root()), 0U);
    EXPECT_EQ(static_cast<std::uint64_t>(ut::DateTime().getTicks()), 0U);
}

TEST_F(Index, TimeOfAFileThatCannotBeExaminedIsThatOfAnUnsetDate)
{
    repository_.makeLink("dangling.dwg", "nowhere");
    touch("b.dwg", 5, 0);
    EXPECT_EQ(modifyTime(L"dangling.dwg", repository_.root()), 0U);
    EXPECT_EQ(modifyTime(L"b.dwg/c.dwg", repository_.root()), 0U);
    EXPECT_EQ(modifyTime(OdString(L"b.dwg\0", 6), repository_.root()), 0U);
}

TEST_F(Index, TimeBefore1970IsKeptInItsBits)
{
    touch("old.dwg", -1, 0);
    EXPECT_EQ(modifyTime(L"old.dwg", repository_.root()), 0 - kSecond);
}

TEST_F(Index, OfAFileWithoutRecordGetsOne)
{
    touch("b.dwg", 5, 7);
    updateIndex(L"b.dwg", *cache_, repository_.root());
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 1 modified\nindex b.dwg 5000000007\n");
    EXPECT_TRUE(isChanged());
}

TEST_F(Index, RecordIsRefreshedAndUnmarked)
{
    touch("a.dwg", 5, 7);
    updateIndex(L"a.dwg", *cache_, repository_.root());
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 5000000007\n");
    EXPECT_TRUE(isChanged());
}

TEST_F(Index, OfAMissingFileHoldsTheTimeOfAnUnsetDate)
{
    updateIndex(L"a.dwg", *cache_, repository_.root());
    updateIndex(L"missing.dwg", *cache_, repository_.root());
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 0\nindex missing.dwg 0\n");
}

TEST_F(Index, RefreshedToWhatItWasMakesTheCacheChanged)
{
    touch("a.dwg", 0, 1);
    cache_->write().index[L"a.dwg"] = {1, false};
    cache_.reset();
    cache_ = repository_.open();
    std::size_t const calls = repository_.calls().size();
    updateIndex(L"a.dwg", *cache_, repository_.root());
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 1\n");
    cache_.reset();
    EXPECT_EQ(repository_.calls().size(), calls + 1);
}

TEST_F(Index, TakesPathsThatAreItsOwnKeys)
{
    touch("a.dwg", 5, 0);
    updateIndex(cache_->read().index.begin()->first, *cache_, repository_.root());
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 5000000000\n");
    removeIndex(cache_->read().index.begin()->first, *cache_);
    EXPECT_EQ(words(), "HEAD master\n");
}

TEST_F(Index, RecordIsRemoved)
{
    removeIndex(L"a.dwg", *cache_);
    EXPECT_EQ(words(), "HEAD master\n");
    EXPECT_TRUE(isChanged());
}

TEST_F(Index, RemovalWithoutARecordMakesTheCacheChangedAllTheSame)
{
    removeIndex(L"A.dwg", *cache_);
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 1 modified\n");
    EXPECT_TRUE(isChanged());
}

TEST_F(Index, OfAllStagedFilesWithoutAnyLeavesTheCacheUnchanged)
{
    touch("a.dwg", 5, 0);
    updateIndex(*cache_, repository_.root());
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 1 modified\n");
    EXPECT_FALSE(isChanged());
    EXPECT_EQ(repository_.stateFile(), kOneRecord);
}

TEST_F(Index, OfAllStagedFilesGetsRecordsForAddedAndModified)
{
    touch("a.dwg", 5, 0);
    touch("b.dwg", 6, 0);
    stage({{L"b.dwg", FileChange::added}, {L"a.dwg", FileChange::modified}});
    updateIndex(*cache_, repository_.root());
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 5000000000\nindex b.dwg 6000000000\n");
}

TEST_F(Index, OfAllStagedFilesMakesTheCacheChanged)
{
    repository_.writeState(
        R"({"head": {"reference": "master"}, "staged_files": [{"file_change": "removed", "path": "no.dwg"}]})");
    cache_ = repository_.open();
    updateIndex(*cache_, repository_.root());
    EXPECT_TRUE(isChanged());
}

TEST_F(Index, LosesTheRecordOfAFileStagedAsRemovedThatStillExists)
{
    touch("a.dwg", 5, 0);
    stage({{L"a.dwg", FileChange::removed}});
    updateIndex(*cache_, repository_.root());
    EXPECT_EQ(words(), "HEAD master\n");
    EXPECT_TRUE(repository_.has("a.dwg"));
}

TEST_F(Index, OfAPathStagedTwiceGoesByTheLastEntry)
{
    touch("a.dwg", 5, 0);
    touch("b.dwg", 6, 0);
    stage(
        {{L"a.dwg", FileChange::removed},
         {L"b.dwg", FileChange::added},
         {L"a.dwg", FileChange::added},
         {L"b.dwg", FileChange::removed}});
    updateIndex(*cache_, repository_.root());
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 5000000000\n");
}

TEST_F(Index, OfAllStagedFilesLeavesThemStaged)
{
    stage({{L"a.dwg", FileChange::removed}, {L"b.dwg", FileChange::added}});
    updateIndex(*cache_, repository_.root());
    EXPECT_EQ(inWords(cache_->read()), "HEAD master\nstaged removed a.dwg\nstaged added b.dwg\nindex b.dwg 0\n");
}

TEST_F(Index, PositionOpenedForWriteIsTheSameAndMakesTheCacheChanged)
{
    auto const position = cache_->read().index.find(L"a.dwg");
    auto const writable = openForWrite(position, *cache_);
    EXPECT_EQ(&writable->second, &position->second);
    EXPECT_TRUE((std::is_same_v<decltype(openForWrite(position, *cache_)), std::map<OdString, IndexData>::iterator>));
    writable->second = {9, false};
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 9\n");
    EXPECT_TRUE(isChanged());
    EXPECT_EQ(repository_.loaded(), "HEAD master\nindex a.dwg 9\n");
}

TEST_F(Index, PositionOpenedForWriteWithoutAChangeMakesTheCacheChanged)
{
    openForWrite(cache_->read().index.begin(), *cache_);
    EXPECT_TRUE(isChanged());
}

TEST_F(Index, EndOpenedForWriteIsTheEnd)
{
    EXPECT_EQ(openForWrite(cache_->read().index.end(), *cache_), cache_->write().index.end());
}

TEST_F(Index, TimeAloneLeavesTheCacheUnchanged)
{
    modifyTime(L"a.dwg", repository_.root());
    EXPECT_FALSE(isChanged());
}

TEST_F(Index, ChangesInsideATransactionAreUndone)
{
    stage({{L"b.dwg", FileChange::added}});
    {
        Transaction const transaction = cache_->getTransaction();
        updateIndex(*cache_, repository_.root());
        updateIndex(L"c.dwg", *cache_, repository_.root());
        removeIndex(L"a.dwg", *cache_);
        openForWrite(cache_->read().index.find(L"b.dwg"), *cache_)->second.modified = true;
        EXPECT_EQ(words(), "HEAD master\nindex b.dwg 0 modified\nindex c.dwg 0\n");
    }
    EXPECT_EQ(words(), "HEAD master\nindex a.dwg 1 modified\n");
}

} // namespace
