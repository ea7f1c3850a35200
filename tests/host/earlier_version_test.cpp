// Repositories and servers that earlier versions of tav made, kept in tests/golden: each opens, is brought to the form
// of this version once, and gives every version back. Such a folder is added when a form changes, and never changed.
#include "host/database/sqlite.h"

#include "tests/host/tav_test.h"

#include "common/mu_common_versions.h"

#include <gmock/gmock.h>

#include <filesystem>
#include <fstream>
#include <map>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

/// Digest of each file by path.
using Digests = std::map<std::string, std::string>;

/// A folder in tests/golden: "repository" with its working files, "server", and in "versions" a line for each file of
/// each commit, with the commit's number, the file's digest and its path. A later form, named after the version of
/// 'tav.db', has only the files that it changed.
class EarlierVersion : public testing::TestWithParam<char const*> {
protected:
    EarlierVersion()
    {
        fs::copy(golden("version_1"), place_.path(), fs::copy_options::recursive);
        fs::copy(golden(GetParam()), place_.path(), fs::copy_options::recursive | fs::copy_options::overwrite_existing);
        tav::Database database(place_.pathTo("repository/.tav/tav.db"));
        tav::Statement row = database.prepare("UPDATE settings SET value = ? WHERE key = 'server'");
        row.with(place_.widePathTo("server")).run();
    }

    static std::string golden(std::string const& name) { return std::string(TAV_GOLDEN) + "/" + name; }

    Outcome tav(Arguments const& arguments) const
    {
        Setting setting;
        setting.folder = place_.pathTo("repository");
        return run(setting, arguments);
    }

    std::map<std::string, Digests> expectedVersions() const
    {
        std::map<std::string, Digests> versions;
        std::ifstream lines(golden("version_1") + "/versions");
        for (std::string commit, digest, path; lines >> commit >> digest && std::getline(lines >> std::ws, path);) {
            versions[commit][path] = digest;
        }
        return versions;
    }

    /// What `tav export` brings of a commit.
    Digests exported(std::string const& commit) const
    {
        std::string const folder = "export of " + commit;
        EXPECT_EQ(tav({"export", commit, place_.pathTo(folder)}).code, 0);
        Digests digests;
        for (fs::directory_entry const& entry : fs::recursive_directory_iterator(place_.pathTo(folder))) {
            std::string const path = fs::relative(entry.path(), place_.pathTo(folder)).string();
            if (entry.is_regular_file()) {
                std::string const content = place_.read(folder + "/" + path);
                digests[path] = generateSha(content.data(), static_cast<int>(content.size())).ansi_str();
            }
        }
        return digests;
    }

    support::TempFolder const place_;
};

TEST_P(EarlierVersion, GivesEveryVersionBack)
{
    EXPECT_THAT(tav({"status"}).out, testing::HasSubstr("modified: plan.dwg"));
    EXPECT_EQ(tav({"verify"}).code, 0);
    EXPECT_EQ(tav({"unstage", "--all"}).code, 0); // Completes the commit that was interrupted.
    for (auto const& [commit, digests] : expectedVersions()) {
        EXPECT_EQ(exported(commit), digests) << "commit " << commit;
    }
}

TEST_P(EarlierVersion, IsBroughtToThisFormOnce)
{
    ASSERT_EQ(tav({"unstage", "--all"}).code, 0);
    ASSERT_EQ(tav({"gc"}).code, 0); // Notes which commits it has gone through.
    std::string const local = place_.read("repository/.tav/tav.db");
    std::string const server = place_.read("server/server.db");
    EXPECT_EQ(tav({"status"}).code, 0);
    EXPECT_EQ(tav({"gc"}).code, 0);
    EXPECT_EQ(place_.read("repository/.tav/tav.db"), local);
    EXPECT_EQ(place_.read("server/server.db"), server);
}

TEST_P(EarlierVersion, GoesOn)
{
    EXPECT_EQ(
        tav({"branch"}), done("  annex  (commit 4)\n"
                              "* master  (commit 3)\n"));
    EXPECT_EQ(tav({"tag"}), done("  as built  (commit 1)\n"));
    place_.write("repository/plan.dwg", "drawn anew");
    EXPECT_EQ(tav({"add", "plan.dwg"}).code, 0);
    EXPECT_EQ(tav({"commit", "-m", "goes on", "--author", "ann@studio"}).code, 0);
    EXPECT_EQ(tav({"switch", "annex"}), done("Now on branch annex (5 files written, 1 removed).\n"));
    EXPECT_THAT(tav({"show", "2"}).out, testing::HasSubstr("renamed:  old/draft.dwg -> new/section.dwg"));
    EXPECT_EQ(tav({"gc"}), done("Removed 0 stored versions that no commit needs; 0 bytes freed.\n"));
    EXPECT_EQ(tav({"verify"}).code, 0);
    EXPECT_EQ(exported("6").at("plan.dwg"), generateSha("drawn anew", 10).ansi_str());
}

INSTANTIATE_TEST_SUITE_P(
    EarlierVersions, EarlierVersion, testing::Values("version_1", "version_2", "version_4"),
    [](auto const& row) { return std::string(row.param); });

} // namespace
} // namespace host_tests
