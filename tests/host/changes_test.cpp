#include "host/changes/changes.h"
#include "host/failure.h"

#include "tests/support/temp_repository.h"
#include "tests/support/utf8.h"

#include <gmock/gmock.h>

#include <string>
#include <unistd.h>

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class Compare : public testing::Test {
protected:
    /// Writes a file as it stands in the commit.
    void commit(std::string const& name)
    {
        std::string const content = "committed " + name;
        repo.write(name, content);
        committed_[support::fromUtf8(name)] = L"po:" + generateSha(content.data(), static_cast<int>(content.size()));
    }

    void index(std::string const& name, bool modified)
    {
        state_.index[support::fromUtf8(name)] = {common::modifyTime(support::fromUtf8(name), repo.root()), modified};
    }

    common::RepoChanges compare() const
    {
        return tav::compare(repo.root(), tav::matchFolder(repo.root(), committedFiles()), state_);
    }

    tav::FileList committedFiles() const
    {
        tav::FileList files;
        for (auto const& [path, url] : committed_) {
            files.push_back({path, url.ansi_str()});
        }
        return files;
    }

    static std::vector<std::string> unchanged(common::RepoChanges const& changes)
    {
        std::vector<std::string> names;
        for (auto const& file : changes.unchanged) {
            names.push_back(file.path.ansi_str());
        }
        return names;
    }

    static std::vector<std::string> modified(common::RepoChanges const& changes)
    {
        std::vector<std::string> names;
        for (auto const& file : changes.modified) {
            EXPECT_EQ(file.working.path, file.committed.path);
            names.push_back(file.working.path.ansi_str());
        }
        return names;
    }

    static std::vector<std::string> untracked(common::RepoChanges const& changes)
    {
        std::vector<std::string> names;
        for (auto const& file : changes.untracked) {
            names.push_back(file.working.path.ansi_str());
        }
        return names;
    }

    static std::vector<std::string> removed(common::RepoChanges const& changes)
    {
        std::vector<std::string> names;
        for (auto const& file : changes.removed) {
            names.push_back(file.committed.path.ansi_str());
        }
        return names;
    }

    support::TempRepository const repo;
    tav::Tree committed_;
    common::State state_;
};

TEST_F(Compare, FindsNothingInAnEmptyFolder)
{
    common::RepoChanges const changes = compare();
    EXPECT_THAT(unchanged(changes), IsEmpty());
    EXPECT_THAT(modified(changes), IsEmpty());
    EXPECT_THAT(untracked(changes), IsEmpty());
    EXPECT_THAT(removed(changes), IsEmpty());
}

TEST_F(Compare, SortsEveryFileIntoOneList)
{
    commit("same.dwg");
    commit("changed.dwg");
    repo.write("changed.dwg", "other");
    commit("gone.dwg");
    unlink(repo.pathTo("gone.dwg").c_str());
    repo.add({"new.dwg"});
    common::RepoChanges const changes = compare();
    EXPECT_THAT(unchanged(changes), ElementsAre("same.dwg"));
    EXPECT_THAT(modified(changes), ElementsAre("changed.dwg"));
    EXPECT_THAT(untracked(changes), ElementsAre("new.dwg"));
    EXPECT_THAT(removed(changes), ElementsAre("gone.dwg"));
}

TEST_F(Compare, ListsFilesInTheOrderOfPaths)
{
    for (char const* const name : {"b/z.dwg", "y.dwg", "a/x.dwg"}) {
        commit(name);
        repo.write(name, "other");
        committed_[support::fromUtf8("gone/" + std::string(name))] = L"po:";
    }
    repo.add({"b/new.dwg", "new.dwg"});
    common::RepoChanges const changes = compare();
    EXPECT_THAT(modified(changes), ElementsAre("a/x.dwg", "b/z.dwg", "y.dwg"));
    EXPECT_THAT(untracked(changes), ElementsAre("b/new.dwg", "new.dwg"));
    EXPECT_THAT(removed(changes), ElementsAre("gone/a/x.dwg", "gone/b/z.dwg", "gone/y.dwg"));
}

TEST_F(Compare, KeepsTrackOfACommittedFileThatIsIgnoredOrHiddenByNow)
{
    commit("a.old");
    commit(".hidden.dwg");
    commit("changed.old");
    repo.write("changed.old", "changed");
    repo.ignore("^.*\\.old$\n^ignore$");
    common::RepoChanges const changes = compare();
    EXPECT_THAT(unchanged(changes), ElementsAre(".hidden.dwg", "a.old"));
    EXPECT_THAT(modified(changes), ElementsAre("changed.old"));
    EXPECT_THAT(removed(changes), IsEmpty());
}

TEST_F(Compare, TakesAFileForRemovedThatAFolderHasReplaced)
{
    commit("a.dwg");
    ASSERT_EQ(unlink(repo.pathTo("a.dwg").c_str()), 0);
    repo.makeFolder("a.dwg");
    EXPECT_THAT(removed(compare()), ElementsAre("a.dwg"));
}

TEST_F(Compare, AsksForTheTimesOfAllOfManyFiles)
{
    std::vector<std::string> names;
    for (int i = 1'000; i < 2'200; ++i) {
        names.push_back(std::to_string(i) + ".dwg");
        repo.write(names.back(), "not as committed");
        committed_[support::fromUtf8(names.back())] = L"po:";
        index(names.back(), i == 1'500 || i == 2'199);
    }
    common::RepoChanges const changes = compare();
    EXPECT_THAT(modified(changes), ElementsAre("1500.dwg", "2199.dwg"));
    EXPECT_EQ(unchanged(changes).size(), 1'198);
}

TEST_F(Compare, LeavesOutWhatTheIndexVouchesForOnRequest)
{
    for (char const* const name : {"a.dwg", "b.dwg", "c.dwg", "gone.dwg"}) {
        commit(name);
        index(name, std::string(name) == "b.dwg");
    }
    unlink(repo.pathTo("gone.dwg").c_str());
    tav::FolderMatch match = tav::matchFolder(repo.root(), committedFiles());
    tav::dropUntouched(match, state_);
    std::vector<std::string> left;
    for (tav::CommittedFile const& file : match.committed) {
        left.push_back(file.path.ansi_str());
    }
    EXPECT_THAT(left, ElementsAre("b.dwg", "gone.dwg"));
}

TEST_F(Compare, TrustsTheIndexForAFileOfUnchangedTime)
{
    commit("a.dwg");
    repo.write("a.dwg", "other");
    index("a.dwg", false);
    EXPECT_THAT(unchanged(compare()), ElementsAre("a.dwg"));
}

TEST_F(Compare, ReadsAFileOfAnotherTimeThanInTheIndex)
{
    commit("a.dwg");
    commit("b.dwg");
    index("a.dwg", false);
    index("b.dwg", false);
    repo.write("b.dwg", "other");
    --state_.index[L"a.dwg"].lastChecked;
    --state_.index[L"b.dwg"].lastChecked;
    EXPECT_THAT(unchanged(compare()), ElementsAre("a.dwg"));
    EXPECT_THAT(modified(compare()), ElementsAre("b.dwg"));
}

TEST_F(Compare, ReadsAFileThatIsMarkedInTheIndex)
{
    commit("a.dwg");
    commit("b.dwg");
    repo.write("b.dwg", "other");
    index("a.dwg", true);
    index("b.dwg", true);
    EXPECT_THAT(unchanged(compare()), ElementsAre("a.dwg"));
    EXPECT_THAT(modified(compare()), ElementsAre("b.dwg"));
}

TEST_F(Compare, AsksTheIndexOnlyAboutCommittedFiles)
{
    repo.add({"new.dwg"});
    index("new.dwg", false);
    EXPECT_THAT(untracked(compare()), ElementsAre("new.dwg"));
}

TEST_F(Compare, KnowsARevisionByTheDigestInItsUrl)
{
    commit("a.dwg");
    commit("b.dwg");
    commit("c.dwg");
    auto const revision = [&](OdString const& name) { return L"tf:plan-1#" + committed_[name].mid(3); };
    committed_[L"a.dwg"] = revision(L"a.dwg");
    committed_[L"b.dwg"] = revision(L"a.dwg");
    committed_[L"c.dwg"] = L"tf:c.dwg#1";
    EXPECT_THAT(unchanged(compare()), ElementsAre("a.dwg"));
    EXPECT_THAT(modified(compare()), ElementsAre("b.dwg", "c.dwg"));
}

TEST_F(Compare, ComparesNamesExactly)
{
    commit("a.dwg");
    auto node = committed_.extract(L"a.dwg");
    node.key() = L"A.dwg";
    committed_.insert(std::move(node));
    common::RepoChanges const changes = compare();
    EXPECT_THAT(untracked(changes), ElementsAre("a.dwg"));
    EXPECT_THAT(removed(changes), ElementsAre("A.dwg"));
}

TEST_F(Compare, FailsForRulesThatCannotBeUsed)
{
    repo.ignore("(");
    try {
        compare();
        FAIL() << "no failure";
    } catch (tav::Failure const& failure) {
        EXPECT_EQ(failure.what, "The ignore file has a rule that is no regular expression that can be used.");
        EXPECT_EQ(failure.next, "Mend '.tav/properties/ignore'.");
    }
}

TEST_F(Compare, ListsIgnoredFilesInTheOrderOfTheScan)
{
    repo.add({"b.bak", "a.bak", "c/d.bak", "c/e.dwg", "old/f.dwg", ".hidden.bak"});
    repo.ignore("^.*\\.bak$\n^old$");
    std::vector<std::string> names;
    for (OdString const& path : tav::ignoredFiles(repo.root())) {
        names.push_back(path.ansi_str());
    }
    EXPECT_THAT(names, ElementsAre("a.bak", "b.bak", "c/d.bak", "old/f.dwg"));
}

} // namespace
