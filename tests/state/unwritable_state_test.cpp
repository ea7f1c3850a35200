// Disks, folders and files that stand in the way.
#include "tests/state/golden.h"
#include "tests/state/states.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"

#include <cerrno>
#include <filesystem>
#include <gmock/gmock.h>
#include <string>
#include <sys/stat.h>
#include <unistd.h>

namespace {

using namespace states;
using support::FailingCall;
using testing::ElementsAre;
using testing::IsEmpty;

std::string const kOld = R"({"head": {"reference": "old"}})";
std::string const kNew = "{\n    \"head\" : {\n        \"reference\" : \"new\"\n    }\n}";

/// Loads the state, changes it and lets it go; what the host is told meanwhile. Without the rights of the
/// administrator.
std::string saveAsOrdinaryUser(Repository const& repository)
{
    return support::asOrdinaryUser([&] {
        repository.open()->write().head = L"new";
        std::string told;
        for (std::string const& call : repository.calls()) {
            told += call;
        }
        return told;
    });
}

void setMode(Repository const& repository, std::string const& name, mode_t mode)
{
    ASSERT_EQ(chmod(repository.pathTo(name).c_str(), mode), 0) << errno;
}

class UnwritableState : public testing::Test {
protected:
    UnwritableState() : repository_(kOld)
    {
        setMode(repository_, "", 0755);
        setMode(repository_, ".tav", 0777);
        setMode(repository_, ".tav/tav.state", 0666);
    }

    void expectOldState() const
    {
        EXPECT_EQ(repository_.stateFile(), kOld);
        EXPECT_THAT(repository_.list(), ElementsAre(".tav/", ".tav/tav.state"));
    }

    Repository const repository_;
};

TEST_F(UnwritableState, IsWrittenWhenNothingStandsInTheWay)
{
    EXPECT_EQ(saveAsOrdinaryUser(repository_), "report success");
    EXPECT_EQ(repository_.stateFile(), kNew);
}

TEST_F(UnwritableState, InAReadOnlyFolderIsReportedOnce)
{
    setMode(repository_, ".tav", 0555);
    EXPECT_EQ(saveAsOrdinaryUser(repository_), unwritable(repository_));
    expectOldState();
}

TEST_F(UnwritableState, OfAReadOnlyFileIsReportedOnce)
{
    setMode(repository_, ".tav/tav.state", 0444);
    EXPECT_EQ(saveAsOrdinaryUser(repository_), unwritable(repository_));
    expectOldState();
}

TEST_F(UnwritableState, CreatedInAReadOnlyFolderIsReportedOnce)
{
    ASSERT_EQ(unlink(repository_.statePath().c_str()), 0);
    setMode(repository_, ".tav", 0555);
    std::string const told = support::asOrdinaryUser([&] {
        Cache::create(repository_.root(), repository_.io());
        return repository_.calls().size() == 1 ? repository_.calls().front() : "not one call";
    });
    EXPECT_EQ(told, unwritable(repository_));
    EXPECT_THAT(repository_.list(), ElementsAre(".tav/"));
}

TEST_F(UnwritableState, InAVanishedFolderIsReportedOnce)
{
    std::shared_ptr<Cache> cache = repository_.open();
    cache->write().head = L"new";
    std::filesystem::remove_all(repository_.pathTo(".tav"));
    cache.reset();
    EXPECT_THAT(repository_.calls(), ElementsAre(unwritable(repository_)));
    EXPECT_THAT(repository_.list(), IsEmpty());
}

TEST_F(UnwritableState, InAVanishedWorkingFolderIsReportedOnce)
{
    support::TempFolder const parent;
    parent.write("bridge/.tav/tav.state", kOld);
    support::RecordingIo const io;
    std::shared_ptr<Cache> cache = Cache::get(common::RootPath(parent.widePathTo("bridge")), io).value();
    cache->write();
    std::filesystem::remove_all(parent.pathTo("bridge"));
    cache.reset();
    EXPECT_THAT(
        io.calls(),
        ElementsAre("report error: Error writing to file '" + parent.pathTo("bridge/.tav/tav.state") + "'"));
    EXPECT_THAT(parent.list(), IsEmpty());
}

TEST_F(UnwritableState, WhoseFileBecameAFolderIsReportedOnce)
{
    std::shared_ptr<Cache> cache = repository_.open();
    cache->write();
    ASSERT_EQ(unlink(repository_.statePath().c_str()), 0);
    repository_.write(".tav/tav.state/inside", "content");
    cache.reset();
    EXPECT_THAT(repository_.calls(), ElementsAre(unwritable(repository_)));
    EXPECT_THAT(repository_.list(), ElementsAre(".tav/", ".tav/tav.state/", ".tav/tav.state/inside"));
}

TEST_F(UnwritableState, WhoseFileVanishedIsWrittenAnew)
{
    std::shared_ptr<Cache> cache = repository_.open();
    cache->write().head = L"new";
    ASSERT_EQ(unlink(repository_.statePath().c_str()), 0);
    cache.reset();
    EXPECT_THAT(repository_.calls(), ElementsAre("report success"));
    EXPECT_EQ(repository_.stateFile(), kNew);
}

TEST_F(UnwritableState, NamesAPathThatLooksLikeAFormatAsItIs)
{
    support::TempFolder const folder;
    support::RecordingIo const io;
    Cache::create(common::RootPath(folder.widePathTo("100%ls %n")), io);
    EXPECT_THAT(
        io.calls(),
        ElementsAre("report error: Error writing to file '" + folder.pathTo("100%ls %n/.tav/tav.state") + "'"));
}

TEST_F(UnwritableState, OnADiskThatFailsIsOldOrNewAndReportedOnceWhicheverCallFails)
{
    for (int const error : {ENOSPC, EDQUOT, EIO, EROFS, EACCES, EMFILE, ENOENT}) {
        bool more = true;
        for (int n = 0; more; ++n) {
            repository_.writeState(kOld);
            std::size_t const calls = repository_.calls().size();
            std::shared_ptr<Cache> cache = repository_.open();
            cache->write().head = L"new";
            FailingCall const failing(n, error);
            cache.reset();
            SCOPED_TRACE(failing.name() + " with error " + std::to_string(error));
            ASSERT_EQ(repository_.calls().size(), calls + 1);
            bool const succeeded = repository_.calls().back() == "report success";
            EXPECT_TRUE(succeeded || repository_.calls().back() == unwritable(repository_));
            EXPECT_TRUE(repository_.stateFile() == kNew || (!succeeded && repository_.stateFile() == kOld));
            EXPECT_THAT(repository_.list(), ElementsAre(".tav/", ".tav/tav.state"));
            more = failing.hasFailed();
        }
    }
}

std::string unreadable(Repository const& repository, std::string const& reason)
{
    return "error: Could not read file '" + repository.statePath() + "': " + reason;
}

TEST(UnreadableState, IsRefusedWithTheReason)
{
    Repository const repository(kOld);
    setMode(repository, "", 0755);
    setMode(repository, ".tav", 0755);
    setMode(repository, ".tav/tav.state", 0200);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return repository.loaded(); }), unreadable(repository, "Permission denied"));
}

TEST(UnreadableState, InAFolderThatCannotBeEnteredIsNotFound)
{
    Repository const repository(kOld);
    setMode(repository, "", 0755);
    setMode(repository, ".tav", 0600);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return repository.loaded(); }),
        "error: No state file found at " + repository.statePath());
    setMode(repository, ".tav", 0755);
}

TEST(UnreadableState, ThatIsAFolderIsRefusedWithTheReason)
{
    Repository const repository;
    repository.makeFolder(".tav/tav.state");
    EXPECT_EQ(repository.loaded(), unreadable(repository, "Is a directory"));
}

TEST(UnreadableState, ThatIsAPipeIsRefusedWithoutWaitingForIt)
{
    Repository const repository;
    ASSERT_EQ(mkfifo(repository.statePath().c_str(), 0666), 0);
    EXPECT_EQ(repository.loaded(), unreadable(repository, "Not a regular file"));
}

TEST(UnreadableState, OnADiskThatFailsIsRefusedWithTheReason)
{
    Repository const repository(kOld);
    std::string const error = unreadable(repository, "Input/output error");
    bool more = true;
    for (int n = 0; more; ++n) {
        FailingCall const failing(n, EIO);
        std::string const outcome = repository.loaded();
        bool const mayFail = failing.name().find("close") == std::string::npos && failing.hasFailed();
        EXPECT_EQ(outcome, mayFail ? error : "HEAD old\n") << failing.name();
        more = failing.hasFailed();
    }
    EXPECT_EQ(repository.stateFile(), kOld);
    EXPECT_THAT(repository.calls(), IsEmpty());
}

TEST(LinkedState, IsLoadedAndItsTargetWrittenWhileTheLinkStays)
{
    Repository const repository;
    repository.write("elsewhere/state", kOld);
    repository.makeLink(".tav/tav.state", "../elsewhere/state");
    EXPECT_EQ(repository.loaded(), "HEAD old\n");
    repository.open()->write().head = L"new";
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
    EXPECT_TRUE(std::filesystem::is_symlink(repository.statePath()));
    EXPECT_EQ(repository.read("elsewhere/state"), kNew);
    EXPECT_THAT(repository.list(), ElementsAre(".tav/", ".tav/tav.state", "elsewhere/", "elsewhere/state"));
}

TEST(LinkedState, ThatDanglesIsNotFoundAndCreatedAtItsTarget)
{
    Repository const repository;
    repository.makeFolder("elsewhere");
    repository.makeLink(".tav/tav.state", "../elsewhere/state");
    EXPECT_EQ(repository.loaded(), "error: No state file found at " + repository.statePath());
    Cache::create(repository.root(), repository.io());
    EXPECT_THAT(repository.calls(), ElementsAre("report success"));
    EXPECT_TRUE(std::filesystem::is_symlink(repository.statePath()));
    EXPECT_EQ(repository.loaded(), "HEAD master\n");
}

TEST(StateFile, KeepsItsPermissions)
{
    Repository const repository(kOld);
    setMode(repository, ".tav/tav.state", 0640);
    repository.open()->write();
    struct stat status;
    ASSERT_EQ(stat(repository.statePath().c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0640U);
}

} // namespace
