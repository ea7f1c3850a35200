// Changes that leave the modification time as it was: each command has to see them.
#include "host/changes/folder_view.h"
#include "host/repository/local_database.h"

#include "tests/host/history_test.h"

#include "common/mu_common_versions.h"

#include <gmock/gmock.h>

#include <cstdio>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace host_tests {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

constexpr timespec kDate = {1'700'000'000, 7};

/// A way to change the content of a file, and of nothing else that a listing shows.
struct Disguise {
    char const* name;
    void (*change)(support::TempFolder const& folder, std::string const& file);
};

void setDate(std::string const& path)
{
    timespec const times[] = {kDate, kDate};
    ASSERT_EQ(utimensat(AT_FDCWD, path.c_str(), times, 0), 0);
}

class UnchangedTime
    : public HistoryTest
    , public testing::WithParamInterface<Disguise> {
protected:
    UnchangedTime()
    {
        for (char const* const content : {"old plan", "any plan"}) {
            repo.write("plan.dwg", content);
            repo.write("note.txt", content);
            setDate(repo.pathTo("plan.dwg"));
            setDate(repo.pathTo("note.txt"));
            EXPECT_EQ(commitAll(content).code, 0);
        }
        EXPECT_EQ(status(), kClean);
        GetParam().change(repo, "plan.dwg");
        GetParam().change(repo, "note.txt");
    }

    static constexpr char const* kWouldBeLost =
        "tav: These files have uncommitted changes, which would be lost. Commit them first, or discard them with "
        "--force:\n";
};

TEST_P(UnchangedTime, ShowsInTheStatus)
{
    EXPECT_EQ(
        status(), "Modified, not staged:\n  (use 'tav add NAME' to stage a file)\n        modified: note.txt\n"
                  "        modified: plan.dwg\n\n");
}

TEST_P(UnchangedTime, ShowsInTheDifferences)
{
    EXPECT_EQ(values({"diff"}, "path"), (std::vector<std::string>{"note.txt", "plan.dwg"}));
}

TEST_P(UnchangedTime, IsStagedAndCommitted)
{
    EXPECT_EQ(tav({"add", "plan.dwg"}), done("Staged 1 file.\n"));
    EXPECT_EQ(tav({"add", "--all"}), done("Staged 1 file.\n"));
    EXPECT_EQ(tav({"commit", "-m", "new"}).code, 0);
    EXPECT_EQ(status(), kClean);
    EXPECT_EQ(tav({"checkout", "1"}).code, 0);
    EXPECT_EQ(tav({"checkout", "3"}).code, 0);
    EXPECT_EQ(repo.read("plan.dwg"), "new plan");
}

TEST_P(UnchangedTime, IsNotLostWhenTheFileIsRemoved)
{
    EXPECT_EQ(
        tav({"rm", "plan.dwg"}), failed("tav: 'plan.dwg' has changes that are in no commit. Commit them first.\n"));
    EXPECT_EQ(repo.read("plan.dwg"), "new plan");
}

TEST_P(UnchangedTime, IsNotLostToAnotherVersion)
{
    std::string const both = std::string(kWouldBeLost) + "  note.txt\n  plan.dwg\n";
    EXPECT_EQ(tav({"restore", "plan.dwg"}), failed(std::string(kWouldBeLost) + "  plan.dwg\n"));
    EXPECT_EQ(tav({"checkout", "1"}), failed(both));
    EXPECT_EQ(tav({"branch", "other", "1"}).code, 0);
    EXPECT_EQ(tav({"switch", "other"}), failed(both));
    EXPECT_EQ(repo.read("plan.dwg"), "new plan");
}

INSTANTIATE_TEST_SUITE_P(
    Disguises, UnchangedTime,
    testing::Values(
        Disguise{
            "AnotherFileOfThatDateInItsPlace",
            [](support::TempFolder const& folder, std::string const& file) {
                folder.write(file + ".other", "new plan");
                setDate(folder.pathTo(file + ".other"));
                ASSERT_EQ(std::rename(folder.pathTo(file + ".other").c_str(), folder.pathTo(file).c_str()), 0);
            }},
        Disguise{
            "WrittenAndGivenItsDateBack",
            [](support::TempFolder const& folder, std::string const& file) {
                folder.write(file, "new plan");
                setDate(folder.pathTo(file));
            }}),
    [](auto const& row) { return std::string(row.param.name); });

class VerifiedFiles : public HistoryTest {
protected:
    /// Digest of each file of which a record holds for the file as it is now.
    std::map<std::string, std::string> known() const
    {
        std::map<std::string, std::string> digests;
        tav::FolderView view(repo.root());
        for (tav::VerifiedFile const& file : tav::LocalDatabase::open(repo.root()).verifiedFiles()) {
            if (view.look(file.path).stamp == file.stamp) {
                digests[file.path] = tav::hexOf(file.digest);
            }
        }
        return digests;
    }

    void writeLongAgo(std::string const& name, std::string const& content) const
    {
        repo.write(name, content);
        setDate(repo.pathTo(name));
    }

    static std::string digest(std::string const& content)
    {
        return generateSha(content.data(), static_cast<int>(content.size())).ansi_str();
    }
};

TEST_F(VerifiedFiles, AreThoseThatACommitHasRead)
{
    writeLongAgo("a.dwg", "one");
    commitAll("first");
    EXPECT_EQ(known()["a.dwg"], digest("one"));
}

TEST_F(VerifiedFiles, AreThoseThatAMoveHasWrittenOrFound)
{
    writeLongAgo("a.dwg", "one");
    writeLongAgo("b.txt", "one");
    commitAll("first");
    writeLongAgo("a.dwg", "two");
    writeLongAgo("b.txt", "two");
    commitAll("second");
    writeLongAgo("b.txt", "one");
    EXPECT_EQ(tav({"checkout", "1"}).code, 0);
    EXPECT_EQ(known()["a.dwg"], digest("one"));
    EXPECT_EQ(known()["b.txt"], digest("one"));
    EXPECT_EQ(tav({"restore", "a.dwg", "--from", "2"}).code, 0);
    EXPECT_EQ(known()["a.dwg"], digest("two"));
    EXPECT_THAT(status(), HasSubstr("modified: a.dwg\n"));
}

TEST_F(VerifiedFiles, AreThoseThatAddHasReadAlsoWhenItFails)
{
    writeLongAgo("a.dwg", "one");
    commitAll("first");
    writeLongAgo("a.dwg", "one");
    EXPECT_EQ(known().count("a.dwg"), 0U);
    EXPECT_EQ(tav({"status"}).code, 0); // Time passes.
    EXPECT_EQ(tav({"add", "none.dwg"}).code, 1);
    EXPECT_EQ(known()["a.dwg"], digest("one"));
}

TEST_F(VerifiedFiles, AreComparedWithTheCommitThatTheFolderStandsOn)
{
    writeLongAgo("a.dwg", "one");
    commitAll("first");
    std::string const older = repo.read(".tav/tav.db");
    writeLongAgo("a.dwg", "two");
    commitAll("second");
    tav::VerifiedFileList const known = tav::LocalDatabase::open(repo.root()).verifiedFiles();
    repo.write(".tav/tav.db", older); // An older copy is put back.
    tav::LocalDatabase::openForChanges(repo.root()).addVerified(known);
    EXPECT_THAT(status(), HasSubstr("modified: a.dwg\n"));
    EXPECT_EQ(values({"diff"}, "path"), std::vector<std::string>{"a.dwg"});
}

} // namespace
} // namespace host_tests
