// What the headers promise about threads, on two threads at a time. Build it with the preset `thread` as well.
#include "common/mu_common_config.h"
#include "common/mu_common_diff.h"
#include "common/mu_common_file_storage.h"
#include "common/mu_common_file_utils.h"
#include "common/mu_common_history.h"
#include "common/mu_common_repo_files.h"
#include "common/mu_common_serialization.h"
#include "common/mu_common_state.h"
#include "common/mu_common_versions.h"
#include "platform/ut/TextFile.h"
#include "platform/ut/text.h"
#include "json/json_reader.h"
#include "json/json_writer.h"

#include "tests/support/recording_io.h"
#include "tests/support/temp_repository.h"

#include <array>
#include <atomic>
#include <functional>
#include <future>
#include <gmock/gmock.h>
#include <memory>
#include <regex>
#include <string>
#include <thread>

#ifdef __SANITIZE_THREAD__
// wxWidgets is not built for the sanitizer, which cannot see how its static objects are guarded.
// NOLINTNEXTLINE(bugprone-reserved-identifier)
extern "C" __attribute__((visibility("default"))) char const* __tsan_default_suppressions()
{
    return "race:libwx_base";
}
#endif

namespace {

using common::Cache;
using common::Config;
using common::ConfigPath;
using support::RecordingIo;
using support::TempFolder;
using support::TempRepository;
using testing::Each;
using testing::ElementsAre;

constexpr int kRounds = 50;

/// Runs `body` on two threads that begin at the same time, with the numbers 0 and 1.
void onTwoThreads(std::function<void(int number)> const& body)
{
    std::atomic<int> waiting{2};
    auto const run = [&](int number) {
        --waiting;
        while (waiting > 0) {
            std::this_thread::yield();
        }
        body(number);
    };
    std::thread first(run, 0);
    std::thread second(run, 1);
    first.join();
    second.join();
}

OdString numbered(wchar_t const* text, int number)
{
    return OdString().format(L"%ls%d", text, number);
}

/// The names of both threads' results, by their number.
using Results = std::array<std::string, 2>;

TEST(Texts, AreCopiedAndChangedByEachThread)
{
    OdString const shared = L"\u041F\u043B\u0430\u043D.dwg";
    Results results;
    onTwoThreads([&](int number) {
        OdString own;
        for (int i = 0; i < kRounds; ++i) {
            own = shared;
            own += numbered(L"-", number);
            own = OdString(own.ansi_str().c_str(), CP_UTF_8);
        }
        results[static_cast<std::size_t>(number)] = own.ansi_str();
    });
    EXPECT_THAT(results, ElementsAre("План.dwg-0", "План.dwg-1"));
}

TEST(Documents, AreReadWrittenAndCopiedByEachThread)
{
    kutils::json::Value shared;
    ASSERT_TRUE(kutils::json::read_string(shared, LR"({"a": [1, 2.5, "\u041F", null], "b": {"c": true}})"));
    Results results;
    onTwoThreads([&](int number) {
        kutils::json::Value own;
        for (int i = 0; i < kRounds; ++i) {
            own = shared;
            std::wstring const text = kutils::json::write_string(own, true);
            kutils::json::read_string(own, OdString(text.c_str(), text.size()));
        }
        results[static_cast<std::size_t>(number)] = own == shared ? "same" : "other";
    });
    EXPECT_THAT(results, Each("same"));
}

TEST(CopiesOfARoot, AreReadByEachThread)
{
    TempRepository const repository;
    common::RootPath const root = repository.root();
    Results results;
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            common::RootPath own(L"/");
            own = root;
            results[static_cast<std::size_t>(number)] = own.relativePathTo(own.statePath()).value().ansi_str();
        }
    });
    EXPECT_THAT(results, Each(".tav/tav.state"));
}

TEST(Scans, OfOneRepositoryRunBesideEachOther)
{
    TempRepository const repository;
    repository.add({"a.dwg", "sub/b.dwg", "c.bak", "sub/d.tmp"});
    repository.ignore("^.*\\.bak$\n(t*m*p*)*\\.tmp\n^ignore$");
    Results results;
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            std::string names;
            auto const files = common::collectRepoFiles(repository.root());
            for (common::File const& file : files.value()) {
                names += file.path.ansi_str() + " ";
            }
            results[static_cast<std::size_t>(number)] = names;
        }
    });
    EXPECT_THAT(results, Each("a.dwg sub/b.dwg sub/d.tmp "));
}

TEST(Rules, AreCompiledByEachThread)
{
    Results results;
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            std::regex const rule = common::RepoIgnore::compile(L"^[[:alpha:]]+(a|b)*\\.dwg$");
            results[static_cast<std::size_t>(number)] = std::regex_match("planab.dwg", rule) ? "match" : "none";
        }
    });
    EXPECT_THAT(results, Each("match"));
}

TEST(Caches, OfTwoRepositoriesAreUsedOnAThreadEach)
{
    std::array<TempRepository, 2> const repositories;
    std::array<RecordingIo, 2> const ios;
    onTwoThreads([&](int number) {
        auto const at = static_cast<std::size_t>(number);
        common::RootPath const root = repositories[at].root();
        Cache::create(root, ios[at]);
        for (int i = 0; i < kRounds; ++i) {
            std::shared_ptr<Cache> const cache = Cache::get(root, ios[at]).value();
            common::Transaction transaction(*cache);
            cache->write().index[numbered(L"file", i)] = {static_cast<std::uint64_t>(i), false};
            transaction.commit();
        }
    });
    for (std::size_t at : {0U, 1U}) {
        EXPECT_EQ(Cache::get(repositories[at].root(), ios[at]).value()->read().index.size(), std::size_t{kRounds});
        EXPECT_EQ(ios[at].calls().size(), std::size_t{kRounds + 1});
        EXPECT_THAT(ios[at].calls(), Each("report success"));
    }
}

/// "Two owners of one repository's state do not see each other": one of them wins, and the file is whole.
TEST(Caches, OfOneRepositoryReplaceItsStateAsAWhole)
{
    TempRepository const repository;
    std::array<RecordingIo, 2> const ios;
    Cache::create(repository.root(), ios[0]);
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            auto const cache = Cache::get(repository.root(), ios[static_cast<std::size_t>(number)]);
            ASSERT_TRUE(cache.hasValue()) << cache.error().message.ansi_str();
            cache.value()->write().head = numbered(L"branch", number);
        }
    });
    std::string const head = Cache::get(repository.root(), ios[0]).value()->read().head.ansi_str();
    EXPECT_TRUE(head == "branch0" || head == "branch1") << head;
    EXPECT_EQ(repository.list(), (std::vector<std::string>{".tav/", ".tav/tav.state"}));
}

TEST(ACache, MayBeReleasedOnAnotherThread)
{
    TempRepository const repository;
    RecordingIo const io;
    Cache::create(repository.root(), io);
    std::shared_ptr<Cache> cache = Cache::get(repository.root(), io).value();
    cache->write().head = L"other";
    std::thread([last = std::move(cache)]() mutable { last.reset(); }).join();
    EXPECT_EQ(Cache::get(repository.root(), io).value()->read().head, OdString(L"other"));
    EXPECT_THAT(io.calls(), ElementsAre("report success", "report success"));
}

/// Holds its object up until another thread says so.
class SlowIo final : public common::IoInterface {
public:
    explicit SlowIo(std::shared_future<void> goOn) : goOn_(std::move(goOn)) {}

    std::int32_t accept(OdString const& /*path*/) const override { return 0; }
    void report(WriteOutcome const& /*outcome*/) const override { goOn_.wait(); }

private:
    std::shared_future<void> goOn_;
};

TEST(ASlowReport, HoldsUpNoOtherThread)
{
    std::array<TempRepository, 2> const repositories;
    std::promise<void> otherIsDone;
    SlowIo const slow(otherIsDone.get_future().share());
    RecordingIo const io;
    onTwoThreads([&](int number) {
        auto const at = static_cast<std::size_t>(number);
        if (number == 0) {
            Cache::create(repositories[at].root(), slow);
        } else {
            Cache::create(repositories[at].root(), io);
            otherIsDone.set_value();
        }
    });
    EXPECT_TRUE(repositories[0].has(".tav/tav.state"));
    EXPECT_THAT(io.calls(), ElementsAre("report success"));
}

TEST(Configurations, OfTwoFoldersAreUsedOnAThreadEach)
{
    std::array<TempFolder, 2> const folders;
    std::array<RecordingIo, 2> const ios;
    onTwoThreads([&](int number) {
        auto const at = static_cast<std::size_t>(number);
        Config::Factory factory;
        for (int i = 0; i < kRounds; ++i) {
            auto const config = factory.get(ConfigPath(folders[at].widePath()), common::ConfigData(), ios[at]);
            config->write()->add(numbered(L"/project", i), L"Name", L"id");
        }
    });
    for (std::size_t at : {0U, 1U}) {
        EXPECT_THAT(ios[at].calls(), Each("report success"));
        auto const config = Config::load(folders[at].widePath(), ios[at]);
        EXPECT_EQ(config.value()->read().projects.count(numbered(L"/project", kRounds - 1)), 1U);
    }
}

TEST(TheFactory, IsMadeOnceWhicheverThreadIsFirst)
{
    std::array<Config::Factory*, 2> factories{};
    onTwoThreads([&](int number) { factories[static_cast<std::size_t>(number)] = &Config::factory(); });
    EXPECT_EQ(factories[0], factories[1]);
}

TEST(Digests, AreMadeByEachThread)
{
    TempRepository const repository;
    std::string const content(100'000, 'x');
    repository.write("a.txt", content);
    OdString const url = L"po:" + generateSha(content.data(), static_cast<int>(content.size()));
    std::array<bool, 2> differ{true, true};
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            differ[static_cast<std::size_t>(number)] = common::isDifferent(L"a.txt", url, repository.root());
        }
    });
    EXPECT_THAT(differ, Each(false));
}

TEST(ServerDocuments, AreReadByEachThread)
{
    OdString const document = LR"([{"commitHash": "a", "name": "z", "refType": "tag"}])";
    Results results;
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            auto const references = common::deserializeReferences(document);
            auto const refused = common::deserializeReferences(L"[{}]");
            results[static_cast<std::size_t>(number)] =
                refused.hasValue() ? "taken" : references.value().at(0).name.ansi_str();
        }
    });
    EXPECT_THAT(results, Each("z"));
}

/// Messages are looked up in the catalogues of the process.
TEST(Messages, AreMadeByEachThread)
{
    TempFolder const folder;
    Results results;
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            auto const root = common::RootPath::get(folder.widePathTo("none"), false);
            results[static_cast<std::size_t>(number)] = root.error().message.ansi_str();
        }
    });
    EXPECT_THAT(results, Each("Path: " + folder.pathTo("none") + " is not a tav directory."));
}

TEST(Urls, AreTakenApartByEachThread)
{
    Results results;
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            results[static_cast<std::size_t>(number)] = common::getRevision(L"tf:plan#1").value().ansi_str();
        }
    });
    EXPECT_THAT(results, Each("1"));
}

TEST(Explorers, AreUsedOnAThreadEach)
{
    TempRepository const repository;
    repository.add({"a.dwg", "b.dwg"});
    Results results;
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            common::RepoChanges changes;
            changes.untracked.push_back({nullptr, {L"a.dwg"}, 0});
            changes.untracked.push_back({nullptr, {L"b.dwg"}, 0});
            common::RepoFileExplorer const explorer(changes, repository.root());
            auto const found = explorer.findForStaging(L"a");
            results[static_cast<std::size_t>(number)] = std::get<common::StagedFile>(found).path.ansi_str();
        }
    });
    EXPECT_THAT(results, Each("a.dwg"));
}

TEST(HistoryItems, AreUsedOnAThreadEach)
{
    Results results;
    OdTimeStamp date;
    date.setPackedValue(0);
    common::HistoryItem const shared(date, L"ann@studio", L"moves the stairs", L"", 1);
    onTwoThreads([&](int number) {
        for (int i = 0; i < kRounds; ++i) {
            common::HistoryItem own = shared;
            own.detail = numbered(L"of thread ", number);
            results[static_cast<std::size_t>(number)] = own.getName().toStdString() + own.getInfo().toStdString();
        }
    });
    EXPECT_EQ(results[0], results[1]);
    EXPECT_THAT(results[0], testing::StartsWith("moves the stairs"));
}

TEST(Files, AreReadAndReplacedOnAThreadEach)
{
    TempFolder const folder;
    Results results;
    onTwoThreads([&](int number) {
        OdString const path = folder.widePathTo("file" + std::to_string(number));
        for (int i = 0; i < kRounds; ++i) {
            ut::TextFile file(path);
            file.create();
            file.addLine(numbered(L"round ", i));
            EXPECT_TRUE(file.write());
            results[static_cast<std::size_t>(number)] = ut::readEntireFile(path).ansi_str();
        }
    });
    EXPECT_THAT(results, Each("round " + std::to_string(kRounds - 1)));
}

} // namespace
