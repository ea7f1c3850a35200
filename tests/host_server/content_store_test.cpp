/// What every store of contents has to do: `ContentStores` has a row for each.
#include "host/server/folder_contents.h"
#include "host/storage/storage_error.h"

#include "tests/support/rows.h"
#include "tests/support/temp_folder.h"

#include <gmock/gmock.h>

#include <cerrno>
#include <memory>
#include <string>

namespace {

using tav::ContentStore;
using testing::ElementsAre;
using testing::IsEmpty;

/// A way to a store; the second object that it opens shows what the first has kept.
struct Implementation {
    char const* name;
    std::unique_ptr<ContentStore> (*open)(std::string const& folder);
};

class ContentStores : public testing::TestWithParam<Implementation> {
protected:
    std::unique_ptr<ContentStore> open() const { return GetParam().open(folder.path()); }

    void put(std::int64_t id, std::string const& bytes, OdString const& repository = L"1") const
    {
        folder.write("incoming", bytes);
        store->put(repository, {{id, folder.pathTo("incoming")}});
    }

    std::string bytesOf(std::int64_t id) const
    {
        return store->read(L"1", id, 0, static_cast<std::size_t>(store->size(L"1", id)));
    }

    template <class Work>
    static int codeOf(Work const& work)
    {
        try {
            work();
            return 0;
        } catch (tav::StorageError const& error) {
            return error.code;
        }
    }

    support::TempFolder const folder;
    std::unique_ptr<ContentStore> const store = open();
};

TEST_P(ContentStores, TakeFilesOverAndKeepTheirBytes)
{
    put(1, "one");
    put(123456789012, std::string(100000, 'x'));
    put(2, "");
    EXPECT_FALSE(folder.has("incoming"));
    EXPECT_EQ(open()->read(L"1", 1, 0, 10), "one");
    EXPECT_EQ(bytesOf(123456789012), std::string(100000, 'x'));
    EXPECT_EQ(open()->size(L"1", 2), 0u);
}

TEST_P(ContentStores, ReadRanges)
{
    put(7, "abcdef");
    EXPECT_EQ(store->read(L"1", 7, 2, 3), "cde");
    EXPECT_EQ(store->read(L"1", 7, 4, 3), "ef");
    EXPECT_EQ(store->read(L"1", 7, 6, 3), "");
}

TEST_P(ContentStores, ListTheNumbersOfARepositoryInOrder)
{
    EXPECT_THAT(store->list(L"1"), IsEmpty());
    for (std::int64_t const id : {300, 2, 101, 1}) {
        put(id, "bytes");
    }
    put(5, "bytes", L"2");
    EXPECT_THAT(open()->list(L"1"), ElementsAre(1, 2, 101, 300));
    EXPECT_THAT(open()->list(L"2"), ElementsAre(5));
}

TEST_P(ContentStores, RemoveAFileAndNoOther)
{
    put(1, "one");
    put(101, "other");
    put(1, "one", L"2");
    store->remove(L"1", 1);
    store->remove(L"1", 1);
    EXPECT_THAT(open()->list(L"1"), ElementsAre(101));
    EXPECT_THAT(open()->list(L"2"), ElementsAre(1));
}

TEST_P(ContentStores, TakeAFileAgainThatIsThere)
{
    put(1, "one");
    put(1, "one");
    EXPECT_EQ(bytesOf(1), "one");
}

TEST_P(ContentStores, TellAMissingFileFromADamagedOne)
{
    put(1, "no record");
    EXPECT_EQ(codeOf([&] { (void)store->size(L"1", 2); }), ENOENT);
    EXPECT_EQ(codeOf([&] { (void)store->read(L"1", 2, 0, 1); }), ENOENT);
    EXPECT_EQ(codeOf([&] { (void)store->open(L"1", 2); }), ENOENT);
    EXPECT_THAT(store->open(L"1", 1).entries(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(
    Stores, ContentStores,
    testing::Values(Implementation{
        "Folder",
        [](std::string const& folder) -> std::unique_ptr<ContentStore> {
            return std::make_unique<tav::FolderContents>(folder + "/contents");
        }}),
    support::rowName);

TEST(FolderContents, PassOverFilesThatAreNotTheirs)
{
    support::TempFolder const folder;
    folder.write("contents/1/07/7", "");
    folder.write("contents/1/07/8", "");
    folder.write("contents/1/07/107x", "");
    folder.write("contents/1/07/0107", "");
    folder.write("contents/1/07/-93", "");
    EXPECT_THAT(tav::FolderContents(folder.pathTo("contents")).list(L"1"), ElementsAre(7));
}

} // namespace
