// Stored versions that are damaged, and working files that still have them.
#include "tests/host/history_test.h"
#include "tests/host/run_here.h"
#include "tests/support/rows.h"

#include "platform/os/os_calls.h"

#include <gmock/gmock.h>

#include <cerrno>
#include <random>
#include <unistd.h>

namespace host_tests {
namespace {

using testing::HasSubstr;

std::string const kNothingDamaged = "Read 5 stored versions; nothing is damaged.\n";

/// Two commits of "a.dwg" and "n.txt". The second version of both is damaged in the storage; the working folder has it.
class Repair : public HistoryTest {
protected:
    Repair()
    {
        repo.write("a.dwg", "drawing one");
        repo.write("n.txt", "text one");
        commitAll("the first");
        repo.write("a.dwg", "drawing two");
        repo.write("n.txt", "text two");
        commitAll("the second");
        damageEnd(storeOf("a-"));
        damageEnd(newestObject());
    }

    /// The revision store whose name begins with `stem`.
    std::string storeOf(std::string const& stem) const
    {
        for (std::string const& name : repo.list()) {
            if (name.find(".tav/tf/" + stem) == 0) {
                return name;
            }
        }
        return {};
    }

    void damage(std::string const& file, std::size_t place) const
    {
        std::string bytes = repo.read(file);
        bytes.at(place) = static_cast<char>(bytes.at(place) ^ 1);
        repo.write(file, bytes);
    }

    void damageEnd(std::string const& file) const { damage(file, repo.read(file).size() - 2); }

    void remove(std::string const& name) const { ASSERT_EQ(unlink(repo.pathTo(name).c_str()), 0); }

    /// Runs a command in a copy of this process whose disk is full.
    Outcome tavOnFullDisk(Arguments const& arguments) const
    {
        Process process(setting(), [&] {
            os::calls().pwrite = [](int, void const*, std::size_t, off_t) -> ssize_t {
                errno = ENOSPC;
                return -1;
            };
            return runHere(arguments);
        });
        return process.wait();
    }

private:
    std::string newestObject() const
    {
        std::string const digest = values({"show", "2"}, "sha256").back();
        return ".tav/objects/" + digest;
    }
};

TEST_F(Repair, OfWhatTheWorkingFolderStillHasIsMadeByVerify)
{
    EXPECT_EQ(
        tav({"verify"}), done(
                             "Repaired 2 stored versions from the working folder:\n"
                             "        n.txt\n"
                             "        a.dwg\n" +
                             kNothingDamaged));
    EXPECT_EQ(tav({"verify"}), done(kNothingDamaged));
}

TEST_F(Repair, IsMadeFromAFileOfAnyName)
{
    ASSERT_EQ(rename(repo.pathTo("a.dwg").c_str(), repo.pathTo("copy.bin").c_str()), 0);
    EXPECT_THAT(tav({"verify"}).out, HasSubstr("        copy.bin\n"));
    EXPECT_EQ(tav({"verify"}), done(kNothingDamaged));
    EXPECT_EQ(tav({"restore", "a.dwg"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "drawing two");
}

TEST_F(Repair, IsListedInTheDocumentOfVerify)
{
    EXPECT_THAT(
        tav({"verify", "--json"}).out,
        testing::MatchesRegex(
            "\\{\n    \"damaged\" : \\[\n    \\],\n    \"elsewhere\" : 0,\n    \"repaired\" : \\[\n        \\{\n"
            "            \"path\" : \"n.txt\",\n            \"url\" : \"po:[0-9a-f]*\"\n        \\},\n"
            "        \\{\n            \"path\" : \"a.dwg\",\n            \"url\" : "
            "\"tf:a-[^\"]*\"\n        \\}\n    \\],\n    \"versions\" : 5\n\\}\n"));
}

TEST_F(Repair, LeavesWhatNoFileHasForTheReport)
{
    repo.write("a.dwg", "drawing too"); // Of the same length.
    Outcome const outcome = tav({"verify"});
    EXPECT_EQ(outcome.code, 1);
    EXPECT_EQ(outcome.out, "Repaired 1 stored version from the working folder:\n        n.txt\n");
    EXPECT_THAT(
        outcome.err, testing::MatchesRegex("tav: 1 of 5 stored versions cannot be read. Put copies of these files from "
                                           "a backup in their place:\n  .*/\\.tav/tf/a-[0-9a-f]*\\.tf, for 'a.dwg' of "
                                           "commit 2: The content of 'tf:a-[^ ]*' is damaged\\.\n"));
}

TEST_F(Repair, IsNotTriedOnAFullDiskWithoutSayingSo)
{
    Outcome const outcome = tavOnFullDisk({"verify"});
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(
        outcome.err, HasSubstr("tav: Nothing could be repaired from the working folder: The stored version of "
                               "'a.dwg' can neither be read nor stored again: "));
    EXPECT_THAT(outcome.err, HasSubstr("tav: 2 of 5 stored versions cannot be read."));
}

TEST_F(Repair, BringsBackWhatBuildsOnTheDamagedVersion)
{
    std::minstd_rand random;
    std::string plan(100'000, ' ');
    for (char& c : plan) {
        c = static_cast<char>(random() >> 8U);
    }
    for (int i = 0; i < 3; ++i) {
        plan[50'000] = static_cast<char>(i);
        repo.write("plan.dwg", plan);
        commitAll("plan " + std::to_string(i));
    }
    tav({"verify"});
    damage(storeOf("plan-"), 1000);
    remove("plan.dwg");
    plan[50'000] = 0;
    repo.write("found.dwg", plan);
    EXPECT_EQ(
        tav({"verify"}), done("Repaired 1 stored version from the working folder:\n        found.dwg\n"
                              "Read 8 stored versions; nothing is damaged.\n"));
}

struct CommandRow {
    char const* name;
    Arguments arguments;
};

class RepairBefore
    : public Repair
    , public testing::WithParamInterface<CommandRow> {};

TEST_P(RepairBefore, TheLastGoodCopyGoes)
{
    EXPECT_EQ(tav(GetParam().arguments).code, 0);
    EXPECT_NE(repo.has("a.dwg") ? repo.read("a.dwg") : "", "drawing two");
    EXPECT_EQ(tav({"restore", "a.dwg", "n.txt", "--from", "2"}).code, 0);
    EXPECT_EQ(repo.read("a.dwg"), "drawing two");
    EXPECT_EQ(repo.read("n.txt"), "text two");
    EXPECT_EQ(tav({"verify"}), done(kNothingDamaged));
}

TEST_P(RepairBefore, TheLastGoodCopyGoesOrItStays)
{
    Outcome const outcome = tavOnFullDisk(GetParam().arguments);
    EXPECT_EQ(outcome.code, 1);
    EXPECT_THAT(
        outcome.err, testing::MatchesRegex("tav: The stored version of 'a.dwg' can neither be read nor stored again: "
                                           ".* cannot be written: No space left on device\\. The file stays, since "
                                           "it may be the only copy; check the disk and the free space\\.\n"));
    EXPECT_EQ(repo.read("a.dwg"), "drawing two");
    EXPECT_EQ(repo.read("n.txt"), "text two");
}

INSTANTIATE_TEST_SUITE_P(
    Commands, RepairBefore,
    testing::Values(
        CommandRow{"Checkout", {"checkout", "1"}}, CommandRow{"ForcedCheckout", {"checkout", "1", "--force"}},
        CommandRow{"Restore", {"restore", "a.dwg", "n.txt", "--from", "1"}},
        CommandRow{"Removal", {"rm", "a.dwg", "n.txt"}}),
    support::rowName);

TEST_F(Repair, IsMadeByAddOfAFileThatIsAsItWasCommitted)
{
    EXPECT_EQ(tav({"add", "a.dwg", "n.txt"}), done("Repaired 2 stored versions.\nNothing new to stage.\n"));
    EXPECT_EQ(tav({"verify"}), done(kNothingDamaged));
    EXPECT_EQ(tav({"add", "a.dwg"}), done("Nothing new to stage.\n"));
}

TEST_F(Repair, IsMadeByACommitThatTakesTheContentAgain)
{
    repo.write("b.dwg", "drawing two");
    repo.write("m.txt", "text two");
    tav({"add", "b.dwg", "m.txt"});
    EXPECT_EQ(tav({"commit", "-m", "copies"}).code, 0);
    EXPECT_EQ(tav({"verify"}), done(kNothingDamaged));
}

} // namespace
} // namespace host_tests
