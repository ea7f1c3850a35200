#include "tests/config/configurations.h"
#include "tests/server/examples.h"
#include "tests/server/translations.h"
#include "tests/support/allocations.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/recording_io.h"
#include "tests/support/utf8.h"

#include <array>
#include <cerrno>
#include <filesystem>
#include <gmock/gmock.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

using namespace configurations;
using common::Config;
using common::ConfigData;
using common::ConfigPath;
using support::asOrdinaryUser;
using support::FailingCall;
using support::RecordingIo;
using support::TempFolder;
using testing::AnyOf;
using testing::ElementsAre;
using testing::IsEmpty;

std::string const kTwoProjects = R"({
    "projects_map" : [
        {
            "info" : {
                "name" : "The bridge",
                "uid" : "42"
            },
            "path" : "/bridge"
        },
        {
            "info" : {
                "name" : "The house",
                "uid" : ""
            },
            "path" : "/house"
        }
    ]
})";

void addTwoProjects(ConfigData& data)
{
    data.add(L"/house", L"The house", L"");
    data.add(L"/bridge", L"The bridge", L"42");
}

class SavedConfig : public testing::Test {
protected:
    std::string content() const { return folder.read(kFile); }

    void save() const { addTwoProjects(*load(folder.widePath(), io)->write()); }

    std::string errorOfWriting() const { return "report error: Error writing to file '" + folder.pathTo(kFile) + "'"; }

    TempFolder const folder;
    RecordingIo const io;
};

TEST_F(SavedConfig, HoldsItsProjectsInAscendingOrder)
{
    save();
    EXPECT_EQ(content(), kTwoProjects);
    EXPECT_THAT(folder.list(), ElementsAre(kFile));
    EXPECT_THAT(io.calls(), ElementsAre("report success"));
}

TEST_F(SavedConfig, IsReadAsItWasWritten)
{
    save();
    EXPECT_EQ(loaded(folder.widePath(), io), "/bridge = The bridge (42), /house = The house ()");
}

TEST_F(SavedConfig, ReplacesTheFileAsAWhole)
{
    folder.write(kFile, R"({"other": 1, "projects_map": [{"info": {"name": "", "uid": ""}, "path": "/old"}]})");
    {
        ConfigRef const config = load(folder.widePath(), io);
        config->write()->remove(L"/old");
        addTwoProjects(*config->write());
    }
    EXPECT_EQ(content(), kTwoProjects);
    EXPECT_THAT(io.calls(), ElementsAre("report success"));
}

TEST_F(SavedConfig, IsAnEmptyObjectWithoutProjects)
{
    folder.write(kFile, "{}");
    load(folder.widePath(), io)->write();
    EXPECT_EQ(content(), "{\n}");
    EXPECT_THAT(io.calls(), ElementsAre("report success"));
}

TEST_F(SavedConfig, IsAnEmptyObjectWhenTheLastProjectIsRemoved)
{
    save();
    ConfigRef config = load(folder.widePath(), io);
    config->write()->remove(L"/house");
    config->write()->remove(L"/bridge");
    config.reset();
    EXPECT_EQ(content(), "{\n}");
}

TEST_F(SavedConfig, IsWrittenByTheLastOwnerAlone)
{
    ConfigRef config = load(folder.widePath(), io);
    ConfigRef owner = config;
    addTwoProjects(*config->write());
    config->write();
    config.reset();
    EXPECT_THAT(folder.list(), IsEmpty());
    EXPECT_THAT(io.calls(), IsEmpty());
    owner.reset();
    EXPECT_EQ(content(), kTwoProjects);
    EXPECT_THAT(io.calls(), ElementsAre("report success"));
}

TEST_F(SavedConfig, IsNotWrittenWithoutAWriter)
{
    {
        ConfigRef const config = load(folder.widePath(), io);
        static_cast<void>(config->read());
    }
    EXPECT_THAT(folder.list(), IsEmpty());
    EXPECT_THAT(io.calls(), IsEmpty());
}

TEST_F(SavedConfig, NeedsNoFactory)
{
    ConfigData data;
    addTwoProjects(data);
    Config(ConfigPath(folder.widePath()), data, io).write();
    EXPECT_EQ(content(), kTwoProjects);
}

TEST_F(SavedConfig, EscapesWhatCannotStandInADocument)
{
    load(folder.widePath(), io)->write()->add(L"/a\\b", OdString(L"\"\u00E4\0\n", 4), L"\xDCFF\xD800");
    EXPECT_EQ(content(), R"({
    "projects_map" : [
        {
            "info" : {
                "name" : "\"\u00E4\u0000\n",
                "uid" : "\uDCFF\uD800"
            },
            "path" : "/a\\b"
        }
    ]
})");
    EXPECT_EQ(load(folder.widePath(), io)->read().projects.at(L"/a\\b").name, OdString(L"\"\u00E4\0\n", 4));
    EXPECT_EQ(load(folder.widePath(), io)->read().projects.at(L"/a\\b").cloud, OdString(L"\xDCFF\xD800"));
}

TEST_F(SavedConfig, GoesWhereALinkLeads)
{
    folder.write("elsewhere/real", "{}");
    folder.makeLink(kFile, "elsewhere/real");
    save();
    EXPECT_EQ(folder.read("elsewhere/real"), kTwoProjects);
    EXPECT_TRUE(std::filesystem::is_symlink(folder.pathTo(kFile)));
}

TEST_F(SavedConfig, KeepsThePermissionsOfTheFile)
{
    folder.write(kFile, "{}");
    ASSERT_EQ(chmod(folder.pathTo(kFile).c_str(), 0640), 0);
    save();
    struct stat status {};
    ASSERT_EQ(stat(folder.pathTo(kFile).c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0640U);
}

TEST_F(SavedConfig, ReportsThatItsFolderHasGone)
{
    {
        Config config(ConfigPath(folder.widePathTo("gone")), io);
        config.write();
    }
    EXPECT_THAT(
        io.calls(),
        ElementsAre("report error: Error writing to file '" + folder.pathTo("gone/directories.state") + "'"));
    EXPECT_THAT(folder.list(), IsEmpty());
}

TEST_F(SavedConfig, LeavesTheOldFileInAFolderThatMayNotBeWritten)
{
    folder.write(kFile, "{}");
    ASSERT_EQ(chmod(folder.path().c_str(), 0555), 0);
    std::string const reported = asOrdinaryUser([&] {
        Config(ConfigPath(folder.widePath()), io).write()->add(L"/a", L"A", L"1");
        return testing::PrintToString(io.calls());
    });
    EXPECT_EQ(reported, "{ \"" + errorOfWriting() + "\" }");
    EXPECT_EQ(content(), "{}");
    EXPECT_THAT(folder.list(), ElementsAre(kFile));
}

TEST_F(SavedConfig, IsNotMadeInAFolderThatHasBeenLockedSinceItWasLoaded)
{
    ASSERT_EQ(chmod(folder.path().c_str(), 0777), 0);
    std::string const path = folder.pathTo("own");
    std::string const reported = asOrdinaryUser([&] {
        load(support::fromUtf8(path), io)->write(); // Its folder and its file are the child's own.
        ConfigRef config = load(support::fromUtf8(path), io);
        config->write();
        chmod(path.c_str(), 0555);
        config.reset();
        chmod(path.c_str(), 0777);
        return testing::PrintToString(io.calls());
    });
    EXPECT_EQ(
        reported, "{ \"report success\", \"report error: Error writing to file '" + path + "/directories.state'\" }");
}

/// Lets memory run out while a configuration is saved.
class SavedConfigOutOfMemory : public SavedConfig {
protected:
    std::vector<std::string> reported() const
    {
        constexpr std::size_t kLarge = 1'000'000;
        folder.write(kFile, "{}");
        ConfigRef config = load(folder.widePath(), io);
        config->write()->add(L"/a", OdString(std::wstring(kLarge, L'x').c_str(), kLarge), L"1");
        support::RefusedAllocations const refused(kLarge);
        config.reset();
        return io.calls();
    }
};

TEST_F(SavedConfigOutOfMemory, IsReportedAndLeavesTheOldFile)
{
    EXPECT_THAT(
        reported(), ElementsAre("report error: An unexpected error occurred while deserializing the config file."));
    EXPECT_EQ(content(), "{}");
}

TEST_F(SavedConfigOutOfMemory, IsReportedInTheLanguageOfTheUser)
{
    server::Translations const translations({"An unexpected error occurred while deserializing the config file."});
    EXPECT_THAT(
        reported(), ElementsAre("report error: {An unexpected error occurred while deserializing the config file.}"));
}

TEST_F(SavedConfig, ReportsInTheLanguageOfTheUser)
{
    server::Translations const translations({"Error writing to file '%ls'", "projects_map", "info", "path"});
    Config(ConfigPath(folder.widePathTo("gone")), io).write();
    save();
    EXPECT_THAT(
        io.calls(), ElementsAre(
                        "report error: {Error writing to file '" + folder.pathTo("gone/directories.state") + "'}",
                        "report success"));
    EXPECT_EQ(content(), kTwoProjects);
}

TEST_F(SavedConfig, IsWhatTheDescriptionOfTheFormatShows)
{
    {
        ConfigRef const config = load(folder.widePath(), io);
        config->write()->add(L"/projects/house", L"The house", L"");
        config->write()->add(L"/projects/bridge", L"The bridge", L"42");
    }
    EXPECT_EQ(content(), server::example("configuration.md", "# Configuration"));
    EXPECT_EQ(loaded(folder.widePath(), io), "/projects/bridge = The bridge (42), /projects/house = The house ()");
}

TEST_F(SavedConfig, IsWhatTheDescriptionOfTheFormatShowsWithoutProjects)
{
    load(folder.widePath(), io)->write();
    EXPECT_EQ(content(), server::example("configuration.md", "# Configuration", 1));
}

class FailingSave : public SavedConfig {
protected:
    static constexpr char const* kOld = "{}";

    /// A changed configuration over the old file.
    ConfigRef changed() const
    {
        folder.write(kFile, kOld);
        ConfigRef config = load(folder.widePath(), io);
        addTwoProjects(*config->write());
        return config;
    }

    int callsOfSaving() const
    {
        ConfigRef config = changed();
        return support::countCalls([&] { config.reset(); });
    }
};

TEST_F(FailingSave, LeavesOldOrNewFileWholeAndReportsOnceWhicheverCallFails)
{
    int const calls = callsOfSaving();
    ASSERT_GT(calls, 5);
    for (int n = 0; n < calls; ++n) {
        ConfigRef config = changed();
        std::size_t const before = io.calls().size();
        FailingCall const failing(n, ENOSPC);
        config.reset();
        ASSERT_EQ(io.calls().size(), before + 1) << failing.name();
        EXPECT_THAT(io.calls().back(), AnyOf("report success", errorOfWriting())) << failing.name();
        EXPECT_THAT(content(), AnyOf(kOld, kTwoProjects)) << failing.name();
        EXPECT_TRUE(io.calls().back() == errorOfWriting() || content() == kTwoProjects) << failing.name();
    }
}

TEST_F(FailingSave, LeavesOldOrNewFileWholeWhereverTheProcessIsKilled)
{
    int const calls = callsOfSaving();
    ASSERT_EQ(chmod(folder.path().c_str(), 0777), 0);
    for (int n = 0; n < calls; ++n) {
        folder.write(kFile, kOld);
        ASSERT_EQ(chmod(folder.pathTo(kFile).c_str(), 0666), 0);
        asOrdinaryUser([&] {
            ConfigRef config = load(folder.widePath(), io);
            addTwoProjects(*config->write());
            FailingCall const killing(n, FailingCall::kKillProcess);
            config.reset();
            return std::string();
        });
        EXPECT_THAT(content(), AnyOf(kOld, kTwoProjects)) << "killed in call " << n;
    }
}

TEST_F(FailingSave, ReportsAFullDisk)
{
    ConfigRef config = changed();
    FailingCall const failing(0, ENOSPC);
    config.reset();
    EXPECT_TRUE(failing.hasFailed());
    EXPECT_THAT(io.calls(), ElementsAre(errorOfWriting()));
    EXPECT_EQ(content(), kOld);
}

/// A gate at which processes wait for each other.
class Gate {
public:
    Gate() { EXPECT_TRUE(pipe(arrived_.data()) == 0 && pipe(open_.data()) == 0); }
    Gate(Gate const&) = delete;
    Gate& operator=(Gate const&) = delete;
    ~Gate()
    {
        for (int const end : {arrived_[0], arrived_[1], open_[0], open_[1]}) {
            close(end);
        }
    }

    /// In a child: says that it is there and waits until the parent opens.
    void pass() const
    {
        char byte = 0;
        close(open_[1]);
        if (write(arrived_[1], &byte, 1) != 1 || read(open_[0], &byte, 1) != 0) {
            _exit(2);
        }
    }

    /// In the parent: waits for `count` children and lets them through.
    void open(int count)
    {
        char byte = 0;
        for (int i = 0; i < count; ++i) {
            EXPECT_EQ(read(arrived_[0], &byte, 1), 1);
        }
        close(open_[1]);
        open_[1] = -1;
    }

private:
    std::array<int, 2> arrived_{-1, -1};
    std::array<int, 2> open_{-1, -1};
};

/// Saves of two processes at the same moment.
class SimultaneousSaves : public SavedConfig {
protected:
    /// Enough projects that writing takes several calls.
    static void addProjects(ConfigData& data, wchar_t const* name)
    {
        for (int i = 0; i < 300; ++i) {
            data.add(OdString().format(L"/%ls/%d", name, i), name, name);
        }
    }

    std::string documentOf(wchar_t const* name) const
    {
        TempFolder const other;
        addProjects(*load(other.widePath(), io)->write(), name);
        return other.read(kFile);
    }

    /// A child that saves its own projects. Its exit code tells whether that was reported as a success.
    pid_t saving(wchar_t const* name, Gate const& gate) const
    {
        pid_t const child = fork();
        if (child == 0) {
            RecordingIo const childIo;
            ConfigRef config = load(folder.widePath(), childIo);
            addProjects(*config->write(), name);
            gate.pass();
            config.reset();
            _exit(childIo.calls() == std::vector<std::string>{"report success"} ? 0 : 1);
        }
        return child;
    }

    static void expectSuccess(pid_t child)
    {
        int status = 0;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << "status " << status;
    }
};

TEST_F(SimultaneousSaves, EachLeaveAWholeFile)
{
    std::string const first = documentOf(L"first");
    std::string const second = documentOf(L"second");
    ASSERT_NE(first, second);
    for (int round = 0; round < 200; ++round) {
        folder.write(kFile, "{}");
        Gate gate;
        std::array<pid_t, 2> const children = {saving(L"first", gate), saving(L"second", gate)};
        gate.open(2);
        EXPECT_TRUE(testing::Value(content(), AnyOf("{}", first, second))) << "while they save, round " << round;
        expectSuccess(children[0]);
        expectSuccess(children[1]);
        ASSERT_TRUE(testing::Value(content(), AnyOf(first, second))) << "round " << round;
        ASSERT_THAT(folder.list(), ElementsAre(kFile)) << "round " << round;
    }
}

} // namespace
