#include "storage_test.h"
#include "tests/support/utf8.h"

#include <set>

namespace storage_tests {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class Cleaning : public StorageTest {
protected:
    /// Cleans; "2 contents, 345 bytes" or the message.
    std::string keepOnly(std::vector<std::string> const& wanted) const
    {
        std::set<OdString> kept;
        for (std::string const& url : wanted) {
            kept.insert(support::fromUtf8(url));
        }
        auto const freed = newStorage().keepOnly(kept);
        return freed.hasValue() ? std::to_string(freed.value().contents) + " contents, " +
                                      std::to_string(freed.value().bytes) + " bytes"
                                : messageOf(freed);
    }

    /// Versions of "plan.dwg", a new whole one every third time.
    void commitMany()
    {
        for (unsigned i = 0; i < 9; ++i) {
            contents.push_back(i % 3 == 0 ? drawing(i, 500) : edited(contents.back(), i));
            urls.push_back(commit("plan.dwg", contents.back()));
        }
    }

    std::size_t sizeOf(std::string const& file) const { return repo.read(file).size(); }

    std::vector<std::string> contents;
    std::vector<std::string> urls;
};

TEST_F(Cleaning, KeepsWhatIsNeededAndNothingElse)
{
    commitMany();
    std::string const kept = store("kept", "kept");
    std::string const dropped = store("dropped", "dropped");
    std::string const other = store("other.dwg", "other");
    std::size_t const before = sizeOf(fileOf(urls[0])) + sizeOf(fileOf(dropped)) + sizeOf(fileOf(other));
    std::string const answer = keepOnly({urls[1], urls[6], kept});
    EXPECT_EQ(answer, "8 contents, " + std::to_string(before - sizeOf(fileOf(urls[0]))) + " bytes");
    EXPECT_THAT(files(), testing::UnorderedElementsAre(fileOf(kept), fileOf(urls[0])));
    for (std::size_t i = 0; i < urls.size(); ++i) {
        bool const isNeeded = i == 0 || i == 1 || i == 6; // The first is the base of the second.
        EXPECT_EQ(contentOf(urls[i]), isNeeded ? contents[i] : "'" + urls[i] + "' is not in the storage.");
    }
    EXPECT_EQ(contentOf(kept), "kept");
}

TEST_F(Cleaning, SeesAllThatIsKept)
{
    commitMany();
    urls.push_back(store("kept", "kept"));
    urls.push_back(store("other.dwg", "other"));
    repo.write(".tav/objects/notes", "of somebody else");
    repo.write(".tav/tf/notes", "of somebody else");
    std::set<OdString> all;
    for (std::string const& url : urls) {
        all.insert(support::fromUtf8(url));
    }
    auto const found = newStorage().contents();
    ASSERT_TRUE(found.hasValue());
    EXPECT_EQ(found.value(), all);
}

TEST_F(Cleaning, LeavesAStoreAloneThatHoldsNothingElse)
{
    commitMany();
    std::string const before = repo.read(fileOf(urls[0]));
    EXPECT_EQ(keepOnly(urls), "0 contents, 0 bytes");
    EXPECT_EQ(repo.read(fileOf(urls[0])), before);
}

TEST_F(Cleaning, RemovesEverythingWhenNothingIsKept)
{
    commitMany();
    store("file", "text");
    EXPECT_EQ(keepOnly({}).substr(0, 12), "10 contents,");
    EXPECT_THAT(files(), IsEmpty());
    EXPECT_EQ(keepOnly({}), "0 contents, 0 bytes");
}

TEST_F(Cleaning, RemovesWhatInterruptedOperationsHaveLeftAndNoFileOfOthers)
{
    std::string const url = store("plan.dwg", "abc");
    std::string const whole = repo.read(fileOf(url));
    repo.write(fileOf(url), whole + "torn");
    repo.write(".tav/objects/incoming/x", "12345");
    repo.write(".tav/restoring/1-1", "12345");
    repo.write(fileOf(url) + ".new", "12345");
    repo.write(".tav/tav.state", "state");
    repo.write(".tav/objects/README", "text");
    repo.write(".tav/tf/.hidden.tf", "text");
    EXPECT_EQ(keepOnly({url}), "0 contents, 19 bytes");
    EXPECT_EQ(repo.read(fileOf(url)), whole);
    EXPECT_THAT(files(), ElementsAre(".tav/objects/README", ".tav/tav.state", ".tav/tf/.hidden.tf", fileOf(url)));
}

TEST_F(Cleaning, LeavesAStoreAsItIsInWhichSomethingToKeepIsDamaged)
{
    commitMany();
    store("file", "text");
    std::string bytes = repo.read(fileOf(urls[0]));
    bytes.back() = static_cast<char>(bytes.back() ^ 1);
    repo.write(fileOf(urls[0]), bytes);
    std::string const store = "The revision store '" + urls[0].substr(3, urls[0].find('#') - 3) + "'";
    EXPECT_EQ(keepOnly({urls[1], urls[8]}), store + " is damaged.");
    EXPECT_EQ(repo.read(fileOf(urls[0])), bytes);
    EXPECT_THAT(files(), ElementsAre(fileOf(urls[0])));
    std::string const foreign = urls[0].substr(0, urls[0].find('#') + 1) + std::string(64, '0');
    EXPECT_EQ(keepOnly({urls[1], foreign}), store + " lacks a revision that is to be kept.");
    EXPECT_EQ(repo.read(fileOf(urls[0])), bytes);
}

TEST_F(Cleaning, RefusesAUrlThatIsNone)
{
    std::string const url = store("plan.dwg", "abc");
    EXPECT_EQ(keepOnly({url, "tf:x"}), "'tf:x' is not a URL of this storage.");
    EXPECT_TRUE(contains(url));
}

TEST_F(Cleaning, FlushesFirst)
{
    repo.write("file", "text");
    tav::LocalStorage storage = newStorage();
    OdString const url = storage.store(L"file").value();
    EXPECT_EQ(messageOf(storage.keepOnly({url})), "success");
    EXPECT_EQ(contentOf(url.ansi_str()), "text");
}

} // namespace
} // namespace storage_tests
