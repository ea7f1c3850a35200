// Objects that are kept as differences to others.
#include "storage_test.h"
#include "tests/support/utf8.h"

#include <cstddef>
#include <filesystem>

namespace storage_tests {
namespace {

using testing::AnyOf;

class Objects : public StorageTest {
protected:
    /// Versions of "PLAN.DWG", each on the one before.
    void commitVersions(unsigned count, std::size_t length = 3000)
    {
        for (unsigned i = 0; i < count; ++i) {
            contents.push_back(i == 0 ? drawing(0, length) : edited(contents.back(), i));
            urls.push_back(commit("PLAN.DWG", contents.back()));
        }
    }

    std::string message(std::size_t i, std::string const& what) const { return "'" + urls[i] + "' " + what; }

    std::vector<std::string> contents;
    std::vector<std::string> urls;
};

TEST_F(Objects, BuildOnTheVersionOfTheLastCommit)
{
    commitVersions(3);
    EXPECT_TRUE(objectOf(urls[0]).isWhole());
    EXPECT_EQ(baseOf(urls[1]), urls[0]);
    EXPECT_EQ(baseOf(urls[2]), urls[1]);
    EXPECT_LT(repo.read(fileOf(urls[2])).size(), 250u);
    for (std::size_t i = 0; i < 3; ++i) {
        EXPECT_EQ(contentOf(urls[i]), contents[i]) << i;
    }
}

TEST_F(Objects, AreKeptWholeWhereTheBaseIsOfNoUse)
{
    std::string const first = commit("print.pdf", drawing(1, 3000));
    std::string const second = commit("print.pdf", drawing(2, 3000));
    EXPECT_TRUE(objectOf(second).isWhole());
    EXPECT_EQ(contentOf(second), drawing(2, 3000));
}

TEST_F(Objects, BeginAnewWhenTheChainIsFull)
{
    commitVersions(40, 600);
    for (std::size_t i = 0; i < urls.size(); ++i) {
        EXPECT_EQ(deltasOf(urls[i]), i == 0 ? 0 : (i - 1) % 32 + 1) << i;
        EXPECT_EQ(contentOf(urls[i]), contents[i]) << i;
    }
}

TEST_F(Objects, BeginAnewEarlierWhereContentsAreLongerThanASegment)
{
    commitVersions(12, kSegment + 100);
    for (std::size_t i = 0; i < urls.size(); ++i) {
        EXPECT_EQ(deltasOf(urls[i]), i == 0 ? 0 : (i - 1) % 8 + 1) << i;
        EXPECT_EQ(contentOf(urls[i]), contents[i]) << i;
    }
}

TEST_F(Objects, DoNotBuildOnRevisionsNorTheReverse)
{
    committed["plan.DWG"] = commit("plan.dwg", drawing(0, 3000));
    EXPECT_TRUE(objectOf(store("plan.DWG", edited(drawing(0, 3000), 1))).isWhole());
    committed["other.dwg"] = store("other.DWG", drawing(2, 3000));
    std::string const revision = store("other.dwg", edited(drawing(2, 3000), 1));
    EXPECT_TRUE(recordsOf(revision).entries().at(0).record.isWhole());
}

TEST_F(Objects, BuildOnASimilarContentWhereThereIsNoVersionBefore)
{
    std::string const sheet = commit("sheet 1.DXF", drawing(1, kSegment));
    std::string const other = commit("sheet 2.DXF", drawing(2, kSegment));
    similar = {support::fromUtf8(other), support::fromUtf8(sheet)};
    std::string const next = store("sheet 3.DXF", edited(drawing(1, kSegment), 3));
    EXPECT_EQ(baseOf(next), sheet);
    EXPECT_EQ(contentOf(next), edited(drawing(1, kSegment), 3));
}

TEST_F(Objects, BuildOnASimilarContentOfTheSameBatch)
{
    repo.write("1.dxf", drawing(1, kSegment));
    repo.write("2.dxf", edited(drawing(1, kSegment), 2));
    tav::LocalStorage storage = newStorage();
    similar = {storage.store(L"1.dxf").value()};
    std::string const url = storage.store(L"2.dxf").value().ansi_str();
    ASSERT_TRUE(storage.flush().hasValue());
    EXPECT_EQ(baseOf(url), similar[0].ansi_str());
    EXPECT_EQ(contentOf(url), edited(drawing(1, kSegment), 2));
}

TEST_F(Objects, AreNotComparedWhereTheyAreShortOrTheCandidateIsNone)
{
    std::string const first = commit("1.txt", drawing(1, 2000));
    similar = {support::fromUtf8(first), L"tf:x", L"po:", support::fromUtf8("po:" + std::string(64, '0'))};
    EXPECT_TRUE(objectOf(store("2.txt", edited(drawing(1, 2000), 1))).isWhole());
    EXPECT_TRUE(objectOf(store("3.txt", drawing(3, kSegment))).isWhole());
}

TEST_F(Objects, LetASimilarDrawingJoinTheStoreOfTheOther)
{
    std::string const sheet = commit("sheet 1.dwg", drawing(1, kSegment));
    similar = {support::fromUtf8(sheet)};
    std::string const next = store("sheet 2.dwg", edited(drawing(1, kSegment), 2));
    EXPECT_EQ(fileOf(next), fileOf(sheet));
    EXPECT_FALSE(recordsOf(next).entries().at(1).record.isWhole());
    std::string const unlike = store("detail.dwg", drawing(3, kSegment));
    EXPECT_NE(fileOf(unlike), fileOf(sheet));
    EXPECT_EQ(contentOf(next), edited(drawing(1, kSegment), 2));
}

TEST_F(Objects, LetNoDrawingJoinAStoreOfManyRevisions)
{
    std::string content = drawing(1, kSegment);
    std::string url;
    for (unsigned i = 0; i < 101; ++i) {
        content = edited(content, i);
        url = commit("plan.dwg", content);
    }
    similar = {support::fromUtf8(url)};
    EXPECT_NE(fileOf(store("copy.dwg", edited(content, 200))), fileOf(url));
}

TEST_F(Objects, GiveNoWrongContentWhicheverByteOfTheChainIsDamaged)
{
    commitVersions(3, 200);
    for (std::string const& url : urls) {
        std::string const whole = repo.read(fileOf(url));
        for (std::size_t place = 0; place < whole.size(); ++place) {
            std::string bytes = whole;
            bytes[place] = static_cast<char>(bytes[place] ^ (1 << place % 8));
            repo.write(fileOf(url), bytes);
            for (std::size_t i = 0; i < urls.size(); ++i) {
                std::string const content = contentOf(urls[i]);
                EXPECT_TRUE(content == contents[i] || content.find(" is damaged.") != std::string::npos)
                    << place << ": " << content;
            }
        }
        repo.write(fileOf(url), whole);
    }
}

TEST_F(Objects, SayWhichBaseIsMissing)
{
    commitVersions(3);
    std::filesystem::remove(repo.pathTo(fileOf(urls[0])));
    EXPECT_EQ(verify(urls[2]), "'" + urls[0] + "', which '" + urls[2] + "' builds on, is not in the storage.");
    EXPECT_EQ(verify(urls[0]), message(0, "is not in the storage."));
}

TEST_F(Objects, AreStoredWholeWhenTheyAreRepairedAndOthersCanBeReadAgain)
{
    commitVersions(3);
    known[urls[1].substr(3)] = urls[1];
    for (bool const isRemoved : {false, true}) {
        if (isRemoved) {
            std::filesystem::remove(repo.pathTo(fileOf(urls[1])));
        } else {
            repo.write(fileOf(urls[1]), "damaged");
        }
        EXPECT_NE(contentOf(urls[2]), contents[2]);
        repo.write("PLAN.DWG", contents[1]);
        auto const repaired = newStorage().repair(support::fromUtf8(urls[1]), L"PLAN.DWG");
        ASSERT_TRUE(repaired.hasValue() && repaired.value()) << messageOf(repaired);
        EXPECT_TRUE(objectOf(urls[1]).isWhole());
        EXPECT_EQ(contentOf(urls[2]), contents[2]);
    }
}

TEST_F(Objects, BuildOnNothingDamaged)
{
    commitVersions(2);
    repo.write(fileOf(urls[0]), "damaged");
    std::string const url = store("PLAN.DWG", edited(contents[1], 9));
    EXPECT_TRUE(objectOf(url).isWhole());
    EXPECT_EQ(contentOf(url), edited(contents[1], 9));
}

TEST_F(Objects, AreVerifiedInTheirOwnFileHoweverOftenTheyWereRead)
{
    commitVersions(2);
    tav::LocalStorage storage = newStorage();
    ASSERT_EQ(messageOf(storage.verify(support::fromUtf8(urls[1]))), "success");
    std::string bytes = repo.read(fileOf(urls[1]));
    bytes.back() = static_cast<char>(bytes.back() ^ 1);
    repo.write(fileOf(urls[1]), bytes);
    EXPECT_EQ(messageOf(storage.verify(support::fromUtf8(urls[1]))), "The content of " + message(1, "is damaged."));
}

/// What cleaning makes of objects.
class TurningOver : public Objects {
protected:
    /// "whole" versions of a file, each of which `committed` has before the next one is turned over.
    void commitWhole(unsigned count)
    {
        commitVersions(count);
        for (std::size_t i = 0; i < urls.size(); ++i) {
            makeWhole(urls[i], contents[i]);
        }
    }

    /// Turns over version `i` as the one after `previous`: how many contents became smaller, or the message.
    std::string turnOver(tav::LocalStorage& storage, std::size_t i, std::string const& previous)
    {
        committed["PLAN.DWG"] = previous;
        auto const freed = storage.turnOver(support::fromUtf8(urls[i]), L"PLAN.DWG");
        return freed.hasValue() ? std::to_string(freed.value().contents) : messageOf(freed);
    }

    void expectAllReadable() const
    {
        for (std::size_t i = 0; i < urls.size(); ++i) {
            EXPECT_EQ(contentOf(urls[i]), contents[i]) << i;
        }
    }
};

TEST_F(TurningOver, MakesDifferencesOfWholeObjects)
{
    commitWhole(40);
    tav::LocalStorage storage = newStorage();
    EXPECT_EQ(turnOver(storage, 0, ""), "0");
    for (std::size_t i = 1; i < urls.size(); ++i) {
        EXPECT_EQ(turnOver(storage, i, urls[i - 1]), "1") << i;
        EXPECT_EQ(deltasOf(urls[i]), (i - 1) % 32 + 1) << i;
    }
    EXPECT_EQ(messageOf(storage.flush()), "success");
    expectAllReadable();
    EXPECT_EQ(turnOver(storage, 5, urls[4]), "0") << "it is a difference already";
}

TEST_F(TurningOver, LeavesWhatDoesNotGetSmaller)
{
    commitWhole(1);
    urls.push_back(commit("other", drawing(9, 3000)));
    contents.push_back(drawing(9, 3000));
    tav::LocalStorage storage = newStorage();
    EXPECT_EQ(turnOver(storage, 1, urls[0]), "0");
    EXPECT_TRUE(objectOf(urls[1]).isWhole());
    EXPECT_THAT(files(), testing::Not(testing::Contains(testing::HasSubstr("incoming/"))));
}

TEST_F(TurningOver, CompressesMoreThoroughlyWhatStaysWhole)
{
    std::string text;
    for (int i = 0; i < 3000; ++i) {
        text += "  0\nLINE\n  5\n" + std::to_string(i * 7919 % 4099) + "\n 10\n" + std::to_string(i * 104729 % 9973);
    }
    std::string const url = commit("plan.dxf", text);
    std::size_t const before = repo.read(fileOf(url)).size();
    auto const freed = newStorage().turnOver(support::fromUtf8(url), L"plan.dxf");
    ASSERT_TRUE(freed.hasValue()) << messageOf(freed);
    EXPECT_EQ(repo.read(fileOf(url)).size() + freed.value().bytes, before);
    EXPECT_LT(repo.read(fileOf(url)).size(), before * 9 / 10);
    EXPECT_EQ(contentOf(url), text);
    EXPECT_TRUE(objectOf(url).isWhole());
}

TEST_F(TurningOver, MakesNoCircle)
{
    commitVersions(3);
    tav::LocalStorage storage = newStorage();
    EXPECT_EQ(turnOver(storage, 0, urls[2]), "0") << "a file that became again what it was";
    EXPECT_EQ(turnOver(storage, 0, urls[0]), "0");
    expectAllReadable();
}

TEST_F(TurningOver, MakesNoChainTooLong)
{
    commitVersions(34); // 32 differences on the first one, and one more
    std::string const first = store("first.DWG", edited(contents[0], 99));
    tav::LocalStorage storage = newStorage();
    EXPECT_EQ(turnOver(storage, 0, first), "0");
    expectAllReadable();
}

TEST_F(TurningOver, LeavesADamagedObjectAndBuildsNothingOnOne)
{
    commitWhole(3);
    repo.write(fileOf(urls[1]), "damaged");
    tav::LocalStorage storage = newStorage();
    EXPECT_EQ(turnOver(storage, 1, urls[0]), "0");
    EXPECT_EQ(turnOver(storage, 2, urls[1]), "0");
    EXPECT_EQ(repo.read(fileOf(urls[1])), "damaged");
    EXPECT_TRUE(objectOf(urls[2]).isWhole());
}

TEST_F(TurningOver, LeavesAllThatOthersBuildOnWhenTheRestIsRemoved)
{
    commitVersions(4);
    std::string const dropped = store("dropped", "dropped");
    auto const freed = newStorage().keepOnly({support::fromUtf8(urls[2])});
    ASSERT_TRUE(freed.hasValue()) << messageOf(freed);
    EXPECT_EQ(freed.value().contents, 2u);
    EXPECT_EQ(contentOf(urls[2]), contents[2]);
    EXPECT_FALSE(contains(urls[3]));
    EXPECT_FALSE(contains(dropped));
}

TEST_F(TurningOver, RemovesNoObjectWhereItIsNotKnownWhatOneBuildsOn)
{
    commitVersions(3);
    std::string bytes = repo.read(fileOf(urls[1]));
    bytes[40] = static_cast<char>(bytes[40] ^ 1);
    repo.write(fileOf(urls[1]), bytes);
    EXPECT_EQ(
        messageOf(newStorage().keepOnly({support::fromUtf8(urls[1])})), "The object '" + urls[1] + "' is damaged.");
    EXPECT_EQ(contentOf(urls[0]), contents[0]);
    EXPECT_EQ(repo.read(fileOf(urls[1])), bytes);
}

/// Objects as somebody else could have made them.
class MadeUpObjects : public StorageTest {
protected:
    static std::string hex(unsigned i)
    {
        tav::Digest digest;
        digest.fill(static_cast<unsigned char>(i));
        return tav::hexOf(digest);
    }

    /// Writes the object `i`, which claims to build on the object `base`.
    void make(unsigned i, unsigned base, std::uint64_t length = 3) const
    {
        std::string const frame("\x28\xb5\x2f\xfd\x20\x03\x19\0\0abc", 12);
        tav::Record record;
        record.digest.fill(static_cast<unsigned char>(i));
        record.base.fill(static_cast<unsigned char>(base));
        record.length = length;
        record.framesLength = frame.size();
        repo.write(".tav/objects/" + hex(i), tav::headerOf(record) + frame);
    }

    static std::string damaged(unsigned i) { return "The content of 'po:" + hex(i) + "' is damaged."; }
    static std::string damagedBase(unsigned i, unsigned top)
    {
        return "The content of 'po:" + hex(i) + "', which 'po:" + hex(top) + "' builds on, is damaged.";
    }
};

TEST_F(MadeUpObjects, AreNotFollowedInACircle)
{
    make(1, 1);
    EXPECT_EQ(contentOf("po:" + hex(1)), damaged(1));
    make(2, 3);
    make(3, 2);
    EXPECT_EQ(contentOf("po:" + hex(2)), damaged(2));
    EXPECT_EQ(contentOf("po:" + hex(3)), damaged(3));
}

TEST_F(MadeUpObjects, AreNotFollowedAlongALongChain)
{
    make(1, 0);
    for (unsigned i = 2; i <= 34; ++i) {
        make(i, i - 1);
    }
    EXPECT_EQ(contentOf("po:" + hex(34)), damaged(34));
    EXPECT_EQ(deltasOf("po:" + hex(34)), 33u);
}

TEST_F(MadeUpObjects, UnpackNoMoreThanTheyHoldHoweverMuchTheyClaim)
{
    make(1, 0, std::uint64_t{1} << 60U);
    make(2, 1, std::uint64_t{1} << 60U);
    make(3, 1);
    EXPECT_EQ(contentOf("po:" + hex(1)), damaged(1));
    EXPECT_EQ(contentOf("po:" + hex(2)), damagedBase(1, 2));
    EXPECT_EQ(contentOf("po:" + hex(3)), damagedBase(1, 3));
}

TEST_F(MadeUpObjects, AreNotBelievedUnderAnotherName)
{
    make(1, 0);
    repo.write(".tav/objects/" + hex(2), repo.read(".tav/objects/" + hex(1)));
    make(3, 2);
    EXPECT_EQ(contentOf("po:" + hex(2)), damaged(2));
    EXPECT_EQ(contentOf("po:" + hex(3)), damagedBase(2, 3));
}

} // namespace
} // namespace storage_tests
