#include "host/repository/local_database.h"

#include "host/errors/failure.h"

#include "tests/support/temp_repository.h"

#include <gmock/gmock.h>

#include <cstdint>
#include <string>
#include <vector>

namespace tav {

void PrintTo(VerifiedFile const& file, std::ostream* stream)
{
    *stream << file.path << ' ' << tav::hexOf(file.digest) << ' ' << file.stamp.size << ' ' << file.stamp.inode << ' '
            << file.stamp.changed << ' ' << file.stamp.modified;
}

bool operator==(VerifiedFile const& a, VerifiedFile const& b)
{
    return a.path == b.path && a.digest == b.digest && a.stamp == b.stamp;
}

} // namespace tav

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class LocalDatabase : public testing::Test {
protected:
    LocalDatabase() { tav::LocalDatabase::make(repo.root()); }

    /// Makes the file what the first version of its tables was.
    void makeFirstVersion() const
    {
        tav::Database file(path);
        file.run("DROP TABLE verified_files; DROP INDEX changes_by_path; DROP TABLE last_changes");
        file.setVersion(1);
    }

    std::int64_t version() const { return tav::Database(path).version(); }

    static tav::VerifiedFile verified(std::string const& path)
    {
        return {path, {0xd1, 0xce}, {5'000'000'000, ~std::uint64_t{0}, 1'700'000'000'000'000'001, -1}};
    }

    support::TempRepository const repo;
    std::string const path = repo.pathTo(".tav/tav.db");
};

TEST_F(LocalDatabase, StaysAsAnEarlierVersionMadeItForWhoOnlyReads)
{
    makeFirstVersion();
    tav::LocalDatabase const database = tav::LocalDatabase::open(repo.root());
    EXPECT_THAT(database.verifiedFiles(), IsEmpty());
    EXPECT_EQ(version(), 1);
}

TEST_F(LocalDatabase, IsBroughtToThisVersionForWhoChangesIt)
{
    makeFirstVersion();
    tav::LocalDatabase database = tav::LocalDatabase::openForChanges(repo.root());
    EXPECT_EQ(version(), 5);
    database.addVerified({verified("a.dwg")});
    EXPECT_THAT(tav::LocalDatabase::open(repo.root()).verifiedFiles(), ElementsAre(verified("a.dwg")));
}

TEST_F(LocalDatabase, IsRefusedWhenANewerVersionMadeIt)
{
    tav::Database(path).setVersion(6);
    try {
        tav::LocalDatabase::open(repo.root());
        FAIL() << "no failure";
    } catch (tav::Failure const& failure) {
        EXPECT_EQ(failure.what, "The database '" + path + "' was written by a newer tav.");
        EXPECT_EQ(failure.next, "Use that one.");
    }
}

TEST_F(LocalDatabase, KeepsTheLastRecordOfAVerifiedFile)
{
    tav::LocalDatabase database = tav::LocalDatabase::openForChanges(repo.root());
    tav::VerifiedFile later = verified("b.dwg");
    later.digest.fill(0xee);
    later.stamp.changed = 7;
    database.addVerified({verified("a.dwg"), verified("b.dwg")});
    database.addVerified({later});
    EXPECT_THAT(database.verifiedFiles(), ElementsAre(verified("a.dwg"), later));
}

TEST_F(LocalDatabase, LeavesOutAVerifiedFileWhoseDigestIsDamaged)
{
    tav::LocalDatabase database = tav::LocalDatabase::openForChanges(repo.root());
    database.addVerified({verified("a.dwg"), verified("b.dwg")});
    database.database().run("UPDATE verified_files SET digest = 'd1ge5t' WHERE path = 'a.dwg'");
    EXPECT_THAT(database.verifiedFiles(), ElementsAre(verified("b.dwg")));
}

TEST_F(LocalDatabase, ListsVerifiedFilesInTheOrderOfBytesWhateverTheyAre)
{
    tav::LocalDatabase database = tav::LocalDatabase::openForChanges(repo.root());
    database.addVerified({verified("\xFF"), verified("\xF0\x9F\x8F\xA0"), verified("a.dwg"), verified("B.dwg")});
    EXPECT_THAT(
        database.verifiedFiles(),
        ElementsAre(verified("B.dwg"), verified("a.dwg"), verified("\xF0\x9F\x8F\xA0"), verified("\xFF")));
}

} // namespace
