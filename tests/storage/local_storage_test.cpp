#include "storage_test.h"

#include "platform/os/os_calls.h"
#include "tests/support/utf8.h"

#include <cerrno>
#include <sys/stat.h>
#include <unistd.h>
#include <zstd.h>

namespace storage_tests {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::StartsWith;

std::string const kAbc = "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad";
std::string const kNothing = "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855";

class LocalStorage : public StorageTest {
protected:
    std::string extract(std::string const& url, std::string const& path) const
    {
        return messageOf(newStorage().extract(support::fromUtf8(url), repo.pathTo(path)));
    }

    mode_t modeOf(std::string const& name) const
    {
        struct stat status {};
        EXPECT_EQ(stat(repo.pathTo(name).c_str(), &status), 0) << name;
        return status.st_mode & 07777U;
    }
};

/// Brings the real calls back.
class RealCallsAfterwards {
public:
    RealCallsAfterwards() { real = os::calls(); }
    RealCallsAfterwards(RealCallsAfterwards const&) = delete;
    RealCallsAfterwards& operator=(RealCallsAfterwards const&) = delete;
    ~RealCallsAfterwards() { os::calls() = real; }

    static inline os::Calls real{};
};

TEST_F(LocalStorage, KeepsDrawingsInRevisionStoresAndOtherFilesAsObjects)
{
    std::string const plan = store("floors/plan.dwg", "abc");
    EXPECT_THAT(plan, StartsWith("tf:plan-"));
    EXPECT_EQ(plan.substr(plan.size() - 65), "#" + kAbc);
    EXPECT_EQ(store("notes.txt", ""), "po:" + kNothing);
    EXPECT_EQ(store("PLAN.DWG", "abc"), "po:" + kAbc);
    EXPECT_THAT(files(), ElementsAre(".tav/objects/" + kAbc, ".tav/objects/" + kNothing, fileOf(plan)));
}

TEST_F(LocalStorage, GivesBackContentsOfAnyLength)
{
    for (std::size_t const size :
         {std::size_t{0}, std::size_t{1}, kSegment - 1, kSegment, kSegment + 1, 2 * kSegment, 7 * kSegment + 5}) {
        for (std::string const& content : {drawing(1, size), std::string(size, 'x')}) {
            for (char const* const name : {"file", "plan.dwg", "b\xff\n.dwg", "a\xfe.txt"}) {
                std::string const url = store(name, content);
                EXPECT_EQ(contentOf(url), content) << url;
                EXPECT_EQ(newStorage().size(support::fromUtf8(url)).value(), size);
                EXPECT_EQ(verify(url), "success");
            }
        }
    }
}

TEST_F(LocalStorage, KeepsObjectsAsArchivesThatZstdUnpacks)
{
    std::string const content = drawing(1, 100) + std::string(3 * kSegment, 'x');
    std::string const archive = repo.read(fileOf(store("file", content)));
    std::string unpacked(content.size() + 1, '\0');
    unpacked.resize(ZSTD_decompress(unpacked.data(), unpacked.size(), archive.data(), archive.size()));
    EXPECT_EQ(unpacked, content);
    EXPECT_LT(archive.size(), 1000u);
}

TEST_F(LocalStorage, ReadsWhatIsNotFlushedYet)
{
    repo.write("plan.dwg", "drawing");
    repo.write("file", "text");
    tav::LocalStorage storage = newStorage();
    for (wchar_t const* const name : {L"plan.dwg", L"file"}) {
        OdString const url = storage.store(name).value();
        EXPECT_TRUE(storage.contains(url).value());
        EXPECT_EQ(messageOf(storage.verify(url)), "success");
    }
    EXPECT_TRUE(newStorage().contains(storage.store(L"plan.dwg").value()).value());
    EXPECT_FALSE(newStorage().contains(storage.store(L"file").value()).value());
}

TEST_F(LocalStorage, TakesBackWhatIsNotFlushed)
{
    std::string const first = commit("old.dwg", drawing(1, 100));
    std::string const before = repo.read(fileOf(first));
    repo.write("old.dwg", drawing(2, 100));
    repo.write("new.dwg", "drawing");
    repo.write("file", "text");
    {
        tav::LocalStorage storage = newStorage();
        for (wchar_t const* const name : {L"old.dwg", L"new.dwg", L"file"}) {
            EXPECT_EQ(messageOf(storage.store(name)), "success");
        }
    }
    EXPECT_THAT(files(), ElementsAre(fileOf(first)));
    EXPECT_EQ(repo.read(fileOf(first)), before);
}

TEST_F(LocalStorage, GivesTheSameUrlWhenAnInterruptedCommitIsRepeated)
{
    for (char const* const name : {"plan.dwg", "file"}) {
        std::string const url = store(name, name);
        std::string const bytes = repo.read(fileOf(url));
        EXPECT_EQ(store(name, name), url);
        EXPECT_EQ(repo.read(fileOf(url)), bytes);
    }
}

TEST_F(LocalStorage, DropsWhatAKilledProcessLeftInTheWay)
{
    repo.write(".tav/objects/incoming/" + kAbc, "half an object");
    EXPECT_EQ(contentOf(store("file", "abc")), "abc");
    EXPECT_THAT(files(), ElementsAre(".tav/objects/" + kAbc));
}

TEST_F(LocalStorage, KeepsEqualContentOfOneBatchOnce)
{
    tav::LocalStorage storage = newStorage();
    std::vector<OdString> urls;
    for (char const* const name : {"a.dwg", "b.dwg", "c"}) {
        repo.write(name, "abc");
        urls.push_back(storage.store(support::fromUtf8(name)).value());
    }
    EXPECT_EQ(messageOf(storage.flush()), "success");
    EXPECT_EQ(urls[0], urls[1]);
    EXPECT_EQ(urls[0], urls[2]);
    EXPECT_THAT(files(), ElementsAre(fileOf(urls[0].ansi_str())));
}

TEST_F(LocalStorage, KeepsContentOnceThatIsKnown)
{
    known[kAbc] = store("a.dwg", "abc");
    EXPECT_EQ(store("b.dwg", "abc"), known[kAbc]);
    EXPECT_EQ(store("c", "abc"), known[kAbc]);
    EXPECT_EQ(files().size(), 1u);
}

TEST_F(LocalStorage, DoesNotRelyOnAKnownUrlWhoseContentIsGoneOrOfAnotherDigest)
{
    for (std::string const& url :
         {"po:" + kAbc, "tf:gone#" + kAbc, "po:" + kNothing, std::string("tf:../x#1"), std::string()}) {
        known[kAbc] = url;
        std::string const kept = store("c", "abc");
        EXPECT_EQ(contentOf(kept), "abc") << url;
        EXPECT_EQ(kept, url == "tf:gone#" + kAbc ? url : "po:" + kAbc);
        EXPECT_EQ(unlink(repo.pathTo(fileOf(kept)).c_str()), 0) << url;
    }
}

TEST_F(LocalStorage, ReplacesAnObjectWhicheverByteOfItIsDamaged)
{
    std::string const url = store("file", "abc");
    std::string const whole = repo.read(fileOf(url));
    for (bool const isKnown : {false, true}) {
        known[kAbc] = isKnown ? url : "";
        for (std::size_t place = 0; place < whole.size(); ++place) {
            std::string bytes = whole;
            bytes[place] = static_cast<char>(bytes[place] ^ 1);
            repo.write(fileOf(url), bytes);
            EXPECT_EQ(store("file", "abc"), url) << place;
            EXPECT_EQ(repo.read(fileOf(url)), whole) << place;
        }
        repo.write(fileOf(url), "");
        EXPECT_EQ(store("file", "abc"), url);
        EXPECT_EQ(contentOf(url), "abc");
    }
    EXPECT_THAT(files(), ElementsAre(fileOf(url)));
}

TEST_F(LocalStorage, RepairsAContentFromAFileThatHasItAndFromNoOther)
{
    for (char const* const name : {"file", "plan.dwg"}) {
        std::string const url = store(name, "abc");
        tav::LocalStorage storage = newStorage();
        EXPECT_FALSE(storage.repair(support::fromUtf8(url), support::fromUtf8(name)).value());
        repo.write(fileOf(url), "damaged");
        repo.write("other", "abd");
        EXPECT_EQ(messageOf(storage.repair(support::fromUtf8(url), L"other")), "'other' has changed since.");
        EXPECT_TRUE(storage.repair(support::fromUtf8(url), support::fromUtf8(name)).value());
        EXPECT_EQ(contentOf(url), "abc");
    }
}

TEST_F(LocalStorage, KeepsADamagedObjectUntilTheNewOneIsFlushed)
{
    std::string const url = store("file", "abc");
    repo.write(fileOf(url), "damaged");
    {
        tav::LocalStorage storage = newStorage();
        EXPECT_EQ(messageOf(storage.store(L"file")), "success");
        EXPECT_EQ(messageOf(storage.verify(support::fromUtf8(url))), "success");
    }
    EXPECT_THAT(files(), ElementsAre(fileOf(url)));
    EXPECT_EQ(repo.read(fileOf(url)), "damaged");
}

TEST_F(LocalStorage, ReadsAKnownContentOnceHoweverManyFilesHaveIt)
{
    static std::string path;
    static int opened;
    known[kAbc] = store("a.dwg", "abc");
    path = repo.pathTo(fileOf(known[kAbc]));
    opened = 0;
    tav::LocalStorage storage = newStorage();
    RealCallsAfterwards const afterwards;
    os::calls().openat = [](int folder, char const* name, int flags, mode_t mode) {
        opened += name == path ? 1 : 0;
        return RealCallsAfterwards::real.openat(folder, name, flags, mode);
    };
    for (int i = 0; i < 3; ++i) {
        EXPECT_EQ(storage.store(L"a.dwg").value(), support::fromUtf8(known[kAbc]));
    }
    EXPECT_EQ(opened, 1);
}

TEST_F(LocalStorage, AppendsToTheStoreOfADrawingThatWasRenamed)
{
    std::string const first = store("plan.dwg", drawing(1, 2000));
    committed["sub/north wing.dwg"] = first;
    std::string const second = store("sub/north wing.dwg", edited(drawing(1, 2000), 1));
    EXPECT_EQ(fileOf(second), fileOf(first));
    EXPECT_EQ(contentOf(first), drawing(1, 2000));
    EXPECT_EQ(contentOf(second), edited(drawing(1, 2000), 1));
    EXPECT_LT(repo.read(fileOf(first)).size(), 2500u);
}

TEST_F(LocalStorage, KeepsTheNameOfAStoreThatIsNotHere)
{
    committed["plan.dwg"] = "tf:ours-1#" + kAbc;
    std::string const url = store("plan.dwg", "drawing");
    EXPECT_THAT(url, StartsWith("tf:ours-1#"));
    EXPECT_EQ(contentOf(url), "drawing");
}

TEST_F(LocalStorage, MakesANewStoreForADrawingThatWasAnObjectOrHasAStrangeUrl)
{
    for (std::string const& url : {"po:" + kAbc, "tf:../../x#" + kAbc, std::string("tf:x")}) {
        committed["plan.dwg"] = url;
        EXPECT_THAT(store("plan.dwg", "drawing"), StartsWith("tf:plan-"));
    }
    EXPECT_EQ(files().size(), 1u);
}

TEST_F(LocalStorage, SaysWhyAFileCannotBeStored)
{
    repo.makeFolder("folder.dwg");
    auto const failure = [this](wchar_t const* name) { return messageOf(newStorage().store(name)); };
    EXPECT_EQ(failure(L"missing"), "'missing' cannot be opened: No such file or directory.");
    EXPECT_EQ(failure(L"folder.dwg"), "'folder.dwg' cannot be opened: Is a directory.");
    EXPECT_THAT(files(), IsEmpty());
}

TEST_F(LocalStorage, RefusesAFileThatChangesWhileItIsStored)
{
    static std::string path;
    static int reads;
    for (int const change : {1, 2, 3, 4, 5, 6}) {
        for (char const* const name : {"plan.dwg", "file"}) {
            std::string const content = drawing(1, 4 * kSegment);
            repo.write(name, content);
            path = repo.pathTo(name);
            reads = change;
            RealCallsAfterwards const afterwards;
            os::calls().pread = [](int file, void* buffer, std::size_t count, off_t offset) {
                if (--reads == 0) {
                    EXPECT_EQ(truncate(path.c_str(), 0), 0);
                    EXPECT_EQ(truncate(path.c_str(), 4 * kSegment), 0);
                }
                return RealCallsAfterwards::real.pread(file, buffer, count, offset);
            };
            tav::LocalStorage storage = newStorage();
            auto const url = storage.store(support::fromUtf8(name));
            os::calls() = RealCallsAfterwards::real;
            EXPECT_EQ(messageOf(storage.flush()), "success");
            if (!url.hasValue()) {
                EXPECT_EQ(messageOf(url), "The file has changed while it was being stored.");
                EXPECT_THAT(files(), IsEmpty());
                continue;
            }
            EXPECT_EQ(reads > 0 ? content : std::string(4 * kSegment, '\0'), contentOf(url.value().ansi_str()));
            EXPECT_EQ(unlink(repo.pathTo(fileOf(url.value().ansi_str())).c_str()), 0);
        }
    }
}

TEST_F(LocalStorage, RefusesAFileThatBecomesShorterWhileItIsStored)
{
    static std::string path;
    repo.write("file", drawing(1, 4 * kSegment));
    path = repo.pathTo("file");
    RealCallsAfterwards const afterwards;
    os::calls().pread = [](int file, void* buffer, std::size_t count, off_t offset) {
        EXPECT_EQ(truncate(path.c_str(), kSegment), 0);
        return RealCallsAfterwards::real.pread(file, buffer, count, offset);
    };
    EXPECT_EQ(messageOf(newStorage().store(L"file")), "'file' became shorter while it was being read.");
    EXPECT_THAT(files(), IsEmpty());
}

TEST_F(LocalStorage, ExtractsIntoANewFileOnly)
{
    std::string const url = store("plan.dwg", drawing(1, 3 * kSegment));
    EXPECT_EQ(extract(url, "copy"), "success");
    EXPECT_EQ(repo.read("copy"), drawing(1, 3 * kSegment));
    mode_t const mask = umask(0);
    umask(mask);
    EXPECT_EQ(modeOf("copy"), 0666U & ~mask);
    repo.write("taken", "old");
    repo.makeLink("dangling", "nowhere");
    EXPECT_EQ(extract(url, "taken"), "'" + repo.pathTo("taken") + "' cannot be made: File exists.");
    EXPECT_EQ(extract(url, "dangling"), "'" + repo.pathTo("dangling") + "' cannot be made: File exists.");
    EXPECT_EQ(repo.read("taken"), "old");
    EXPECT_FALSE(repo.has("nowhere"));
    std::string bytes = repo.read(fileOf(url));
    bytes.back() = static_cast<char>(bytes.back() ^ 1);
    repo.write(fileOf(url), bytes);
    EXPECT_EQ(extract(url, "damaged"), "The content of '" + url + "' is damaged.");
    EXPECT_FALSE(repo.has("damaged"));
}

TEST_F(LocalStorage, StopsReadingWhenTheSinkHasEnough)
{
    std::string const url = store("file", drawing(1, 3 * kSegment));
    std::size_t total = 0;
    auto const outcome = newStorage().read(support::fromUtf8(url), [&](char const*, std::size_t count) {
        total += count;
        return false;
    });
    EXPECT_EQ(messageOf(outcome), "The content of '" + url + "' was not read to its end.");
    EXPECT_EQ(total, kSegment);
}

TEST_F(LocalStorage, SaysWhatIsKept)
{
    std::string const url = store("plan.dwg", "abc");
    std::string const other = url.substr(0, url.find('#') + 1) + kNothing;
    EXPECT_TRUE(contains(url));
    EXPECT_FALSE(contains(other));
    EXPECT_FALSE(contains("po:" + kAbc));
    EXPECT_FALSE(contains("tf:x#" + kAbc));
    EXPECT_EQ(messageOf(newStorage().contains(L"po:1")), "'po:1' is not a URL of this storage.");
    EXPECT_EQ(verify(other), "'" + other + "' is not in the storage.");
    EXPECT_EQ(messageOf(newStorage().size(support::fromUtf8(other))), "'" + other + "' is not in the storage.");
}

TEST_F(LocalStorage, FlushesManyFilesAtOnceAndEachWhereThatIsNotKnown)
{
    static int flushesOfAll;
    static int flushesOfOne;
    static int error;
    for (int const given : {0, EOPNOTSUPP, EINVAL, ENOSYS}) {
        error = given;
        flushesOfAll = flushesOfOne = 0;
        tav::LocalStorage storage = newStorage();
        for (int i = 0; i < 20; ++i) {
            repo.write("file", std::to_string(given) + " " + std::to_string(i));
            EXPECT_EQ(messageOf(storage.store(L"file")), "success");
        }
        RealCallsAfterwards const afterwards;
        os::calls().syncfs = [](int) { return ++flushesOfAll, errno = error, error == 0 ? 0 : -1; };
        os::calls().fsync = [](int) { return ++flushesOfOne, 0; };
        EXPECT_EQ(messageOf(storage.flush()), "success");
        EXPECT_EQ(flushesOfAll, 1);
        EXPECT_EQ(flushesOfOne, error == 0 ? 1 : 21); // The folder, too.
    }
    EXPECT_EQ(files().size(), 80u);
}

} // namespace
} // namespace storage_tests
