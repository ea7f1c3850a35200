// Changes of large repositories. Nothing here looks at a clock: what takes quadratic time does not end in time.
#include "common/mu_common_diff.h"

#include "tests/support/sanitized.h"

#include <gmock/gmock.h>
#include <string>
#include <variant>

namespace {

using namespace common;

constexpr std::size_t kFiles = support::kIsSanitized ? 20'000 : 200'000;
/// Each is compared with an expression, which takes so long that even this many are too many to be compared twice each.
constexpr std::size_t kSearchedFiles = 5'000;

OdString pathOf(std::size_t number)
{
    std::string const path = "house-" + std::to_string(number % 2'000) + "/drawing-" + std::to_string(number) + ".dwg";
    return OdString(path.c_str(), CP_UTF_8);
}

/// The end of the path of one file alone.
OdString nameOf(std::size_t number)
{
    std::string const name = "/drawing-" + std::to_string(number);
    return OdString(name.c_str(), CP_UTF_8);
}

/// Half of the candidates modified, half new, and as many unchanged files.
RepoChanges largeChanges(std::size_t files = kFiles)
{
    RepoChanges changes;
    for (std::size_t i = 0; i < files; ++i) {
        changes.unchanged.push_back({pathOf(i), L""});
        if (i % 2 == 0) {
            changes.modified.push_back({nullptr, {pathOf(i)}, {pathOf(i), L""}, 0});
        } else {
            changes.untracked.push_back({nullptr, {pathOf(i)}, 0});
        }
    }
    return changes;
}

StagedFile candidate(std::size_t number)
{
    return {pathOf(number), number % 2 == 0 ? FileChange::modified : FileChange::added};
}

TEST(LargeChanges, AreStagedOneByOne)
{
    RepoFileExplorer explorer(largeChanges(), common::RootPath(L"/project"));
    for (std::size_t i = kFiles; i-- > 0;) {
        ASSERT_TRUE(explorer.hasFilesToStage());
        ASSERT_TRUE(explorer.stage(candidate(i)));
    }
    EXPECT_FALSE(explorer.hasFilesToStage());
    for (std::size_t i = 0; i < kFiles; ++i) {
        ASSERT_FALSE(explorer.stage(candidate(i)));
    }
    EXPECT_EQ(explorer.stagedFiles().value().size(), kFiles);
    EXPECT_EQ(explorer.stagedFiles().value().front().path(), pathOf(0));
    EXPECT_EQ(explorer.stagedFiles().value().back().path(), pathOf(kFiles - 1));
}

TEST(LargeChanges, OfEqualCandidatesAreAnsweredToo)
{
    RepoChanges changes;
    changes.untracked.assign(kFiles, {nullptr, {L"a.dwg"}, 0});
    RepoFileExplorer explorer(changes, common::RootPath(L"/project"));
    EXPECT_TRUE(explorer.stage({L"a.dwg", FileChange::added}));
    for (std::size_t i = 0; i < kFiles; ++i) {
        ASSERT_FALSE(explorer.stage({L"a.dwg", FileChange::added}));
    }
    EXPECT_TRUE(explorer.hasFilesToStage());
}

TEST(LargeChanges, AreSearchedByName)
{
    RepoFileExplorer const explorer(largeChanges(kSearchedFiles), common::RootPath(L"/project"));
    OdString const name = nameOf(kSearchedFiles - 1);
    auto const found = explorer.findForStaging(name);
    ASSERT_TRUE(std::holds_alternative<StagedFile>(found));
    EXPECT_EQ(std::get<StagedFile>(found), candidate(kSearchedFiles - 1));
    EXPECT_TRUE(std::holds_alternative<std::monostate>(explorer.findForStaging(nameOf(kSearchedFiles))));
    EXPECT_EQ(explorer.findUnchanged(name), pathOf(kSearchedFiles - 1));
    EXPECT_TRUE(explorer.findUnchanged(nameOf(kSearchedFiles)).isEmpty());
}

/// A name that a backtracking matcher would try in endlessly many ways.
TEST(LongPaths, AreAnsweredInTime)
{
    std::string const path = std::string(4'000, 'a') + ".dwg";
    RepoChanges changes;
    changes.unchanged = {{OdString(path.c_str(), CP_UTF_8), L""}};
    changes.untracked = {{nullptr, {OdString(path.c_str(), CP_UTF_8)}, 0}};
    RepoFileExplorer const explorer(changes, common::RootPath(L"/project"));
    EXPECT_TRUE(explorer.findUnchanged(L"(a*)*b").isEmpty());
    EXPECT_TRUE(std::holds_alternative<std::monostate>(explorer.findForStaging(L"(a|aa)*b")));
    EXPECT_FALSE(explorer.findUnchanged(L"(a*)*").isEmpty());
}

} // namespace
