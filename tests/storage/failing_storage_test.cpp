// What operations leave behind when a call of the system fails.
#include "storage_test.h"

#include "platform/os/os_calls.h"
#include "tests/support/failing_call.h"
#include "tests/support/utf8.h"

#include <cerrno>

namespace storage_tests {
namespace {

using support::FailingCall;

/// Makes flushing cost nothing while it lives; whether it fails is still up to the test.
class QuickFlushes {
public:
    QuickFlushes() : real_(os::calls())
    {
        os::calls().fsync = [](int) { return 0; };
        os::calls().syncfs = [](int) { return 0; };
    }
    QuickFlushes(QuickFlushes const&) = delete;
    QuickFlushes& operator=(QuickFlushes const&) = delete;
    ~QuickFlushes() { os::calls() = real_; }

private:
    os::Calls real_;
};

/// A new repository with two versions of a drawing and an object, for each call that fails.
class Scene : public StorageTest {
public:
    Scene()
    {
        first = commit("plan.dwg", drawing(1, 3 * kSegment));
        second = commit("plan.dwg", edited(drawing(1, 3 * kSegment), 1));
        object = store("file", drawing(2, 100));
        before = files();
        storeBefore = repo.read(fileOf(first));
    }

    void TestBody() override {}

    bool isOldWhole() const
    {
        return contentOf(first) == drawing(1, 3 * kSegment) &&
               contentOf(second) == edited(drawing(1, 3 * kSegment), 1) && contentOf(object) == drawing(2, 100);
    }

    using StorageTest::commit;
    using StorageTest::committed;
    using StorageTest::contains;
    using StorageTest::contentOf;
    using StorageTest::fileOf;
    using StorageTest::files;
    using StorageTest::makeWhole;
    using StorageTest::newStorage;
    using StorageTest::repo;
    using StorageTest::store;

    std::string first;
    std::string second;
    std::string object;
    std::vector<std::string> before;
    std::string storeBefore;

private:
    QuickFlushes quickFlushes_;
};

/// Stores a new version, a new drawing and a new object, and flushes. Whether all of that succeeded.
bool storeThree(Scene const& scene, std::vector<std::string>& urls)
{
    tav::LocalStorage storage = scene.newStorage();
    for (wchar_t const* const name : {L"plan.dwg", L"new.dwg", L"new"}) {
        auto const url = storage.store(name);
        if (!url.hasValue()) {
            return false;
        }
        urls.push_back(url.value().ansi_str());
    }
    return storage.flush().hasValue();
}

void writeThree(Scene const& scene)
{
    scene.repo.write("plan.dwg", edited(drawing(1, 3 * kSegment), 2));
    scene.repo.write("new.dwg", drawing(3, 3 * kSegment));
    scene.repo.write("new", drawing(4, 3 * kSegment));
}

class FailingStorage : public testing::TestWithParam<int> {};

TEST_P(FailingStorage, KeepsAllOfABatchOrNothing)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        Scene const scene;
        writeThree(scene);
        std::vector<std::string> urls;
        bool succeeded = false;
        std::string name;
        {
            FailingCall const failing(n, GetParam());
            succeeded = storeThree(scene, urls);
            more = failing.hasFailed();
            name = failing.name();
        }
        EXPECT_TRUE(scene.isOldWhole()) << name;
        if (succeeded) {
            ASSERT_EQ(urls.size(), 3u);
            EXPECT_EQ(scene.contentOf(urls[0]), edited(drawing(1, 3 * kSegment), 2)) << name;
            EXPECT_EQ(scene.contentOf(urls[1]), drawing(3, 3 * kSegment)) << name;
            EXPECT_EQ(scene.contentOf(urls[2]), drawing(4, 3 * kSegment)) << name;
        } else {
            EXPECT_EQ(scene.files(), scene.before) << name;
            EXPECT_EQ(scene.repo.read(Scene::fileOf(scene.first)), scene.storeBefore) << name;
        }
    }
}

TEST_P(FailingStorage, ReplacesADamagedObjectOrLeavesIt)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        Scene const scene;
        std::string const whole = scene.repo.read(Scene::fileOf(scene.object));
        std::string const damaged = whole.substr(0, whole.size() - 1) + "x";
        scene.repo.write(Scene::fileOf(scene.object), damaged);
        bool succeeded = false;
        std::string name;
        {
            FailingCall const failing(n, GetParam());
            tav::LocalStorage storage = scene.newStorage();
            succeeded = storage.store(L"file").hasValue() && storage.flush().hasValue();
            more = failing.hasFailed();
            name = failing.name();
        }
        EXPECT_EQ(scene.files(), scene.before) << name;
        std::string const bytes = scene.repo.read(Scene::fileOf(scene.object));
        EXPECT_TRUE(bytes == whole || (!succeeded && bytes == damaged)) << name;
    }
}

TEST_P(FailingStorage, NeverLosesARevisionWithADamagedHeader)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        Scene const scene;
        std::string damaged = scene.storeBefore;
        std::size_t const place = damaged.rfind("tavrev1") + 40;
        damaged[place] = static_cast<char>(damaged[place] ^ 1);
        scene.repo.write(Scene::fileOf(scene.first), damaged);
        writeThree(scene);
        std::vector<std::string> urls;
        FailingCall const failing(n, GetParam());
        static_cast<void>(storeThree(scene, urls));
        more = failing.hasFailed();
        EXPECT_EQ(scene.repo.read(Scene::fileOf(scene.first)).substr(0, damaged.size()), damaged) << failing.name();
    }
}

TEST_P(FailingStorage, ExtractsTheWholeContentOrNothing)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        Scene const scene;
        bool succeeded = false;
        std::string name;
        {
            FailingCall const failing(n, GetParam());
            succeeded =
                scene.newStorage().extract(support::fromUtf8(scene.second), scene.repo.pathTo("copy")).hasValue();
            more = failing.hasFailed();
            name = failing.name();
        }
        EXPECT_EQ(scene.repo.has("copy"), succeeded) << name;
        EXPECT_TRUE(!succeeded || scene.repo.read("copy") == edited(drawing(1, 3 * kSegment), 1)) << name;
    }
}

TEST_P(FailingStorage, CleansWithoutLosingWhatIsKept)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        Scene scene;
        std::string const other = scene.commit("plan.dwg", drawing(5, 3 * kSegment));
        std::string name;
        {
            FailingCall const failing(n, GetParam());
            static_cast<void>(
                scene.newStorage().keepOnly({support::fromUtf8(scene.second), support::fromUtf8(scene.object)}));
            more = failing.hasFailed();
            name = failing.name();
        }
        EXPECT_TRUE(scene.isOldWhole()) << name;
        EXPECT_EQ(scene.files(), scene.before) << name;
        std::string const content = scene.contentOf(other);
        EXPECT_TRUE(content == drawing(5, 3 * kSegment) || content == "'" + other + "' is not in the storage.");
    }
}

TEST_P(FailingStorage, TurnsAnObjectOverOrLeavesItAsItWas)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        Scene scene;
        std::string const content = edited(drawing(2, 100), 7);
        std::string const next = scene.commit("next", content);
        scene.makeWhole(next, content);
        std::string const whole = scene.repo.read(Scene::fileOf(next));
        scene.committed["next"] = scene.object;
        bool succeeded = false;
        std::string name;
        {
            FailingCall const failing(n, GetParam());
            tav::LocalStorage storage = scene.newStorage();
            succeeded = storage.turnOver(support::fromUtf8(next), L"next").hasValue();
            more = failing.hasFailed();
            name = failing.name();
        }
        EXPECT_TRUE(scene.isOldWhole()) << name;
        EXPECT_EQ(scene.contentOf(next), content) << name;
        EXPECT_FALSE(scene.repo.has(".tav/objects/incoming/" + next.substr(3))) << name;
        EXPECT_TRUE(succeeded || scene.repo.read(Scene::fileOf(next)) == whole) << name;
        EXPECT_TRUE(more || scene.repo.read(Scene::fileOf(next)) != whole) << "it was not turned over at all";
    }
}

INSTANTIATE_TEST_SUITE_P(Errors, FailingStorage, testing::Values(ENOSPC, EIO), [](auto const& row) {
    return row.param == ENOSPC ? "FullDisk" : "BrokenDisk";
});

TEST(InterruptedStorage, GoesOnWhicheverCallIsInterrupted)
{
    bool more = true;
    for (int n = 0; more; ++n) {
        Scene const scene;
        writeThree(scene);
        std::vector<std::string> urls;
        FailingCall const failing(n, EINTR);
        EXPECT_TRUE(storeThree(scene, urls)) << failing.name();
        EXPECT_TRUE(scene.newStorage().extract(support::fromUtf8(urls.at(0)), scene.repo.pathTo("copy")).hasValue())
            << failing.name();
        EXPECT_TRUE(scene.newStorage().keepOnly({support::fromUtf8(urls.at(0))}).hasValue()) << failing.name();
        more = failing.hasFailed();
    }
}

} // namespace
} // namespace storage_tests
