#include "host/commits/turn_over.h"

#include "host/storage/local_storage.h"
#include "host/storage/object_bases.h"
#include "host/storage/storage_url.h"
#include "host/text/utf8.h"

#include "tests/support/temp_repository.h"

#include "common/mu_common_versions.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <random>
#include <string>
#include <vector>

namespace {

/// Bytes that do not compress, others for each `seed`.
std::string drawing(unsigned seed)
{
    std::minstd_rand random(seed);
    std::string bytes(6000, '\0');
    for (char& byte : bytes) {
        byte = static_cast<char>(random() >> 8U);
    }
    return bytes;
}

std::string edited(std::string bytes, unsigned seed)
{
    return bytes.replace(bytes.size() / 2, 8, drawing(seed), 0, 8);
}

/// A history whose objects are all whole, as earlier versions of tav stored them.
class TurnOverObjects : public testing::Test {
protected:
    struct File {
        std::string path;
        std::string content; ///< none for a file that the commit removed
        std::string previousPath = {};
    };

    void commit(std::vector<File> const& files)
    {
        std::vector<tav::FileRecord> changes;
        for (File const& file : files) {
            OdString const url = file.content.empty() ? OdString() : storeWhole(file.content);
            changes.push_back({tav::fromUtf8(file.path), url, tav::fromUtf8(file.previousPath)});
        }
        tav::CommitTables& commits = database_.commits();
        OdString const parent = number_ > 0 ? hashOf(number_) : OdString();
        ++number_;
        std::vector<OdString> const parents = number_ > 1 ? std::vector<OdString>{parent} : std::vector<OdString>();
        commits.addChanges({number_, hashOf(number_), L"ann", L"drawn", 0, parents}, changes);
    }

    tav::TurnedOver turnOver() { return tav::turnOverObjects(repo_.root(), database_); }

    /// The content that the object with `content` builds on; empty for a whole one.
    std::string baseOf(std::string const& content) const
    {
        tav::StorageLayout const layout(repo_.root());
        std::vector<tav::Digest> const chain = tav::ObjectBases(layout).chainOf(digestOf(content));
        for (std::string const& other : contents_) {
            if (chain.size() > 1 && digestOf(other) == chain[1]) {
                return other;
            }
        }
        return {};
    }

    void damage(std::string const& content) const { repo_.write(objectOf(content), "damaged"); }

    void makeUnreadable(std::string const& content) const
    {
        std::filesystem::remove(repo_.pathTo(objectOf(content)));
        repo_.makeFolder(objectOf(content)); // The system refuses to read it, even for root.
    }

    void makeReadable(std::string const& content)
    {
        std::filesystem::remove(repo_.pathTo(objectOf(content)));
        storeWhole(content);
    }

    tav::LocalDatabase& database() { return database_; }

private:
    static OdString hashOf(std::int64_t number) { return OdString().format(L"%064d", static_cast<int>(number)); }

    static tav::Digest digestOf(std::string const& content)
    {
        return *tav::digestFromHex(generateSha(content.data(), static_cast<int>(content.size())).ansi_str());
    }

    static std::string objectOf(std::string const& content) { return ".tav/objects/" + tav::hexOf(digestOf(content)); }

    OdString storeWhole(std::string const& content)
    {
        contents_.push_back(content);
        repo_.write("whole", content);
        tav::LocalStorage storage(repo_.root());
        OdString const url = storage.store(L"whole").value();
        EXPECT_TRUE(storage.flush().hasValue());
        return url;
    }

    support::TempRepository const repo_;
    tav::LocalDatabase database_ = tav::LocalDatabase::make(repo_.root());
    std::int64_t number_ = 0;
    std::vector<std::string> contents_;
};

TEST_F(TurnOverObjects, BuildsEachVersionOnTheOneBefore)
{
    std::string const first = drawing(1);
    std::string const second = edited(first, 2);
    std::string const third = edited(second, 3);
    commit({{"PLAN.DWG", first}});
    commit({{"PLAN.DWG", second}});
    commit({{"PLAN.DWG", third}});
    EXPECT_EQ(turnOver().freed.contents, 2u);
    EXPECT_EQ(baseOf(first), "");
    EXPECT_EQ(baseOf(second), first);
    EXPECT_EQ(baseOf(third), second);
}

TEST_F(TurnOverObjects, FollowsAFileToItsNewName)
{
    std::string const first = drawing(1);
    std::string const other = drawing(7);
    std::string const second = edited(first, 2);
    commit({{"PLAN.DWG", first}, {"other.txt", other}});
    commit({{"PLAN.DWG", ""}, {"new/SECTION.TXT", second, "PLAN.DWG"}});
    EXPECT_EQ(turnOver().freed.contents, 1u);
    EXPECT_EQ(baseOf(second), first);
}

TEST_F(TurnOverObjects, BuildsANewFileOnASimilarOneBesideIt)
{
    std::string const sheet = drawing(1);
    std::string const copy = edited(sheet, 2);
    commit({{"sheet 1.DWG", sheet}, {"sheet 3.DWG", drawing(3)}});
    commit({{"sheet 2.DWG", copy}});
    EXPECT_EQ(turnOver().freed.contents, 1u);
    EXPECT_EQ(baseOf(copy), sheet);
}

TEST_F(TurnOverObjects, BuildsNothingOnAFileThatIsGone)
{
    std::string const sheet = drawing(1);
    std::string const copy = edited(sheet, 2);
    commit({{"sheet 1.DWG", sheet}});
    commit({{"sheet 1.DWG", ""}});
    commit({{"sheet 2.DWG", copy}});
    EXPECT_EQ(turnOver().freed.contents, 0u);
    EXPECT_EQ(baseOf(copy), "");
}

TEST_F(TurnOverObjects, GoesOnFromTheLastCommitThatItHasGoneThrough)
{
    std::string const first = drawing(1);
    std::string const second = edited(first, 2);
    commit({{"PLAN.DWG", first}});
    EXPECT_EQ(turnOver().freed.contents, 0u);
    EXPECT_EQ(database().turnedOver(), 1);
    commit({{"PLAN.DWG", second}});
    EXPECT_EQ(turnOver().freed.contents, 1u) << "it knows what the commit before has left";
    EXPECT_EQ(baseOf(second), first);
    EXPECT_EQ(database().turnedOver(), 2);
    EXPECT_EQ(turnOver().freed.contents, 0u);
}

TEST_F(TurnOverObjects, LeavesDamagedObjectsToVerify)
{
    std::string const first = drawing(1);
    std::string const second = edited(first, 2);
    commit({{"PLAN.DWG", first}});
    commit({{"PLAN.DWG", second}});
    damage(first);
    tav::TurnedOver const turned = turnOver();
    EXPECT_FALSE(turned.error.has_value());
    EXPECT_EQ(turned.freed.contents, 0u);
    EXPECT_EQ(database().turnedOver(), 2);
}

TEST_F(TurnOverObjects, ComesBackForWhatTheSystemRefusedToRead)
{
    std::string const first = drawing(1);
    std::string const second = edited(first, 2);
    commit({{"PLAN.DWG", first}});
    commit({{"PLAN.DWG", second}});
    makeUnreadable(first);
    EXPECT_TRUE(turnOver().error.has_value());
    EXPECT_EQ(database().turnedOver(), 0);
    makeReadable(first);
    EXPECT_EQ(turnOver().freed.contents, 1u);
    EXPECT_EQ(baseOf(second), first);
}

} // namespace
