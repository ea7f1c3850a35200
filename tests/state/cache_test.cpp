#include "tests/state/states.h"

#include <gmock/gmock.h>
#include <string>
#include <type_traits>

namespace {

using namespace states;
using testing::ElementsAre;
using testing::IsEmpty;

std::string const kFresh = "{\n    \"head\" : {\n        \"reference\" : \"master\"\n    }\n}";
/// Loads like the fresh document, but is not what the library writes.
std::string const kByHand = R"({"head": {"reference": "master"}})";

std::string headDocument(std::string const& branch)
{
    return "{\n    \"head\" : {\n        \"reference\" : \"" + branch + "\"\n    }\n}";
}

TEST(Cache, IsNeitherCopiedNorMoved)
{
    EXPECT_FALSE(std::is_copy_constructible_v<Cache>);
    EXPECT_FALSE(std::is_copy_assignable_v<Cache>);
    EXPECT_FALSE(std::is_move_constructible_v<Cache>);
    EXPECT_FALSE(std::is_move_assignable_v<Cache>);
}

TEST(Cache, OfARepositoryWithoutStateFileIsRefused)
{
    Repository const repository;
    EXPECT_EQ(repository.loaded(), "error: No state file found at " + repository.statePath());
    EXPECT_THAT(repository.list(), ElementsAre(".tav/"));
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(Cache, OfAFolderThatIsNoRepositoryIsRefused)
{
    support::TempFolder const folder;
    support::RecordingIo const io;
    common::RootPath const root(folder.widePathTo("100%ls/plans"));
    EXPECT_EQ(
        inWords(Cache::get(root, io)), "error: No state file found at " + folder.pathTo("100%ls/plans/.tav/tav.state"));
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST(Cache, IsUnchangedWhenLoaded)
{
    Repository const repository(kByHand);
    repository.open();
    EXPECT_EQ(repository.stateFile(), kByHand);
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(Cache, ThatWasOnlyReadWritesAndReportsNothing)
{
    Repository const repository(kByHand);
    {
        std::shared_ptr<Cache> const cache = repository.open();
        EXPECT_EQ(inWords(cache->read()), "HEAD master\n");
    }
    EXPECT_EQ(repository.stateFile(), kByHand);
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(Cache, IsWrittenAfterWriteEvenWithoutAChange)
{
    Repository const repository(kByHand);
    repository.open()->write();
    EXPECT_EQ(repository.stateFile(), kFresh);
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
}

TEST(Cache, WritesWhenItGoesAndNotBefore)
{
    Repository const repository(kByHand);
    std::shared_ptr<Cache> cache = repository.open();
    cache->write().head = L"roof";
    EXPECT_EQ(cache->read().head, OdString(L"roof"));
    EXPECT_EQ(&cache->read(), &cache->write());
    EXPECT_EQ(repository.stateFile(), kByHand);
    EXPECT_THAT(repository.calls(), IsEmpty());
    cache.reset();
    EXPECT_EQ(repository.stateFile(), headDocument("roof"));
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
}

TEST(Cache, IsWrittenOnceByTheLastOwner)
{
    Repository const repository(kByHand);
    std::shared_ptr<Cache> first = repository.open();
    std::shared_ptr<Cache> second = first;
    first->write();
    first.reset();
    EXPECT_EQ(repository.stateFile(), kByHand);
    second.reset();
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
}

TEST(Cache, StaysChangedWhateverFollows)
{
    Repository const repository(kByHand);
    {
        std::shared_ptr<Cache> const cache = repository.open();
        cache->write();
        cache->getTransaction().commit();
        cache->read();
    }
    EXPECT_EQ(repository.stateFile(), kFresh);
}

TEST(Cache, MadeOfAStateIsUnchanged)
{
    Repository const repository;
    State state;
    state.head = L"roof";
    {
        Cache const cache(repository.root(), state, repository.io());
        EXPECT_EQ(inWords(cache.read()), "HEAD roof\n");
    }
    EXPECT_THAT(repository.list(), ElementsAre(".tav/"));
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(Cache, MadeOfNothingIsFreshAndChanged)
{
    Repository const repository;
    {
        Cache const cache(repository.root(), repository.io());
        EXPECT_EQ(inWords(cache.read()), "HEAD master\n");
        EXPECT_THAT(repository.list(), ElementsAre(".tav/"));
    }
    EXPECT_EQ(repository.stateFile(), kFresh);
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
}

TEST(Cache, TellsTheHostItWasGiven)
{
    Repository const repository(kByHand);
    support::RecordingIo const other;
    Cache::get(repository.root(), other).value()->write();
    EXPECT_THAT(other.calls(), ElementsAre("report success"));
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(Cache, CreatedIsLoadedFresh)
{
    Repository const repository;
    Cache::create(repository.root(), repository.io());
    EXPECT_EQ(repository.stateFile(), kFresh);
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
    EXPECT_THAT(repository.list(), ElementsAre(".tav/", ".tav/tav.state"));
    EXPECT_EQ(repository.loaded(), "HEAD master\n");
}

class CreateOverWhatIsThere : public testing::TestWithParam<std::string> {};

INSTANTIATE_TEST_SUITE_P(
    Documents, CreateOverWhatIsThere, testing::Values("", "no JSON", kByHand, headDocument("roof")));

TEST_P(CreateOverWhatIsThere, ChangesAndReportsNothing)
{
    Repository const repository(GetParam());
    Cache::create(repository.root(), repository.io());
    EXPECT_EQ(repository.stateFile(), GetParam());
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(Create, LeavesAnEntryOfAnotherKindAlone)
{
    Repository const repository;
    repository.makeFolder(".tav/tav.state");
    Cache::create(repository.root(), repository.io());
    EXPECT_THAT(repository.list(), ElementsAre(".tav/", ".tav/tav.state/"));
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(Caches, OfOneRepositoryAreIndependent)
{
    Repository const repository(kByHand);
    std::shared_ptr<Cache> const first = repository.open();
    std::shared_ptr<Cache> const second = repository.open();
    EXPECT_NE(first, second);
    first->write().head = L"roof";
    EXPECT_EQ(inWords(second->read()), "HEAD master\n");
    EXPECT_EQ(inWords(repository.open()->read()), "HEAD master\n");
}

TEST(Caches, TheOneThatGoesLastWins)
{
    for (bool const firstGoesLast : {false, true}) {
        Repository const repository(kByHand);
        std::shared_ptr<Cache> first = repository.open();
        std::shared_ptr<Cache> second = repository.open();
        first->write().head = L"first";
        second->write().head = L"second";
        (firstGoesLast ? second : first).reset();
        (firstGoesLast ? first : second).reset();
        EXPECT_EQ(repository.stateFile(), headDocument(firstGoesLast ? "first" : "second"));
        EXPECT_THAT(repository.calls(), ElementsAre("report success", "report success"));
    }
}

TEST(Caches, AnUnchangedOneThatGoesLastLosesNothing)
{
    Repository const repository(kByHand);
    std::shared_ptr<Cache> const unchanged = repository.open();
    repository.open()->write().head = L"roof";
    EXPECT_EQ(repository.stateFile(), headDocument("roof"));
}

TEST(Caches, LoadTheFileAnewEachTime)
{
    Repository const repository(kByHand);
    std::shared_ptr<Cache> const before = repository.open();
    repository.writeState(headDocument("roof"));
    EXPECT_EQ(repository.loaded(), "HEAD roof\n");
    EXPECT_EQ(inWords(before->read()), "HEAD master\n");
}

TEST(Transaction, IsNeitherCopiedNorMoved)
{
    EXPECT_FALSE(std::is_copy_constructible_v<Transaction>);
    EXPECT_FALSE(std::is_copy_assignable_v<Transaction>);
}

/// Changes every part of a state.
void changeAll(State& state)
{
    state.head = L"roof";
    state.headCommit = 5;
    state.stagedFiles.emplace_back(L"b.dwg", FileChange::removed);
    state.renames[L"b.dwg"] = L"a.dwg";
    state.index[L"a.dwg"] = {2, true};
}

std::string const kFilledIn = R"({"head": {"commit": 0, "head": 4, "reference": "feature"},
    "staged_files": [{"file_change": "added", "path": "a.dwg"}], "renames": [{"new": "a.dwg", "previous": "c.dwg"}],
    "index": [{"data": {"last_checked": 1, "modified": false}, "path": "a.dwg"}]})";
constexpr char const* kFilledInWords = "HEAD feature 4\nstaged added a.dwg\nrename c.dwg -> a.dwg\nindex a.dwg 1\n";
constexpr char const* kChangedWords = "HEAD roof 5\nstaged added a.dwg\nstaged removed b.dwg\n"
                                      "rename c.dwg -> a.dwg\nrename a.dwg -> b.dwg\nindex a.dwg 2 modified\n";

TEST(Transaction, UncommittedPutsEveryPartOfTheStateBack)
{
    Repository const repository(kFilledIn);
    std::shared_ptr<Cache> const cache = repository.open();
    {
        Transaction const transaction(*cache);
        changeAll(cache->write());
        EXPECT_EQ(inWords(cache->read()), kChangedWords);
    }
    EXPECT_EQ(inWords(cache->read()), kFilledInWords);
}

TEST(Transaction, CommittedKeepsEveryChange)
{
    Repository const repository(kFilledIn);
    std::shared_ptr<Cache> const cache = repository.open();
    {
        Transaction transaction = cache->getTransaction();
        changeAll(cache->write());
        transaction.commit();
    }
    EXPECT_EQ(inWords(cache->read()), kChangedWords);
}

TEST(Transaction, KeepsWhatIsChangedAfterTheCommitToo)
{
    Repository const repository(kFilledIn);
    std::shared_ptr<Cache> const cache = repository.open();
    {
        Transaction transaction = cache->getTransaction();
        transaction.commit();
        changeAll(cache->write());
    }
    EXPECT_EQ(inWords(cache->read()), kChangedWords);
}

TEST(Transaction, MayBeCommittedTwice)
{
    Repository const repository(kFilledIn);
    std::shared_ptr<Cache> const cache = repository.open();
    {
        Transaction transaction = cache->getTransaction();
        changeAll(cache->write());
        transaction.commit();
        transaction.commit();
    }
    EXPECT_EQ(inWords(cache->read()), kChangedWords);
}

TEST(Transaction, PutsBackWhatTheCacheHeldAndNotWhatTheFileHolds)
{
    Repository const repository(kByHand);
    {
        std::shared_ptr<Cache> const cache = repository.open();
        cache->write().head = L"before";
        Transaction const transaction = cache->getTransaction();
        cache->write().head = L"inside";
        EXPECT_EQ(repository.stateFile(), kByHand);
    }
    EXPECT_EQ(repository.stateFile(), headDocument("before"));
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
}

TEST(Transaction, UncommittedMakesTheCacheChangedEvenIfNothingWas)
{
    Repository const repository(kByHand);
    {
        std::shared_ptr<Cache> const cache = repository.open();
        Transaction const transaction = cache->getTransaction();
    }
    EXPECT_EQ(repository.stateFile(), kFresh);
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
}

TEST(Transaction, CommittedWithoutAChangeLeavesTheCacheUnchanged)
{
    Repository const repository(kByHand);
    {
        std::shared_ptr<Cache> const cache = repository.open();
        Transaction transaction = cache->getTransaction();
        transaction.commit();
    }
    EXPECT_EQ(repository.stateFile(), kByHand);
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(Transaction, WritesNothingItself)
{
    for (bool const committed : {false, true}) {
        Repository const repository(kByHand);
        std::shared_ptr<Cache> cache = repository.open();
        {
            Transaction transaction = cache->getTransaction();
            cache->write().head = L"roof";
            if (committed) {
                transaction.commit();
            }
            EXPECT_EQ(repository.stateFile(), kByHand);
        }
        EXPECT_EQ(repository.stateFile(), kByHand);
        EXPECT_THAT(repository.calls(), IsEmpty());
        cache.reset();
        EXPECT_EQ(repository.stateFile(), committed ? headDocument("roof") : kFresh);
        EXPECT_THAT(repository.calls(), ElementsAre("report success"));
    }
}

TEST(Transaction, InsideAnotherEndsByItself)
{
    for (bool const innerCommitted : {false, true}) {
        for (bool const outerCommitted : {false, true}) {
            Repository const repository(kByHand);
            std::shared_ptr<Cache> const cache = repository.open();
            {
                Transaction outer = cache->getTransaction();
                cache->write().head = L"outer";
                {
                    Transaction inner = cache->getTransaction();
                    cache->write().head = L"inner";
                    if (innerCommitted) {
                        inner.commit();
                    }
                }
                EXPECT_EQ(cache->read().head, OdString(innerCommitted ? L"inner" : L"outer"));
                if (outerCommitted) {
                    outer.commit();
                }
            }
            OdString const kept = innerCommitted ? L"inner" : L"outer";
            EXPECT_EQ(cache->read().head, outerCommitted ? kept : OdString(L"master"));
        }
    }
}

TEST(Transaction, KeepsTheReferenceToTheStateValid)
{
    Repository const repository(kFilledIn);
    std::shared_ptr<Cache> const cache = repository.open();
    State const& state = cache->read();
    {
        Transaction const transaction = cache->getTransaction();
        changeAll(cache->write());
    }
    EXPECT_EQ(&state, &cache->read());
    EXPECT_EQ(inWords(state), kFilledInWords);
}

/// A host that breaks its promise.
class ThrowingIo final : public common::IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { return 0; }
    void report(WriteOutcome const& /*outcome*/) const override { throw std::runtime_error("no report, please"); }
};

TEST(CacheDeathTest, EndsTheProcessWhenTheReportThrows)
{
    Repository const repository;
    ThrowingIo const io;
    EXPECT_DEATH({ Cache const cache(repository.root(), io); }, "no report, please");
}

} // namespace
