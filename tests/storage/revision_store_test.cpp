// What a revision store serves when its file has been cut, damaged or made up.
#include "storage_test.h"
#include "tests/support/rows.h"
#include "tests/support/utf8.h"

#include <functional>
#include <memory>
#include <zstd.h>

namespace storage_tests {
namespace {

using testing::AnyOf;
using testing::ElementsAre;

class RevisionStore : public StorageTest {
protected:
    /// Three versions of a drawing, each a delta on the one before.
    void commitThree()
    {
        for (unsigned i = 0; i < 3; ++i) {
            contents.push_back(i == 0 ? drawing(0, 300) : edited(contents.back(), i));
            urls.push_back(commit("plan.dwg", contents.back()));
        }
        file = fileOf(urls[0]);
        whole = repo.read(file);
    }

    void damage(std::size_t place) const
    {
        std::string bytes = whole;
        bytes[place] = static_cast<char>(bytes[place] ^ (1 << place % 8));
        repo.write(file, bytes);
    }

    std::string damaged(std::size_t i) const { return "The content of '" + urls[i] + "' is damaged."; }
    std::string missing(std::size_t i) const { return "'" + urls[i] + "' is not in the storage."; }

    std::vector<std::string> contents;
    std::vector<std::string> urls;
    std::string file;
    std::string whole;
};

TEST_F(RevisionStore, ServesEarlierRevisionsAndTakesANewOneWhereverTheLastIsCutOff)
{
    commitThree();
    auto const before = static_cast<std::size_t>(recordsOf(urls[0]).entries()[2].offset);
    committed["plan.dwg"] = urls[1];
    for (std::size_t length = before; length < whole.size(); ++length) {
        repo.write(file, whole.substr(0, length));
        EXPECT_EQ(contentOf(urls[0]), contents[0]) << length;
        EXPECT_EQ(contentOf(urls[1]), contents[1]) << length;
        EXPECT_EQ(contentOf(urls[2]), missing(2)) << length;
        EXPECT_EQ(store("plan.dwg", contents[2]), urls[2]) << length;
        EXPECT_EQ(contentOf(urls[2]), contents[2]) << length;
        EXPECT_EQ(repo.read(file), whole) << length;
    }
}

TEST_F(RevisionStore, DropsWhatAnAppendThatWasKilledHasLeft)
{
    commitThree();
    auto const before = static_cast<std::size_t>(recordsOf(urls[0]).entries()[2].offset);
    committed["plan.dwg"] = urls[1];
    std::string bytes = whole;
    bytes.replace(before, tav::kHeaderLength, tav::kHeaderLength, '\0'); // It would have been written last.
    for (std::size_t length = before; length <= bytes.size(); ++length) {
        repo.write(file, bytes.substr(0, length));
        EXPECT_EQ(store("plan.dwg", contents[2]), urls[2]) << length;
        EXPECT_TRUE(repo.read(file) == whole) << length;
    }
}

TEST_F(RevisionStore, DropsATailThatCanHoldNothing)
{
    commitThree();
    for (std::string const& tail : {std::string(5000, '\0'), whole.substr(0, 103), std::string("x")}) {
        repo.write(file, whole + tail);
        EXPECT_EQ(contentOf(urls[2]), contents[2]);
        std::string const content = edited(contents[2], 9);
        EXPECT_EQ(contentOf(store("plan.dwg", content)), content);
        EXPECT_TRUE(recordsOf(urls[0]).isClean());
    }
}

TEST_F(RevisionStore, AppendsBehindATailThatMayHoldSomething)
{
    commitThree();
    for (std::string const& tail :
         {drawing(9, 5000), whole.substr(0, 50) + whole.substr(0, 90), std::string(4096, '\0') + drawing(9, 1)}) {
        repo.write(file, whole + tail);
        EXPECT_EQ(contentOf(urls[2]), contents[2]);
        std::string const content = edited(contents[2], 9);
        EXPECT_EQ(contentOf(store("plan.dwg", content)), content);
        EXPECT_EQ(contentOf(urls[2]), contents[2]);
        EXPECT_EQ(repo.read(file).substr(0, whole.size() + tail.size()), whole + tail);
    }
}

TEST_F(RevisionStore, KeepsTheNewestRevisionWhicheverByteOfItsHeaderIsDamaged)
{
    commitThree();
    auto const begin = static_cast<std::size_t>(recordsOf(urls[0]).entries()[2].offset);
    std::string const content = edited(contents[2], 9);
    for (std::size_t place = begin; place < begin + tav::kHeaderLength; ++place) {
        damage(place);
        EXPECT_EQ(contentOf(urls[2]), missing(2)) << place;
        std::string const url = store("plan.dwg", content);
        EXPECT_EQ(contentOf(url), content) << place;
        std::string mended = repo.read(file);
        mended.replace(0, whole.size(), whole);
        repo.write(file, mended);
        EXPECT_EQ(contentOf(urls[2]), contents[2]) << place;
        EXPECT_EQ(contentOf(url), content) << place;
    }
}

TEST_F(RevisionStore, KeepsARevisionWithADamagedHeaderWhenAnAppendIsTakenBack)
{
    commitThree();
    for (std::size_t const begin : {std::size_t{0}, static_cast<std::size_t>(recordsOf(urls[0]).entries()[2].offset)}) {
        std::string bytes = begin == 0 ? whole.substr(0, recordsOf(urls[0]).entries()[0].end()) : whole;
        bytes[begin + 40] = static_cast<char>(bytes[begin + 40] ^ 1);
        repo.write(file, bytes);
        repo.write("plan.dwg", edited(contents[2], 9));
        EXPECT_EQ(messageOf(newStorage().store(L"plan.dwg")), "success");
        ASSERT_TRUE(repo.has(file));
        EXPECT_EQ(repo.read(file), bytes);
        repo.write(file, whole);
    }
}

TEST_F(RevisionStore, GivesNoWrongContentWhicheverByteIsDamaged)
{
    commitThree();
    for (std::size_t place = 0; place < whole.size(); ++place) {
        damage(place);
        for (std::size_t i = 0; i < urls.size(); ++i) {
            EXPECT_THAT(contentOf(urls[i]), AnyOf(contents[i], damaged(i), missing(i))) << place;
        }
        EXPECT_NE(verify(urls[0]) + verify(urls[1]) + verify(urls[2]), "successsuccesssuccess") << place;
    }
}

TEST_F(RevisionStore, StepsOverADamagedHeaderAndLosesNothingBehindIt)
{
    commitThree();
    std::string const other = commit("plan.dwg", drawing(7, 300)); // Whole: too different from the others.
    whole = repo.read(file);
    damage(static_cast<std::size_t>(recordsOf(urls[0]).entries()[1].offset) + 20);
    EXPECT_EQ(contentOf(urls[0]), contents[0]);
    EXPECT_EQ(contentOf(urls[1]), missing(1));
    EXPECT_EQ(contentOf(urls[2]), damaged(2));
    EXPECT_EQ(contentOf(other), drawing(7, 300));
    std::string const last = commit("plan.dwg", drawing(8, 300));
    EXPECT_EQ(contentOf(last), drawing(8, 300));
    EXPECT_EQ(contentOf(other), drawing(7, 300));
    EXPECT_EQ(repo.read(file).size() > whole.size(), true);
}

TEST_F(RevisionStore, BuildsNothingOnADamagedRevision)
{
    commitThree();
    damage(whole.size() - 1);
    std::string const content = edited(contents[2], 9);
    std::string const url = commit("plan.dwg", content);
    EXPECT_EQ(contentOf(urls[2]), damaged(2));
    EXPECT_EQ(contentOf(url), content);
}

TEST_F(RevisionStore, StoresARevisionAgainThatAnInterruptedCommitLeftDamaged)
{
    commitThree();
    damage(whole.size() - 1);
    committed["plan.dwg"] = urls[1];
    EXPECT_EQ(store("plan.dwg", contents[2]), urls[2]);
    EXPECT_EQ(contentOf(urls[2]), contents[2]);
    EXPECT_EQ(recordsOf(urls[2]).entries().size(), 4u);
}

TEST_F(RevisionStore, ReadsLaterRevisionsAgainWhenTheOneTheyBuildOnIsStoredAgain)
{
    commitThree();
    auto const begin = static_cast<std::size_t>(recordsOf(urls[0]).entries()[1].offset);
    for (std::size_t const place : {begin + 40, begin + tav::kHeaderLength + 5}) { // In the header, in the frame.
        damage(place);
        EXPECT_EQ(contentOf(urls[2]), damaged(2)) << place;
        EXPECT_EQ(store("plan.dwg", contents[1]), urls[1]) << place;
        for (std::size_t i = 0; i < urls.size(); ++i) {
            EXPECT_EQ(contentOf(urls[i]), contents[i]) << place;
        }
    }
}

TEST_F(RevisionStore, ReadsTheWholeOfALongChainWhenAnEarlyLinkIsStoredAgain)
{
    for (unsigned i = 0; i <= tav::kLongestChain; ++i) {
        contents.push_back(i == 0 ? drawing(0, 300) : edited(contents.back(), i));
        urls.push_back(commit("plan.dwg", contents.back()));
    }
    file = fileOf(urls[0]);
    whole = repo.read(file);
    auto const begin = static_cast<std::size_t>(recordsOf(urls[0]).entries()[5].offset);
    for (std::size_t const place : {begin + 40, begin + tav::kHeaderLength + 5}) {
        for (std::size_t const previous : {4u, 5u, 32u}) {
            damage(place);
            committed["plan.dwg"] = urls[previous];
            EXPECT_EQ(store("plan.dwg", contents[5]), urls[5]);
            for (std::size_t i = 0; i < urls.size(); ++i) {
                EXPECT_EQ(contentOf(urls[i]), contents[i]) << i << " after " << previous << ", " << place;
            }
        }
    }
}

TEST_F(RevisionStore, StoresAgainWhatIsKnownUnderItsUrlButCannotBeRead)
{
    commitThree();
    for (std::size_t i = 0; i < urls.size(); ++i) {
        known[urls[i].substr(urls[i].size() - 64)] = urls[i];
    }
    for (std::size_t place = 0; place < whole.size(); place += 7) {
        damage(place);
        for (std::size_t i = 0; i < urls.size(); ++i) {
            EXPECT_EQ(store(i == 1 ? "text" : "copy.dwg", contents[i]), urls[i]) << place;
        }
        for (std::size_t i = 0; i < urls.size(); ++i) {
            EXPECT_EQ(contentOf(urls[i]), contents[i]) << place;
        }
    }
    EXPECT_THAT(files(), ElementsAre(file));
}

TEST_F(RevisionStore, LosesTheDamagedRecordOfARevisionStoredAgainWithTheNextCleaning)
{
    commitThree();
    for (std::size_t const place : {std::size_t{40}, std::size_t{150}}) {
        damage(place);
        EXPECT_EQ(store("plan.dwg", contents[0]), urls[0]);
        auto const freed =
            newStorage().keepOnly({support::fromUtf8(urls[0]), support::fromUtf8(urls[1]), support::fromUtf8(urls[2])});
        EXPECT_EQ(messageOf(freed), "success");
        EXPECT_EQ(repo.read(file).size(), whole.size());
        EXPECT_TRUE(recordsOf(urls[0]).isClean());
        for (std::size_t i = 0; i < urls.size(); ++i) {
            EXPECT_EQ(contentOf(urls[i]), contents[i]) << place;
        }
    }
}

/// How long the chains of the revisions of one drawing may become.
struct Chains {
    char const* name;
    std::size_t length; ///< of the drawing
    std::size_t longest;
};

class RevisionStoreChains
    : public RevisionStore
    , public testing::WithParamInterface<Chains> {};

TEST_P(RevisionStoreChains, GrowToTheirBoundAndBeginAgain)
{
    std::string content = drawing(0, GetParam().length);
    std::vector<std::string> versions;
    for (unsigned i = 0; i < 40; ++i) {
        versions.push_back(i == 0 ? content : edited(versions.back(), i));
        urls.push_back(commit("plan.dwg", versions.back()));
    }
    auto const records = std::make_shared<tav::RecordFile const>(recordsOf(urls[0]));
    ASSERT_EQ(records->entries().size(), 40u);
    for (std::size_t i = 0; i < 40; ++i) {
        std::size_t const expected = i == 0 ? 0 : (i - 1) % GetParam().longest + 1;
        EXPECT_EQ(tav::chainOf({records, i}, tav::basesIn(records)).size() - 1, expected) << i;
        EXPECT_EQ(contentOf(urls[i]), versions[i]) << i;
    }
}

INSTANTIATE_TEST_SUITE_P(
    Lengths, RevisionStoreChains,
    testing::Values(Chains{"OneSegment", 1u << 12U, 32}, Chains{"MoreThanOneSegment", (1u << 12U) + 1, 8}),
    support::rowName);

TEST_F(RevisionStore, KeepsAContentWholeWhereTheBaseIsOfNoUse)
{
    std::string const first = commit("plan.dwg", drawing(0, 5 * kSegment));
    std::string const second = commit("plan.dwg", drawing(1, 5 * kSegment));
    EXPECT_EQ(fileOf(first), fileOf(second));
    tav::RecordFile const records = recordsOf(first);
    ASSERT_EQ(records.entries().size(), 2u);
    EXPECT_TRUE(records.entries()[1].record.isWhole());
    EXPECT_EQ(contentOf(second), drawing(1, 5 * kSegment));
}

struct Change {
    char const* name;
    std::function<std::string(std::string)> make;
};

class DeltaOverSegments
    : public RevisionStore
    , public testing::WithParamInterface<Change> {};

TEST_P(DeltaOverSegments, GivesBackTheContentAndIsSmall)
{
    std::string const before = drawing(0, 10 * kSegment + 123);
    std::string const after = GetParam().make(before);
    std::string const first = commit("plan.dwg", before);
    std::string const second = commit("plan.dwg", after);
    EXPECT_EQ(contentOf(first), before);
    EXPECT_EQ(contentOf(second), after);
    tav::RecordFile const records = recordsOf(first);
    ASSERT_EQ(records.entries().size(), 2u);
    EXPECT_FALSE(records.entries()[1].record.isWhole());
    EXPECT_LT(records.entries()[1].record.framesLength, before.size() / 4);
}

INSTANTIATE_TEST_SUITE_P(
    Changes, DeltaOverSegments,
    testing::Values(
        Change{"Edit", [](std::string bytes) { return edited(std::move(bytes), 1); }},
        Change{"Insertion", [](std::string bytes) { return bytes.insert(5000, "inserted"); }},
        Change{"Deletion", [](std::string bytes) { return bytes.erase(5000, 1500); }},
        Change{"Cut", [](std::string bytes) { return bytes.substr(0, 9 * kSegment - 1); }},
        Change{"CutToSegments", [](std::string bytes) { return bytes.substr(0, 8 * kSegment); }},
        Change{"Appendage", [](std::string bytes) { return bytes + "appended"; }},
        Change{"GrownWithZeros", [](std::string bytes) { return bytes + std::string(20 * kSegment, '\0'); }},
        Change{"CutToOneSegment", [](std::string bytes) { return bytes.substr(0, kSegment); }}),
    support::rowName);

TEST_F(RevisionStore, BuildsALargeContentOnASmallOne)
{
    std::string const before = drawing(0, 1000);
    std::string const after = before + drawing(1, 5 * kSegment);
    std::string const first = commit("plan.dwg", before);
    std::string const second = commit("plan.dwg", after);
    EXPECT_FALSE(recordsOf(first).entries()[1].record.isWhole());
    EXPECT_EQ(contentOf(second), after);
}

/// A store made up byte by byte: as a stranger would.
class MadeUpStore : public RevisionStore {
protected:
    static std::string frameOf(std::string const& content)
    {
        std::string frame(ZSTD_compressBound(content.size()), '\0');
        frame.resize(ZSTD_compress(frame.data(), frame.size(), content.data(), content.size(), 3));
        return frame;
    }

    static tav::Record recordOf(char digest, char base, std::string const& frame, std::uint64_t length)
    {
        tav::Record record;
        record.digest.fill(static_cast<unsigned char>(digest));
        record.base.fill(static_cast<unsigned char>(base));
        record.length = length;
        record.framesLength = frame.size();
        return record;
    }

    /// What reading the revision of the digest 0101... of a store with these bytes says.
    std::string read(std::string const& bytes) const
    {
        repo.write(".tav/tf/x.tf", bytes);
        return contentOf(kUrl);
    }

    static inline std::string const kUrl = "tf:x#0101010101010101010101010101010101010101010101010101010101010101";
    std::string const damagedX = "The content of '" + kUrl + "' is damaged.";
    std::string const missingX = "'" + kUrl + "' is not in the storage.";
    std::string const frame = frameOf("abc");
};

TEST_F(MadeUpStore, IsNotBelieved)
{
    EXPECT_EQ(read(""), missingX);
    EXPECT_EQ(read(headerOf(recordOf(1, 0, frame, 3)) + frame), damagedX) << "another digest";
    EXPECT_EQ(read(headerOf(recordOf(1, 0, frame, 4)) + frame), damagedX) << "another length";
    EXPECT_EQ(read(headerOf(recordOf(1, 0, frame, std::uint64_t{1} << 60U)) + frame), damagedX) << "a huge length";
    EXPECT_EQ(read(headerOf(recordOf(1, 0, frame + frame, 3)) + frame + frame), damagedX) << "a frame too many";
    EXPECT_EQ(read(headerOf(recordOf(1, 1, frame, 3)) + frame), damagedX) << "its own base";
    EXPECT_EQ(read(headerOf(recordOf(1, 2, frame, 3)) + frame), damagedX) << "a base that is missing";
    EXPECT_EQ(read(headerOf(recordOf(1, 2, frame, 3)) + frame + headerOf(recordOf(2, 1, frame, 3)) + frame), damagedX)
        << "bases in a circle";
    tav::Record endless = recordOf(1, 0, frame, 3);
    endless.framesLength = std::uint64_t{1} << 60U;
    EXPECT_EQ(read(headerOf(endless) + frame), missingX) << "frames beyond the end";
    endless.framesLength = ~std::uint64_t{0};
    EXPECT_EQ(read(headerOf(endless) + frame), missingX) << "frames whose end wraps around";
    std::string skippable("\x50\x2a\x4d\x18\x03\0\0\0abc", 11);
    EXPECT_EQ(read(headerOf(recordOf(1, 0, skippable, 3)) + skippable), damagedX) << "a frame without content";
}

TEST_F(MadeUpStore, UnpacksNoMoreThanItsLengthSays)
{
    std::string const three("\x19\0\0abc", 6);                            // the last block, as it stands
    std::string const many("\xfb\xff\x0fx", 4);                           // the last block, one byte 131,071 times
    std::string const huge("\x28\xb5\x2f\xfd\xe0\0\0\0\0\0\0\0\x10", 13); // of 2^60 bytes
    std::string const small("\x28\xb5\x2f\xfd\x20\x03", 6);               // of 3 bytes
    std::string const unknown("\x28\xb5\x2f\xfd\0\xff", 6);               // of any length, with the largest window
    std::uint64_t const exabyte = std::uint64_t{1} << 60U;
    for (std::string const& bomb : {huge + three, huge + many, small + many, unknown + three, unknown + many}) {
        for (std::uint64_t const length : {std::uint64_t{3}, std::uint64_t{131'071}, exabyte}) {
            EXPECT_EQ(read(headerOf(recordOf(1, 0, bomb, length)) + bomb), damagedX) << length;
        }
    }
    std::string const sound = small + three;
    EXPECT_EQ(ZSTD_getFrameContentSize(sound.data(), sound.size()), 3u) << "else all of them are no frames";
}

TEST_F(MadeUpStore, IsNotFollowedAlongALongChain)
{
    std::string bytes = headerOf(recordOf(100, 0, frame, 3)) + frame;
    for (char i = 100; i > 67; --i) {
        bytes += headerOf(recordOf(i == 68 ? char{1} : static_cast<char>(i - 1), i, frame, 3)) + frame;
    }
    EXPECT_EQ(read(bytes), damagedX);
    auto const records = std::make_shared<tav::RecordFile const>(recordsOf(kUrl));
    ASSERT_EQ(records->entries().size(), 34u);
    EXPECT_EQ(tav::chainOf({records, 32}, tav::basesIn(records)).size(), 33u);
    EXPECT_THROW(static_cast<void>(tav::chainOf({records, 33}, tav::basesIn(records))), tav::StorageError);
}

} // namespace
} // namespace storage_tests
