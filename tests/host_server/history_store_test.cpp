/// What every store of history has to do: `HistoryStores` has a row for each.
#include "host/errors/failure.h"
#include "host/server/sqlite_history.h"

#include "tests/host_server/server_test.h"
#include "tests/support/rows.h"

#include <gmock/gmock.h>

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace {

using tav::CommitRecord;
using tav::FileRecord;
using tav::HistoryStore;
using testing::ElementsAre;
using testing::IsEmpty;

/// A way to a store; the second object that it opens shows what the first has kept.
struct Implementation {
    char const* name;
    std::unique_ptr<HistoryStore> (*open)(std::string const& folder);
};

OdString hash(char name)
{
    return server::wideText(std::string(64, name));
}

class HistoryStores : public testing::TestWithParam<Implementation> {
protected:
    HistoryStores() { store->add({L"1", L"bridge"}); }

    std::unique_ptr<HistoryStore> open() const { return GetParam().open(folder.path()); }

    /// Adds a commit with the next number behind those whose names are in `parents`.
    void commit(
        char name, std::string const& parents, std::vector<FileRecord> const& changes,
        OdString const& repository = L"1")
    {
        auto const transaction = store->write(repository);
        add(*transaction, name, parents, changes);
        transaction->commit();
    }

    static void
    add(tav::HistoryTransaction& transaction, char name, std::string const& parents,
        std::vector<FileRecord> const& changes)
    {
        CommitRecord record{transaction.lastNumber() + 1, hash(name), L"ann", L"moves the stairs", 1709647629, {}};
        for (char const parent : parents) {
            record.parents.push_back(hash(parent));
        }
        transaction.add(record, changes);
    }

    void set(common::Reference const& reference)
    {
        auto const transaction = store->write(L"1");
        transaction->set(reference);
        transaction->commit();
    }

    std::string numbers(HistoryStore& of, std::int64_t first = 1, OdString const& repository = L"1") const
    {
        std::string text;
        for (tav::CommitNumber const& next : of.read(repository)->numbersFrom(first)) {
            text += std::to_string(next.number) + next.hash.ansi_str().substr(0, 1) + " ";
        }
        return text;
    }

    std::string references() const
    {
        std::string text;
        for (common::Reference const& next : store->read(L"1")->references()) {
            std::string const type = next.type == common::EType::tag ? "tag " : "branch ";
            text += type + next.name.ansi_str() + " " + next.commitHash.ansi_str().substr(0, 1) + "; ";
        }
        return text;
    }

    std::string tree(char name) const
    {
        std::string text;
        for (auto const& [path, url] : store->read(L"1")->files(hash(name))) {
            text += path.ansi_str() + "=" + url.ansi_str() + " ";
        }
        return text;
    }

    std::string changes(char name) const
    {
        std::string text;
        for (FileRecord const& next : store->read(L"1")->changes(hash(name))) {
            text += next.path.ansi_str() + "=" + next.url.ansi_str() + "<" + next.previousPath.ansi_str() + " ";
        }
        return text;
    }

    support::TempFolder const folder;
    std::unique_ptr<HistoryStore> const store = open();
};

TEST_P(HistoryStores, ListRepositoriesOldestFirstAndTakeEachIdentifierOnce)
{
    EXPECT_TRUE(store->add({L"0", L"bridge"}));
    EXPECT_FALSE(store->add({L"1", L"tunnel"}));
    std::string text;
    for (tav::Repository const& repository : open()->repositories()) {
        text += repository.id.ansi_str() + " " + repository.name.ansi_str() + "; ";
    }
    EXPECT_EQ(text, "1 bridge; 0 bridge; ");
    EXPECT_EQ(store->find(L"1")->name, OdString(L"bridge"));
    EXPECT_FALSE(store->find(L"2"));
}

TEST_P(HistoryStores, KeepCommitsWithAllThatIsInThem)
{
    commit('a', "", {{L"notes", L"po:1", L""}});
    commit('b', "a", {{L"plan", L"po:2", L"notes"}, {L"notes", L"", L""}});
    commit('c', "ab", {});
    auto const other = open();
    auto const history = other->read(L"1");
    CommitRecord const found = *history->find(hash('c'));
    EXPECT_EQ(found.number, 3);
    EXPECT_EQ(found.author, OdString(L"ann"));
    EXPECT_EQ(found.message, OdString(L"moves the stairs"));
    EXPECT_EQ(found.date, 1709647629);
    EXPECT_THAT(found.parents, ElementsAre(hash('a'), hash('b')));
    EXPECT_EQ(history->find(std::int64_t{2})->hash, hash('b'));
    EXPECT_FALSE(history->find(hash('d')));
    EXPECT_FALSE(history->find(std::int64_t{4}));
    EXPECT_EQ(history->lastNumber(), 3);
    EXPECT_EQ(history->after(1).size(), 2u);
    EXPECT_THAT(history->after(3), IsEmpty());
}

TEST_P(HistoryStores, PutTreesTogetherFromChanges)
{
    commit('a', "", {{L"notes", L"po:1", L""}, {L"old", L"po:2", L""}});
    commit('b', "a", {{L"notes", L"po:3", L""}});
    commit('c', "a", {{L"new", L"po:2", L"old"}, {L"old", L"", L""}});
    commit('d', "cb", {{L"notes", L"po:3", L""}});
    EXPECT_EQ(tree('b'), "notes=po:3 old=po:2 ");
    EXPECT_EQ(tree('d'), "new=po:2 notes=po:3 ");
    EXPECT_EQ(changes('c'), "new=po:2<old old=< ");
    EXPECT_EQ(changes('a'), "notes=po:1< old=po:2< ");
}

TEST_P(HistoryStores, ListNumbersFromAnyOn)
{
    commit('a', "", {});
    commit('b', "a", {});
    EXPECT_EQ(numbers(*store), "1a 2b ");
    EXPECT_EQ(numbers(*store, 2), "2b ");
    EXPECT_EQ(numbers(*store, 3), "");
}

TEST_P(HistoryStores, KnowWhatIsBeforeWhat)
{
    commit('a', "", {});
    commit('b', "a", {});
    commit('c', "a", {});
    commit('d', "bc", {});
    auto const history = store->read(L"1");
    EXPECT_TRUE(history->isBefore(hash('a'), hash('d')));
    EXPECT_TRUE(history->isBefore(hash('c'), hash('d')));
    EXPECT_TRUE(history->isBefore(hash('b'), hash('b')));
    EXPECT_FALSE(history->isBefore(hash('b'), hash('c')));
    EXPECT_FALSE(history->isBefore(hash('d'), hash('a')));
    std::string between;
    for (tav::CommitNumber const& next : history->between(hash('d'), hash('b'))) {
        between += std::to_string(next.number) + " ";
    }
    EXPECT_EQ(between, "3 4 ");
    EXPECT_EQ(history->between(hash('b'), OdString()).size(), 2u);
    EXPECT_THAT(history->between(hash('a'), hash('d')), IsEmpty());
}

TEST_P(HistoryStores, MakeMoveAndRemoveReferences)
{
    commit('a', "", {});
    commit('b', "a", {});
    set({L"main", hash('a'), common::EType::branch});
    set({L"as built", hash('a'), common::EType::tag});
    set({L"main", hash('b'), common::EType::branch});
    EXPECT_EQ(references(), "tag as built a; branch main b; ");
    EXPECT_EQ(store->read(L"1")->reference(L"main")->commitHash, hash('b'));
    EXPECT_FALSE(store->read(L"1")->reference(L"other"));
    auto const transaction = store->write(L"1");
    transaction->removeReference(L"as built");
    transaction->removeReference(L"other");
    transaction->commit();
    EXPECT_EQ(references(), "branch main b; ");
}

TEST_P(HistoryStores, KeepRepositoriesApart)
{
    store->add({L"2", L"tunnel"});
    commit('a', "", {{L"notes", L"po:1", L""}});
    set({L"main", hash('a'), common::EType::branch});
    commit('b', "", {{L"plan", L"po:1", L""}}, L"2");
    EXPECT_EQ(numbers(*store, 1, L"2"), "1b ");
    EXPECT_THAT(store->read(L"2")->references(), IsEmpty());
    EXPECT_FALSE(store->read(L"2")->find(hash('a')));
    store->noteDelivered(L"1", 1);
    EXPECT_EQ(store->read(L"2")->delivered(), 0);
}

TEST_P(HistoryStores, NoteTheHighestNumberThatIsHandedOut)
{
    EXPECT_EQ(store->read(L"1")->delivered(), 0);
    store->noteDelivered(L"1", 3);
    store->noteDelivered(L"1", 2);
    EXPECT_EQ(open()->read(L"1")->delivered(), 3);
}

TEST_P(HistoryStores, ShowATransactionItsOwnChangesAndNobodyElse)
{
    auto const other = open();
    auto const transaction = store->write(L"1");
    add(*transaction, 'a', "", {{L"notes", L"po:1", L""}});
    transaction->set({L"main", hash('a'), common::EType::branch});
    EXPECT_EQ(transaction->lastNumber(), 1);
    EXPECT_EQ(transaction->references().size(), 1u);
    EXPECT_EQ(numbers(*other), "");
    transaction->commit();
    EXPECT_EQ(numbers(*other), "1a ");
}

TEST_P(HistoryStores, ForgetATransactionThatIsNotCommitted)
{
    add(*store->write(L"1"), 'a', "", {{L"notes", L"po:1", L""}});
    EXPECT_EQ(numbers(*store), "");
    commit('b', "", {});
    EXPECT_EQ(numbers(*store), "1b ");
}

TEST_P(HistoryStores, RefuseARepositoryThatIsNotThere)
{
    EXPECT_THROW(store->read(L"2"), tav::Failure);
    EXPECT_THROW(store->write(L"2"), tav::Failure);
}

INSTANTIATE_TEST_SUITE_P(
    Stores, HistoryStores,
    testing::Values(Implementation{
        "Sqlite",
        [](std::string const& folder) -> std::unique_ptr<HistoryStore> {
            return std::make_unique<tav::SqliteHistory>(folder + "/server.db");
        }}),
    support::rowName);

} // namespace
