#include "host/history/last_changes.h"

#include "host/repository/local_database.h"
#include "host/text/utf8.h"

#include "tests/support/temp_repository.h"

#include <gmock/gmock.h>

#include <string>
#include <vector>

namespace {

using testing::ElementsAre;

class LastChanges : public testing::Test {
protected:
    void add(std::int64_t number, std::vector<std::int64_t> const& parents, std::vector<tav::FileRecord> const& changes)
    {
        std::vector<OdString> hashes;
        for (std::int64_t const parent : parents) {
            hashes.push_back(hashOf(parent));
        }
        database.commits().addChanges({number, hashOf(number), L"ann", L"drawn", 0, hashes}, changes);
    }

    /// So many new files, "0.dwg" and so on.
    void addMany(std::int64_t number, int count)
    {
        std::vector<tav::FileRecord> changes;
        for (int i = 0; i < count; ++i) {
            changes.push_back({OdString().format(L"%05d.dwg", i), L"po:1", L""});
        }
        tav::WriteTransaction transaction(database.database()); // Else each file waits for the disk.
        add(number, {}, changes);
        transaction.commit();
    }

    /// "a.dwg 5" for each file.
    std::vector<std::string> at(std::int64_t number)
    {
        std::vector<std::string> files;
        for (tav::LastChange const& file : tav::LastChanges(database.database()).at(*database.commits().find(number))) {
            files.push_back(file.path + " " + std::to_string(file.commit));
        }
        return files;
    }

    std::int64_t numberOfTheKeptList()
    {
        tav::Statement row = database.database().prepare("SELECT number FROM last_changes");
        return row.next() ? row.integer(0) : 0;
    }

    support::TempRepository const repo;
    tav::LocalDatabase database = tav::LocalDatabase::make(repo.root());

private:
    static OdString hashOf(std::int64_t number) { return OdString().format(L"%064d", static_cast<int>(number)); }
};

TEST_F(LastChanges, AreThoseOnTheLineOfFirstParents)
{
    add(1, {}, {{L"a.dwg", L"po:1", L""}, {L"b.dwg", L"po:1", L""}, {L"図面.dwg", L"po:1", L""}});
    add(2, {1}, {{L"a.dwg", L"po:2", L""}});
    add(3, {1}, {{L"a.dwg", L"po:3", L""}, {L"b.dwg", L"", L""}});
    add(4, {2, 3}, {{L"b.dwg", L"", L""}});
    EXPECT_THAT(at(1), ElementsAre("a.dwg 1", "b.dwg 1", "図面.dwg 1"));
    EXPECT_THAT(at(3), ElementsAre("a.dwg 3", "図面.dwg 1"));
    EXPECT_THAT(at(4), ElementsAre("a.dwg 2", "図面.dwg 1"));
    EXPECT_EQ(numberOfTheKeptList(), 0);
}

TEST_F(LastChanges, AreKeptForManyFilesAndBroughtToLaterCommits)
{
    addMany(1, 10'000);
    std::vector<std::string> const first = at(1);
    EXPECT_EQ(numberOfTheKeptList(), 1);
    EXPECT_EQ(at(1), first);
    add(2, {1}, {{L"00000.dwg", L"", L""}, {L"00001.dwg", L"po:2", L""}, {L"zz.dwg", L"po:2", L""}});
    add(3, {2}, {{L"-.dwg", L"po:3", L""}, {L"00002.dwg", L"po:3", L""}, {L"zz.dwg", L"", L""}});
    std::vector<std::string> const third = at(3);
    EXPECT_THAT(
        std::vector<std::string>(third.begin(), third.begin() + 4),
        ElementsAre("-.dwg 3", "00001.dwg 2", "00002.dwg 3", "00003.dwg 1"));
    EXPECT_EQ(third.back(), "09999.dwg 1");
    EXPECT_EQ(numberOfTheKeptList(), 1);
}

TEST_F(LastChanges, OfAnEarlierCommitAreNotTakenFromTheKeptList)
{
    addMany(1, 10'000);
    add(2, {1}, {{L"00000.dwg", L"po:2", L""}});
    EXPECT_EQ(at(2).front(), "00000.dwg 2");
    EXPECT_EQ(numberOfTheKeptList(), 2);
    EXPECT_EQ(at(1).front(), "00000.dwg 1");
    EXPECT_EQ(numberOfTheKeptList(), 2);
}

TEST_F(LastChanges, AreFoundInADatabaseOfAnEarlierVersion)
{
    database.database().run("DROP TABLE last_changes; DROP INDEX changes_by_path");
    addMany(1, 10'000);
    EXPECT_EQ(at(1).size(), 10'000);
    EXPECT_EQ(at(1).back(), "09999.dwg 1");
}

} // namespace
