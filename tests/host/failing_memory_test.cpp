// What commands, and the saves of the library, leave behind when there is not enough memory.
#include "tests/host/failing_memory.h"
#include "tests/host/run_here.h"
#include "tests/host/scene.h"
#include "tests/support/rows.h"
#include "tests/support/stride.h"
#include "tests/support/temp_repository.h"

#include "common/mu_common_config.h"
#include "common/mu_common_repo_prop.h"
#include "common/mu_common_state.h"
#include "platform/os/os_calls.h"

#include <gtest/gtest.h>

#include <csignal>
#include <fcntl.h>
#include <functional>
#include <iostream>
#include <memory>
#include <new>
#include <optional>

namespace host_tests {
namespace {

using support::FailingAllocation;
using Lasts = FailingAllocation::Lasts;

constexpr int kWasEnough = 77;
constexpr int kEscaped = 78;

/// Every number up to some hundreds, then in growing steps; fewer unless every step is asked for.
long next(long n)
{
    static long const dense = support::stride(40, 40) == 1 ? 150 : 40;
    static long const part = dense / 4;
    return n < dense ? n + 1 : n + n / part;
}

void tell(int failures)
{
    EXPECT_GT(failures, 3);
    testing::Test::RecordProperty("failing requests", failures);
    std::cout << failures << " failing requests\n";
}

/// Memory is short from the moment on when the command takes its lock.
int openInShortage(int folder, char const* path, int flags, mode_t mode)
{
    FailingAllocation::resume();
    return openat(folder, path, flags, mode);
}

class FailingAllocationIn : public testing::TestWithParam<SceneRow> {
protected:
    FailingAllocationIn()
    {
        EXPECT_EQ(scene_.tav(command_.arguments).code, 0);
        after_ = scene_.situation();
    }

    /// Runs the command with its n-th request failing.
    Outcome fail(long n, Lasts lasts) const
    {
        return scene_.inCopy([&] {
            Words words(command_.arguments);
            FailingMemory const failing(n, lasts);
            os::calls().openat = openInShortage;
            int code = 0;
            try {
                code = tav::run(words.count(), words.begin());
            } catch (std::bad_alloc const&) {
                code = kEscaped;
            }
            return FailingAllocation::hasFailed() ? code : kWasEnough;
        });
    }

    /// Does that with request after request; `isDue` says whether the end of the command is as it should be.
    template <class IsDue>
    void failEverywhere(Lasts lasts, IsDue const& isDue) const
    {
        int failures = 0;
        for (long n = 0;; n = next(n)) {
            scene_.reset();
            Outcome const outcome = fail(n, lasts);
            if (outcome.code == kWasEnough) {
                break;
            }
            ++failures;
            SCOPED_TRACE("request " + std::to_string(n) + ": " + testing::PrintToString(outcome));
            EXPECT_TRUE(isDue(outcome));
            Outcome const repeated = scene_.verifyAndRepeat(command_);
            EXPECT_TRUE(isDone(repeated)) << testing::PrintToString(repeated);
            EXPECT_EQ(difference(after_, scene_.situation()), "");
        }
        tell(failures);
    }

    SceneRow const command_ = GetParam();
    Scene const scene_{command_.prepare};
    std::string after_;
};

TEST_P(FailingAllocationIn, LosesNothingWhenOneRequestFails)
{
    failEverywhere(Lasts::once, [&](Outcome const& outcome) {
        bool const isDone = outcome.code == 0 && outcome.err.empty();
        return isDone ? difference(after_, scene_.situation()).empty() : faultOfFailure(outcome).empty();
    });
}

/// There may be no memory for the message either. A state that is being saved just then cannot report that. Looking for
/// a folder that has moved comes after the command, and is not worth a message.
TEST_P(FailingAllocationIn, LosesNothingWhenAllRequestsFailFromThenOn)
{
    int unreported = 0;
    failEverywhere(Lasts::on, [&](Outcome const& outcome) {
        unreported += outcome.code == -SIGABRT ? 1 : 0;
        bool const isDone = outcome.code == 0 && outcome.err.empty() && difference(after_, scene_.situation()).empty();
        return isDone || outcome.code == 1 || outcome.code == kEscaped || outcome.code == -SIGABRT;
    });
    EXPECT_LE(unreported, 3);
}

INSTANTIATE_TEST_SUITE_P(Commands, FailingAllocationIn, testing::ValuesIn(sceneRows()), [](auto const& row) {
    return row.param.name;
});

/// Takes the report without needing memory for it.
class SimpleIo final : public common::IoInterface {
public:
    std::int32_t accept(OdString const& /*path*/) const override { return 1; }
    void report(WriteOutcome const& outcome) const override
    {
        FailingAllocation::pause();
        ++reports_;
        hasFailed_ = !outcome.hasValue();
    }

    int reports() const { return reports_; }
    bool hasFailed() const { return hasFailed_; }

private:
    mutable int reports_ = 0;
    mutable bool hasFailed_ = false;
};

enum Save { kSaved = 0, kNotSaved = 1, kSilent = 2 };

Save saveOf(SimpleIo const& io)
{
    return io.reports() != 1 ? kSilent : io.hasFailed() ? kNotSaved : kSaved;
}

struct SaveRow {
    friend void PrintTo(SaveRow const& row, std::ostream* stream) { *stream << row.name; }

    char const* name;
    std::string file;
    /// Calls `begin` when memory begins to be short.
    std::function<Save(support::TempRepository const&, std::function<void()> const& begin)> save;
};

class FailingAllocationWhileSaving : public testing::TestWithParam<SaveRow> {
protected:
    static void prepare(support::TempRepository const& repository)
    {
        repository.write(".tav/tav.state", R"({"head": {"reference": "old"}})");
        repository.write("config/directories.state", "{}");
        repository.makeFolder(".tav/properties");
    }

    static int saveWithout(long n, support::TempRepository const& repository)
    {
        Process process(Setting(), [&] {
            std::optional<FailingMemory> failing;
            Save save = kNotSaved;
            try {
                save = GetParam().save(repository, [&] {
                    failing.emplace(n, Lasts::once);
                    FailingAllocation::resume();
                });
            } catch (std::bad_alloc const&) {
            }
            FailingAllocation::pause();
            return FailingAllocation::hasFailed() ? static_cast<int>(save) : kWasEnough;
        });
        return process.wait().code;
    }

    static std::string contentOf(support::TempRepository const& repository)
    {
        return repository.has(GetParam().file) ? repository.read(GetParam().file) : "there is none";
    }
};

TEST_P(FailingAllocationWhileSaving, LeavesTheOldFileOrTheNewOneAndTellsWhich)
{
    support::TempRepository const done;
    prepare(done);
    std::string const before = contentOf(done);
    ASSERT_EQ(GetParam().save(done, [] {}), kSaved);
    std::string const after = contentOf(done);
    ASSERT_NE(before, after);
    int failures = 0;
    for (long n = 0;; n = next(n)) {
        support::TempRepository const repository;
        prepare(repository);
        int const code = saveWithout(n, repository);
        if (code == kWasEnough) {
            break;
        }
        ++failures;
        SCOPED_TRACE("request " + std::to_string(n));
        EXPECT_TRUE(code == kSaved || code == kNotSaved) << code;
        std::string const content = contentOf(repository);
        EXPECT_TRUE(content == after || (code != kSaved && content == before)) << content;
        EXPECT_EQ(GetParam().save(repository, [] {}), kSaved);
        EXPECT_EQ(contentOf(repository), after);
        EXPECT_EQ(repository.list(), done.list());
    }
    tell(failures);
}

Save saveState(support::TempRepository const& repository, std::function<void()> const& begin)
{
    SimpleIo const io;
    auto cache = common::Cache::get(repository.root(), io).value();
    common::State& state = cache->write();
    state.head = L"new";
    state.stagedFiles.clear();
    for (int i = 0; i < 20; ++i) {
        state.stagedFiles.emplace_back(OdString(L"plan-") + std::to_wstring(i).c_str(), common::FileChange::added);
    }
    begin();
    cache.reset();
    return saveOf(io);
}

Save saveConfig(support::TempRepository const& repository, std::function<void()> const& begin)
{
    SimpleIo const io;
    auto config = common::Config::load(repository.widePathTo("config"), io).value();
    for (int i = 0; i < 20; ++i) {
        config->write()->add(OdString(L"/projects/") + std::to_wstring(i).c_str(), L"bridge", L"cloud");
    }
    begin();
    config.reset();
    return saveOf(io);
}

Save saveIgnoreFile(support::TempRepository const& repository, std::function<void()> const& begin)
{
    begin();
    return common::RepoIgnore::write(repository.root()).hasValue() ? kSaved : kNotSaved;
}

INSTANTIATE_TEST_SUITE_P(
    Files, FailingAllocationWhileSaving,
    testing::Values(
        SaveRow{"State", ".tav/tav.state", saveState}, SaveRow{"Config", "config/directories.state", saveConfig},
        SaveRow{"IgnoreFile", ".tav/properties/ignore", saveIgnoreFile}),
    support::rowName);

} // namespace
} // namespace host_tests
