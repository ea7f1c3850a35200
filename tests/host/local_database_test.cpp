#include "host/repository/local_database.h"

#include "host/errors/failure.h"
#include "host/repository/journal.h"

#include "tests/host/earlier_database.h"
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
        host_tests::makeSecondVersion(path, {});
        tav::Database file(path);
        file.run("DROP TABLE verified_files");
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
    EXPECT_EQ(version(), 7);
    database.addVerified({verified("a.dwg")});
    EXPECT_THAT(tav::LocalDatabase::open(repo.root()).verifiedFiles(), ElementsAre(verified("a.dwg")));
}

char const* const kNotedCommit = R"({"document":"the document","contents":[{"url":"po:1","size":7,"digest":)"
                                 R"("d1ce000000000000000000000000000000000000000000000000000000000000"}],)"
                                 R"("files":[{"path":"a.dwg","time":5,"modified":true},{"path":"ö.dwg"}]})";

void expectNotedCommit(tav::PendingOperation const& pending)
{
    auto const& commit = std::get<tav::PendingCommit>(pending);
    EXPECT_EQ(commit.document, OdString(L"the document"));
    ASSERT_EQ(commit.contents.size(), 1U);
    EXPECT_EQ(commit.contents[0].url, OdString(L"po:1"));
    EXPECT_EQ(commit.contents[0].size, 7U);
    EXPECT_EQ(commit.contents[0].digest, (tav::Digest{0xd1, 0xce}));
    ASSERT_EQ(commit.files.size(), 2U);
    EXPECT_EQ(commit.files.at(L"a.dwg")->lastChecked, 5U);
    EXPECT_TRUE(commit.files.at(L"a.dwg")->modified);
    EXPECT_FALSE(commit.files.at(L"\xF6.dwg"));
}

TEST_F(LocalDatabase, ShowsWhatTheSecondVersionHasNotedToWhoOnlyReads)
{
    host_tests::makeSecondVersion(path, OdString(kNotedCommit, CP_UTF_8));
    expectNotedCommit(tav::LocalDatabase::open(repo.root()).pendingOperation());
    EXPECT_EQ(version(), 2);
}

TEST_F(LocalDatabase, TakesOverACommitThatTheSecondVersionHasNoted)
{
    host_tests::makeSecondVersion(path, OdString(kNotedCommit, CP_UTF_8));
    tav::LocalDatabase database = tav::LocalDatabase::openForChanges(repo.root());
    expectNotedCommit(database.pendingOperation());
    tav::endOperation(database);
    EXPECT_TRUE(std::holds_alternative<std::monostate>(database.pendingOperation()));
    EXPECT_TRUE(database.operations().latest(10).empty()); // It does not say how to take it back.
}

TEST_F(LocalDatabase, TakesOverACheckoutThatTheSecondVersionHasNoted)
{
    host_tests::makeSecondVersion(
        path, L"{\"target\":\"c\",\"branch\":\"main\",\"written\":false,\"begun\":[\"a\",\"b\"],\"files\":[]}");
    tav::LocalDatabase database = tav::LocalDatabase::openForChanges(repo.root());
    tav::PendingOperation const pending = database.pendingOperation();
    auto const& checkout = std::get<tav::PendingCheckout>(pending);
    EXPECT_EQ(checkout.target, OdString(L"c"));
    EXPECT_EQ(checkout.branch, OdString(L"main"));
    EXPECT_FALSE(checkout.isWritten);
    EXPECT_THAT(checkout.begun, ElementsAre(OdString(L"a"), OdString(L"b")));
}

TEST_F(LocalDatabase, IsRefusedWhenANewerVersionMadeIt)
{
    tav::Database(path).setVersion(8);
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
