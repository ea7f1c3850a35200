// States of large repositories. Nothing here looks at a clock: what takes quadratic time does not end in time.
#include "tests/state/states.h"
#include "tests/support/utf8.h"

#include <gmock/gmock.h>
#include <string>

namespace {

using namespace states;
using testing::ElementsAre;

constexpr std::size_t kFiles = 100'000;

OdString pathOf(std::size_t number)
{
    return support::fromUtf8("house-" + std::to_string(number % 2'000) + "/drawing-" + std::to_string(number) + ".dwg");
}

TEST(LargeState, TakesIndexRecordsOfAllStagedFilesAndDropsThem)
{
    Repository const repository(R"({"head": {"reference": "master"}})");
    std::shared_ptr<Cache> const cache = repository.open();
    for (std::size_t i = 0; i < kFiles; ++i) {
        cache->write().stagedFiles.emplace_back(pathOf(i), i % 2 == 0 ? FileChange::added : FileChange::modified);
    }
    common::updateIndex(*cache, repository.root());
    EXPECT_EQ(cache->read().index.size(), kFiles);
    for (StagedFile& file : cache->write().stagedFiles) {
        file.change = FileChange::removed;
    }
    common::updateIndex(*cache, repository.root());
    EXPECT_TRUE(cache->read().index.empty());
}

TEST(LargeState, IsSavedAndLoadedWhole)
{
    State state;
    for (std::size_t i = 0; i < kFiles; ++i) {
        state.index[pathOf(i)] = {i, i % 3 == 0};
        if (i % 4 == 0) {
            state.stagedFiles.emplace_back(pathOf(kFiles - i), FileChange::modified);
            state.renames[pathOf(i)] = pathOf(i + 1);
        }
    }
    Repository const repository;
    repository.saved(state);
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
    EXPECT_TRUE(repository.loaded() == inWords(state));
}

/// The room for the text is found out beforehand; one path says little of the others.
TEST(LargeState, IsSavedWhenOnePathIsMuchLongerThanTheOthers)
{
    State state;
    OdString const longPath = support::fromUtf8(std::string(100'000, 'a'));
    state.index[longPath] = {1, false};
    for (std::size_t i = 0; i < kFiles; ++i) {
        state.index[pathOf(i)] = {i, false};
    }
    Repository repository;
    repository.saved(state);
    EXPECT_EQ(repository.open()->read().index.size(), kFiles + 1);
}

TEST(LargeState, IsRolledBackWhole)
{
    State state;
    for (std::size_t i = 0; i < kFiles; ++i) {
        state.index[pathOf(i)] = {i, false};
    }
    Repository const repository;
    Cache cache(repository.root(), state, repository.io());
    {
        Transaction const transaction = cache.getTransaction();
        for (std::size_t i = 0; i < kFiles; ++i) {
            common::removeIndex(pathOf(i), cache);
        }
        EXPECT_TRUE(cache.read().index.empty());
    }
    EXPECT_TRUE(inWords(cache.read()) == inWords(state));
}

} // namespace
