#include "host/pictures/picture_cache.h"

#include "tests/support/failing_call.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <gmock/gmock.h>
#include <sys/stat.h>
#include <utime.h>

namespace tav {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::uint64_t kNoLimit = std::uint64_t(1) << 40U;

std::string digestOf(char first, char rest = '0')
{
    return first + std::string(63, rest);
}

class PictureCacheTest : public testing::Test {
protected:
    support::TempFolder folder;
    PictureCache cache = PictureCache(folder.pathTo("cache/pictures"), kNoLimit);

    // Where a picture is, below the folder.
    static std::string nameOf(std::string const& digest)
    {
        return std::string("cache/pictures/") + digest[0] + "/" + digest + ".picture";
    }
    void makeOld(std::string const& digest, int age)
    {
        struct utimbuf const times = {1'000'000'000 - age, 1'000'000'000 - age};
        ASSERT_EQ(utime(folder.pathTo(nameOf(digest)).c_str(), &times), 0);
    }
};

TEST_F(PictureCacheTest, GivesBackWhatWasKept)
{
    cache.keep(digestOf('a'), "a picture");
    cache.keep(digestOf('b'), std::string("with\0nul", 8));
    EXPECT_EQ(cache.find(digestOf('a')), "a picture");
    EXPECT_EQ(cache.find(digestOf('b')), std::string("with\0nul", 8));
}

TEST_F(PictureCacheTest, KnowsThatAContentHasNoPicture)
{
    cache.keep(digestOf('a'), "");
    EXPECT_EQ(cache.find(digestOf('a')), "");
}

TEST_F(PictureCacheTest, HasNothingThatWasNotKept)
{
    EXPECT_EQ(cache.find(digestOf('a')), std::nullopt);
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST_F(PictureCacheTest, ReplacesAPicture)
{
    cache.keep(digestOf('a'), "a picture");
    cache.keep(digestOf('a'), "another one");
    EXPECT_EQ(cache.find(digestOf('a')), "another one");
}

TEST_F(PictureCacheTest, IsForTheUserAlone)
{
    cache.keep(digestOf('a'), "a picture");
    for (std::string const& name : {std::string("cache/pictures/a"), nameOf(digestOf('a'))}) {
        struct stat status = {};
        ASSERT_EQ(stat(folder.pathTo(name).c_str(), &status), 0);
        EXPECT_EQ(status.st_mode & 077U, 0U) << name;
    }
}

TEST_F(PictureCacheTest, TakesNothingButDigests)
{
    for (std::string const& digest :
         {std::string(), std::string("a"), std::string("../") + std::string(61, 'a'), std::string(64, 'A'),
          std::string(65, 'a'), std::string(63, 'a'), std::string(62, 'a') + "/a"}) {
        cache.keep(digest, "a picture");
        EXPECT_EQ(cache.find(digest), std::nullopt) << digest;
    }
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST_F(PictureCacheTest, ReadsNothingButDigests)
{
    cache.keep(digestOf('a'), "a picture");
    folder.write("cache/pictures/n/notes.picture", folder.read(nameOf(digestOf('a'))));
    EXPECT_EQ(cache.find("notes"), std::nullopt);
}

TEST_F(PictureCacheTest, PassesOverAPictureThatIsDamagedAnywhere)
{
    cache.keep(digestOf('a'), "a picture");
    std::string const name = nameOf(digestOf('a'));
    std::string const whole = folder.read(name);
    for (std::size_t at = 0; at < whole.size(); ++at) {
        std::string damaged = whole;
        damaged[at] = static_cast<char>(damaged[at] ^ 1);
        folder.write(name, damaged);
        EXPECT_EQ(cache.find(digestOf('a')), std::nullopt) << at;
    }
    for (std::size_t length = 0; length < whole.size(); ++length) {
        folder.write(name, whole.substr(0, length));
        EXPECT_EQ(cache.find(digestOf('a')), std::nullopt) << "cut at " << length;
    }
    cache.keep(digestOf('a'), "a picture");
    EXPECT_EQ(cache.find(digestOf('a')), "a picture");
}

TEST_F(PictureCacheTest, RemovesTheOldestPicturesWhenTheLimitIsReached)
{
    // Every sixteenth of the limit has room for three blocks of 4096 bytes.
    PictureCache const small(folder.pathTo("cache/pictures"), 16 * 3 * 4096);
    small.keep(digestOf('a', '1'), "one");
    small.keep(digestOf('a', '2'), "two");
    small.keep(digestOf('a', '3'), "three");
    small.keep(digestOf('b', '1'), "elsewhere");
    makeOld(digestOf('a', '1'), 1);
    makeOld(digestOf('a', '2'), 3);
    makeOld(digestOf('a', '3'), 2);
    makeOld(digestOf('b', '1'), 4);

    small.keep(digestOf('a', '4'), "four");
    EXPECT_EQ(small.find(digestOf('a', '2')), std::nullopt);
    EXPECT_EQ(small.find(digestOf('a', '1')), "one");
    EXPECT_EQ(small.find(digestOf('a', '3')), "three");
    EXPECT_EQ(small.find(digestOf('a', '4')), "four");
    EXPECT_EQ(small.find(digestOf('b', '1')), "elsewhere");

    small.keep(digestOf('a', '5'), std::string(2 * 4096 - 18, 'x'));
    EXPECT_EQ(small.find(digestOf('a', '3')), std::nullopt);
    EXPECT_EQ(small.find(digestOf('a', '1')), std::nullopt);
    EXPECT_EQ(small.find(digestOf('a', '4')), "four");
}

TEST_F(PictureCacheTest, KeepsNoPictureThatWouldTakeItsWholePart)
{
    PictureCache const small(folder.pathTo("cache/pictures"), 16 * 4096);
    small.keep(digestOf('a', '1'), std::string(4096 - 18, 'x'));
    small.keep(digestOf('a', '2'), std::string(4096 - 17, 'x'));
    EXPECT_EQ(small.find(digestOf('a', '1')), std::string(4096 - 18, 'x'));
    EXPECT_EQ(small.find(digestOf('a', '2')), std::nullopt);
}

TEST_F(PictureCacheTest, ReadsNoPictureLongerThanItsPart)
{
    cache.keep(digestOf('a'), std::string(4096, 'x'));
    PictureCache const small(folder.pathTo("cache/pictures"), 16 * 4096);
    EXPECT_EQ(small.find(digestOf('a')), std::nullopt);
}

TEST_F(PictureCacheTest, RemovesNothingButItsOwnFiles)
{
    PictureCache const small(folder.pathTo("cache/pictures"), 16 * 4096);
    std::string const unfinished = "cache/pictures/a/" + digestOf('a', '1') + "-77-0.tmp";
    folder.write(unfinished, std::string(4096, 'x'));
    std::vector<std::string> const foreign = {"notes.txt",        ".hidden",
                                              digestOf('a', '2'), digestOf('a', '2') + ".tm",
                                              "thumb.picture",    digestOf('A') + ".picture"};
    for (std::string const& name : foreign) {
        folder.write("cache/pictures/a/" + name, std::string(4096, 'x'));
    }
    small.keep(digestOf('a', '3'), "a picture");
    EXPECT_FALSE(folder.has(unfinished));
    for (std::string const& name : foreign) {
        EXPECT_TRUE(folder.has("cache/pictures/a/" + name)) << name;
    }
}

TEST_F(PictureCacheTest, IsOfNoUseAndNoHarmWhereItCannotBeMade)
{
    folder.write("cache", "a file");
    cache.keep(digestOf('a'), "a picture");
    EXPECT_EQ(cache.find(digestOf('a')), std::nullopt);
    EXPECT_EQ(folder.read("cache"), "a file");
}

TEST_F(PictureCacheTest, HasTheOldPictureOrTheNewOneWhicheverCallFails)
{
    cache.keep(digestOf('a'), "old");
    int const calls = support::countCalls([&] { cache.keep(digestOf('a'), "old"); });
    ASSERT_GT(calls, 2);
    for (int n = 0; n < calls; ++n) {
        cache.keep(digestOf('a'), "old");
        support::FailingCall failing(n, ENOSPC);
        cache.keep(digestOf('a'), "new");
        EXPECT_THAT(cache.find(digestOf('a')), testing::AnyOf("old", "new")) << failing.name();
    }
    EXPECT_THAT(folder.list(), ElementsAre("cache/", "cache/pictures/", "cache/pictures/a/", nameOf(digestOf('a'))));
}

} // namespace

} // namespace tav
