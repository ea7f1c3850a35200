// Hosts that change the process under living objects, or whose callbacks do what they should not.
#include "common/mu_common_config.h"
#include "common/mu_common_file_storage.h"
#include "common/mu_common_file_utils.h"
#include "common/mu_common_state.h"

#include "tests/support/foreign_locale.h"
#include "tests/support/recording_io.h"
#include "tests/support/temp_repository.h"

#include <csignal>
#include <filesystem>
#include <functional>
#include <gmock/gmock.h>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

namespace {

using common::Cache;
using common::Config;
using support::RecordingIo;
using support::TempFolder;
using support::TempRepository;
using testing::ElementsAre;

/// A repository and a configuration, open and changed, before the host does something to its process.
class LivingObjects : public testing::Test {
protected:
    LivingObjects()
    {
        repository.add({"a.dwg", "b.bak"});
        Cache::create(repository.root(), io);
        cache = Cache::get(repository.root(), io).value();
        cache->write().index[L"a.dwg"] = {1'234'567'890, false};
        config = Config::load(configFolder.widePath(), io).value();
        config->write()->add(L"/house", L"House", L"1234567");
    }

    /// Lets go of both, which saves them.
    void release()
    {
        cache.reset();
        config.reset();
    }

    void expectBothSaved()
    {
        release();
        EXPECT_EQ(repository.read(".tav/tav.state"), kState);
        EXPECT_EQ(configFolder.read("directories.state"), kConfig);
        EXPECT_THAT(io.calls(), ElementsAre("report success", "report success", "report success"));
        EXPECT_THAT(configFolder.list(), ElementsAre("directories.state"));
    }

    static constexpr char const* kState = R"({
    "head" : {
        "reference" : "master"
    },
    "index" : [
        {
            "data" : {
                "last_checked" : 1234567890,
                "modified" : false
            },
            "path" : "a.dwg"
        }
    ]
})";
    static constexpr char const* kConfig = R"({
    "projects_map" : [
        {
            "info" : {
                "name" : "House",
                "uid" : "1234567"
            },
            "path" : "/house"
        }
    ]
})";

    TempRepository const repository;
    TempFolder const configFolder;
    RecordingIo const io;
    std::shared_ptr<Cache> cache;
    std::shared_ptr<Config> config;
};

class LivingObjectsUnderLocale
    : public LivingObjects
    , public testing::WithParamInterface<char const*> {};

TEST_P(LivingObjectsUnderLocale, AreSavedAsUnderTheOneTheyWereReadUnder)
{
    common::RepoIgnore const rules(repository.root());
    support::ForeignLocale const locale(GetParam());
    EXPECT_TRUE(rules.matches(L"b.bak"));
    EXPECT_FALSE(rules.matches(L"a.dwg"));
    EXPECT_EQ(common::collectRepoFiles(repository.root()).value().size(), 1U);
    expectBothSaved();
}

TEST_P(LivingObjectsUnderLocale, AreReadWhenItHasGone)
{
    {
        support::ForeignLocale const locale(GetParam());
        release();
    }
    EXPECT_EQ(Cache::get(repository.root(), io).value()->read().index.at(L"a.dwg").lastChecked, 1'234'567'890U);
    EXPECT_EQ(Config::load(configFolder.widePath(), io).value()->read().projects.at(L"/house").cloud, L"1234567");
}

INSTANTIATE_TEST_SUITE_P(Locales, LivingObjectsUnderLocale, testing::Values("C", "C.UTF-8"), [](auto const& row) {
    return row.index == 0 ? "C" : "C_UTF_8";
});

mode_t modeOf(std::string const& path)
{
    struct stat status;
    EXPECT_EQ(stat(path.c_str(), &status), 0);
    return status.st_mode & 07777;
}

TEST_F(LivingObjects, KeepTheRightsOfTheirFilesUnderAnotherUmask)
{
    ASSERT_EQ(chmod(repository.pathTo(".tav/tav.state").c_str(), 0640), 0);
    mode_t const before = umask(0077);
    expectBothSaved();
    umask(before);
    EXPECT_EQ(modeOf(repository.pathTo(".tav/tav.state")), 0640U);
    EXPECT_EQ(modeOf(configFolder.pathTo("directories.state")), 0600U);
}

TEST_F(LivingObjects, AreSavedUnderAnUmaskThatLeavesNothing)
{
    mode_t const before = umask(0777);
    release();
    umask(before);
    EXPECT_EQ(repository.read(".tav/tav.state"), kState);
    EXPECT_EQ(modeOf(configFolder.pathTo("directories.state")), 0U);
    EXPECT_THAT(io.calls(), ElementsAre("report success", "report success", "report success"));
}

TEST_F(LivingObjects, AreSavedWhereTheyWereReadInAnotherCurrentFolder)
{
    TempFolder const elsewhere;
    std::filesystem::path const before = std::filesystem::current_path();
    std::filesystem::current_path(elsewhere.path());
    expectBothSaved();
    std::filesystem::current_path(before);
    EXPECT_TRUE(elsewhere.list().empty());
}

TEST_F(LivingObjects, WithARelativePathMakeNothingInAnotherCurrentFolder)
{
    std::filesystem::path const before = std::filesystem::current_path();
    TempFolder const elsewhere;
    std::filesystem::current_path(repository.path());
    cache = Cache::get(common::RootPath(L"."), io).value();
    cache->write().head = L"other";
    std::filesystem::current_path(elsewhere.path());
    cache.reset();
    std::filesystem::current_path(before);
    EXPECT_EQ(io.calls().back(), "report error: Error writing to file './.tav/tav.state'");
    EXPECT_TRUE(elsewhere.list().empty());
    EXPECT_EQ(repository.read(".tav/tav.state"), kState);
}

TEST_F(LivingObjects, WhoseFoldersAreGoneSayThatAndMakeNothing)
{
    std::filesystem::remove_all(repository.pathTo(".tav"));
    std::filesystem::remove_all(configFolder.path());
    release();
    EXPECT_THAT(
        io.calls(),
        ElementsAre(
            "report success", "report error: Error writing to file '" + repository.pathTo(".tav/tav.state") + "'",
            "report error: Error writing to file '" + configFolder.pathTo("directories.state") + "'"));
    EXPECT_FALSE(repository.has(".tav"));
    EXPECT_FALSE(std::filesystem::exists(configFolder.path()));
    std::filesystem::create_directory(configFolder.path());
}

TEST_F(LivingObjects, OutliveTheCopyOfThePathsTheyWereGiven)
{
    auto root = std::make_unique<common::RootPath>(repository.root());
    cache = std::make_shared<Cache>(*root, common::State(), io);
    root.reset();
    cache->write().head = L"other";
    cache.reset();
    EXPECT_EQ(Cache::get(repository.root(), io).value()->read().head, OdString(L"other"));
}

/// A host whose callbacks throw.
class ThrowingIo final : public common::IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { throw std::runtime_error("accept throws"); }
    void report(WriteOutcome const& /*outcome*/) const override { throw std::runtime_error("report throws"); }
};

using ReportThatThrows = LivingObjects;

TEST_F(ReportThatThrows, EndsTheProcessWhenTheStateIsSafe)
{
    ThrowingIo const throwing;
    auto const save = [&] {
        std::shared_ptr<Cache> const own = Cache::get(repository.root(), throwing).value();
        own->write().head = L"other";
    };
    cache.reset();
    EXPECT_EXIT(save(), testing::KilledBySignal(SIGABRT), "report throws");
    EXPECT_EQ(Cache::get(repository.root(), io).value()->read().head, OdString(L"other"));
}

TEST_F(ReportThatThrows, EndsTheProcessWhenTheConfigurationIsSafe)
{
    ThrowingIo const throwing;
    config.reset();
    auto const save = [&] { Config::load(configFolder.widePath(), throwing).value()->write()->remove(L"/house"); };
    EXPECT_EXIT(save(), testing::KilledBySignal(SIGABRT), "report throws");
    EXPECT_EQ(configFolder.read("directories.state"), "{\n}");
}

TEST_F(ReportThatThrows, IsNotCalledForWhatWasOnlyRead)
{
    ThrowingIo const throwing;
    release();
    EXPECT_EQ(Cache::get(repository.root(), throwing).value()->read().index.size(), 1U);
    EXPECT_EQ(Config::load(configFolder.widePath(), throwing).value()->read().projects.size(), 1U);
}

/// A storage that counts its merges, and does nothing else.
class CountingStorage final : public common::FileStorage {
public:
    int merges = 0;

    Expected<OdString> store(common::RootPath const& /*root*/, OdString const& /*path*/) override { return OdString(); }
    WriteOutcome restore(common::RootPath const& /*root*/, OdString const& /*url*/, OdString const& /*to*/) override
    {
        return WriteOutcome(std::in_place);
    }
    Expected<bool> contains(common::RootPath const& /*root*/, OdString const& /*url*/) override { return true; }
    WriteOutcome remove(common::RootPath const& /*root*/, OdString const& /*url*/) override
    {
        return WriteOutcome(std::in_place);
    }
    Expected<bool>
    mergeFromStorage(common::RootPath const& /*root*/, OdString const& /*to*/, OdString const& /*url*/) override
    {
        ++merges;
        return true;
    }
    Expected<std::vector<OdString>> revisions(common::RootPath const& /*root*/, OdString const& /*url*/) override
    {
        return std::vector<OdString>();
    }
    WriteOutcome verify(common::RootPath const& /*root*/, OdString const& /*url*/) override
    {
        return WriteOutcome(std::in_place);
    }
};

TEST(AcceptThatThrows, ReachesTheCallerAndMergesNothing)
{
    ThrowingIo const throwing;
    CountingStorage storage;
    auto const merge = [&] { return storage.merge(L"a", L"b", L"c", L"d", common::RootPath(L"/nowhere"), throwing); };
    EXPECT_THROW(static_cast<void>(merge()), std::runtime_error);
    EXPECT_EQ(storage.merges, 0);
}

/// Does what the test wants when it is told, once.
class Listener final : public common::ConfigListener {
public:
    explicit Listener(std::function<void()> what) : what_(std::move(what)) {}

    void configChanged() override
    {
        ++told;
        if (std::function<void()> const what = std::exchange(what_, nullptr)) {
            what();
        }
    }

    int told = 0;

private:
    std::function<void()> what_;
};

TEST_F(LivingObjects, TellAListenerThatWritesOfThatToo)
{
    Listener listener([&] { config->write()->add(L"/more", L"More", L"2"); });
    config->addListener(listener);
    config->write();
    EXPECT_EQ(listener.told, 2);
    EXPECT_EQ(config->read().projects.size(), 2U);
    config->removeListener(listener);
}

TEST_F(LivingObjects, TellAListenerOnceThatGoesAndComesBack)
{
    std::optional<Listener> listener;
    listener.emplace([&] {
        config->removeListener(*listener);
        config->addListener(*listener);
    });
    config->addListener(*listener);
    config->write();
    EXPECT_EQ(listener->told, 1);
    config->removeListener(*listener);
}

TEST_F(LivingObjects, TellNoListenerThatAnotherOneHasDestroyed)
{
    auto victim = std::make_unique<Listener>(nullptr);
    auto const destroy = [&] {
        config->removeListener(*victim);
        victim.reset();
    };
    Listener first(destroy); // Whichever of the two is told first, the other's address is not used behind its end.
    config->addListener(*victim);
    config->addListener(first);
    config->write();
    EXPECT_EQ(first.told, 1);
    config->write();
    EXPECT_EQ(first.told, 2);
    config->removeListener(first);
}

TEST_F(LivingObjects, MayBeLetGoByAListenerWhileTheyHaveAnotherOwner)
{
    std::shared_ptr<Config> second = config;
    Listener listener([&] { second.reset(); });
    config->addListener(listener);
    config->write();
    EXPECT_EQ(config.use_count(), 1);
    config->removeListener(listener);
    expectBothSaved();
}

} // namespace
