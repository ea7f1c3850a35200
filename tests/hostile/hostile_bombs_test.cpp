// Small files that unfold into a lot. The commands on them run with little memory.
#include "host/errors/failure.h"
#include "host/protocol/commit_document.h"
#include "host/repository/local_database.h"
#include "host/text/utf8.h"

#include "tests/host/earlier_database.h"
#include "tests/host/history_test.h"
#include "tests/host/run_here.h"
#include "tests/support/rows.h"
#include "tests/support/sanitized.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <sys/resource.h>
#include <unistd.h>

namespace host_tests {
namespace {

using testing::AnyOf;

std::string repeated(std::string const& text, std::size_t count)
{
    std::string result;
    result.reserve(text.size() * count);
    for (std::size_t i = 0; i < count; ++i) {
        result += text;
    }
    return result;
}

/// The address sanitizer takes terabytes of addresses for itself.
void limitMemory(rlim_t bytes)
{
    rlimit const limit{bytes, bytes};
    if (!support::kIsSanitized && setrlimit(RLIMIT_AS, &limit) != 0) {
        _exit(99);
    }
}

constexpr rlim_t kMemory = rlim_t{256} << 20U;

class Bombs : public HistoryTest {
protected:
    Outcome limited(Arguments const& arguments, std::vector<std::string> const& environment = {}) const
    {
        Setting with = setting();
        with.environment = environment;
        Process process(with, [&] {
            limitMemory(kMemory);
            return runHere(arguments);
        });
        return process.wait();
    }
};

struct Bomb {
    char const* name;
    std::string (*text)();
};

std::string withMember(std::string const& member)
{
    return R"({"head": {"reference": "master"}, "projects_map": [], "more": )" + member + "}";
}

std::vector<Bomb> const kBombs = {
    {"Nested", [] { return withMember(repeated("[", 500'000) + repeated("]", 500'000)); }},
    {"NestedObjects", [] { return withMember(repeated("{\"a\":", 300'000) + "1" + repeated("}", 300'000)); }},
    {"NestedAndOpen", [] { return withMember(repeated("[", 1'000'000)); }},
    {"LongText", [] { return withMember('"' + repeated("x", 10'000'000) + '"'); }},
    {"LongTextWithoutEnd", [] { return withMember('"' + repeated("x", 10'000'000)); }},
    {"LongNumber", [] { return withMember(repeated("9", 5'000'000)); }},
    {"OneKeyAMillionTimes", [] { return withMember("1, " + repeated(R"("a":1,)", 1'000'000) + R"("b": 1)"); }},
    {"Escapes", [] { return withMember('"' + repeated("\\u0041", 500'000) + '"'); }},
};

class BombInAFile
    : public Bombs
    , public testing::WithParamInterface<Bomb> {};

/// It is read, or refused with what to do; then nothing has changed.
void expectAnswer(Outcome const& outcome)
{
    bool const isTold = outcome.code == 1 && outcome.err.compare(0, 5, "tav: ") == 0 && outcome.err.size() < 1000;
    EXPECT_TRUE(outcome.code == 0 || isTold) << outcome.code << " " << outcome.err.substr(0, 1000);
}

TEST_P(BombInAFile, IsAnsweredWhereTheStateStands)
{
    std::string const text = GetParam().text();
    repo.write(".tav/tav.state", text);
    repo.write("a.dwg", "new");
    for (Arguments const& command : {Arguments{"status"}, {"unstage", "--all"}}) {
        Outcome const outcome = limited(command);
        expectAnswer(outcome);
        EXPECT_TRUE(outcome.code == 0 || repo.read(".tav/tav.state") == text);
    }
}

TEST_P(BombInAFile, IsAnsweredWhereTheListOfProjectsStands)
{
    support::TempFolder const config;
    std::string const text = GetParam().text();
    config.write("tav/directories.state", text);
    expectAnswer(limited({"projects"}, {"XDG_CONFIG_HOME=" + config.path()}));
    EXPECT_TRUE(config.read("tav/directories.state") == text);
}

TEST_P(BombInAFile, IsAnsweredWhereTheRulesStand)
{
    std::string const text = GetParam().text();
    repo.ignore(text);
    for (Arguments const& command : {Arguments{"status"}, {"add", "--all"}}) {
        Outcome const outcome = limited(command);
        expectAnswer(outcome);
        EXPECT_EQ(outcome.code, 1);
    }
    EXPECT_TRUE(repo.read(".tav/properties/ignore") == text);
}

TEST_P(BombInAFile, IsRefusedAsADocumentForTheServer)
{
    Process process(setting(), [&] {
        limitMemory(4 * kMemory);
        try {
            tav::readCommitInfo(tav::fromUtf8(GetParam().text()));
        } catch (tav::Failure const&) {
            return 1;
        } catch (std::bad_alloc const&) {
            return 2;
        }
        return 0;
    });
    EXPECT_THAT(process.wait().code, AnyOf(1, 2));
}

INSTANTIATE_TEST_SUITE_P(Kinds, BombInAFile, testing::ValuesIn(kBombs), support::rowName);

TEST_P(BombInAFile, IsToldWhereACommandNotedWhatItHasBegun)
{
    tav::LocalDatabase::make(repo.root());
    makeSecondVersion(repo.pathTo(".tav/tav.db"), tav::fromUtf8(GetParam().text()));
    repo.write("a.dwg", "new");
    for (Arguments const& command : {Arguments{"status"}, {"add", "--all"}}) {
        expectAnswer(limited(command));
    }
    EXPECT_EQ(repo.read("a.dwg"), "new");
}

TEST_F(Bombs, OfAGigabyteAreToldWhereMemoryIsShort)
{
    // The text has a hole, which takes no room on the disk.
    std::string const begin = R"({"head": {"reference": "master"}, "projects_map": [], "more": ")";
    off_t const length = support::kIsSanitized ? 100'000'000 : 1'000'000'000;
    for (std::string const name : {".tav/tav.state", ".tav/properties/ignore"}) {
        std::string const before = repo.read(name);
        repo.write(name, begin);
        ASSERT_EQ(truncate(repo.pathTo(name).c_str(), length), 0);
        auto const time = std::filesystem::last_write_time(repo.pathTo(name));
        Outcome const outcome = limited({"add", "--all"});
        expectAnswer(outcome);
        EXPECT_EQ(outcome.code, 1) << name;
        EXPECT_EQ(std::filesystem::file_size(repo.pathTo(name)), length);
        EXPECT_EQ(std::filesystem::last_write_time(repo.pathTo(name)), time);
        repo.write(name, before);
    }
}

TEST_F(Bombs, OfManyRulesAreAnswered)
{
    repo.write("a.dwg", "new");
    repo.ignore(repeated("^.*\\.bak$\n", 20'000) + "^ignore$\n");
    EXPECT_EQ(limited({"files"}), done("a.dwg\n"));
}

/// Expressions that take a matcher of the usual kind longer than anybody waits.
TEST_F(Bombs, OfSlowRulesAndNamesAreAnswered)
{
    std::string const name(30, 'a');
    std::string const longest(255, 'a');
    repo.write(name, "new");
    repo.write(longest, "new");
    repo.ignore("(a*)*b\n.*.*.*.*.*.*x\n(a|aa)+$b\n^ignore$\n");
    EXPECT_EQ(limited({"files"}), done(name + "\n" + longest + "\n"));
    EXPECT_EQ(limited({"add", "(a*)*b"}).code, 1);
    EXPECT_EQ(limited({"add", ".*.*.*.*x"}).code, 1);
    EXPECT_EQ(limited({"add", "--all"}), done("Staged 2 files.\n"));
    EXPECT_EQ(limited({"commit", "-m", "x"}).code, 0);
    EXPECT_EQ(limited({"mv", longest, "c"}), done("Renamed '" + longest + "' to 'c'.\n"));
    EXPECT_EQ(limited({"status"}).code, 0);
}

} // namespace
} // namespace host_tests
