#include "host/changes/changes.h"
#include "host/errors/failure.h"
#include "host/storage/storage_url.h"

#include "tests/support/temp_repository.h"
#include "tests/support/utf8.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <cstdio>
#include <string>
#include <sys/stat.h>
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

    /// Records that the file, as it is now, has the content of the commit.
    void know(std::string const& name)
    {
        auto const file = committed_.find(support::fromUtf8(name));
        std::string const url = file == committed_.end() ? std::string() : file->second.ansi_str();
        known_.push_back(
            {name, tav::digestOf(std::string_view(url)).value_or(tav::Digest{}),
             *tav::FolderView(repo.root()).look(support::fromUtf8(name)).stamp});
    }

    tav::FolderChanges compare() const
    {
        return tav::compare(repo.root(), tav::matchFolder(repo.root(), committedFiles(), known_));
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
    tav::VerifiedFileList known_;
};

TEST_F(Compare, FindsNothingInAnEmptyFolder)
{
    tav::FolderChanges const changes = compare();
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
    tav::FolderChanges const changes = compare();
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
    tav::FolderChanges const changes = compare();
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
    tav::FolderChanges const changes = compare();
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

TEST_F(Compare, LooksAtEachOfManyFiles)
{
    std::vector<std::string> names;
    for (int i = 1'000; i < 2'200; ++i) {
        names.push_back(std::to_string(i) + ".dwg");
        repo.write(names.back(), "not as committed");
        committed_[support::fromUtf8(names.back())] = OdString(L"po:") + OdString(std::wstring(64, L'0').c_str());
        if (i != 1'500 && i != 2'199) {
            know(names.back());
        }
    }
    tav::FolderChanges const changes = compare();
    EXPECT_THAT(modified(changes), ElementsAre("1500.dwg", "2199.dwg"));
    EXPECT_EQ(unchanged(changes).size(), 1'198);
}

TEST_F(Compare, LeavesOutWhatIsKnownToBeUnchangedOnRequest)
{
    for (char const* const name : {"a.dwg", "b.dwg", "c.dwg", "gone.dwg"}) {
        commit(name);
        if (std::string(name) != "b.dwg") {
            know(name);
        }
    }
    unlink(repo.pathTo("gone.dwg").c_str());
    tav::FolderMatch match = tav::matchFolder(repo.root(), committedFiles(), known_);
    tav::dropKnown(match);
    std::vector<std::string> left;
    for (tav::CommittedFile const& file : match.committed) {
        left.push_back(file.path.ansi_str());
    }
    EXPECT_THAT(left, ElementsAre("b.dwg", "gone.dwg"));
}

TEST_F(Compare, DoesNotReadAFileThatIsKnown)
{
    commit("a.dwg");
    repo.write("a.dwg", "other");
    know("a.dwg");
    EXPECT_THAT(unchanged(compare()), ElementsAre("a.dwg"));
}

TEST_F(Compare, FindsWhatIsKnownAlsoOfNamesThatAreNoText)
{
    for (char const* const name : {"a.dwg", "\xFF.dwg", "\xF0\x9F\x8F\xA0.dwg", "\xC3\xA9.dwg"}) {
        commit(name);
        repo.write(name, "other");
        know(name);
    }
    std::sort(known_.begin(), known_.end(), [](auto const& a, auto const& b) { return a.path < b.path; });
    EXPECT_THAT(modified(compare()), IsEmpty());
}

TEST_F(Compare, ReadsAFileThatIsKnownToHaveAnotherContentThanTheCommit)
{
    commit("a.dwg");
    know("a.dwg");
    repo.write("b.dwg", "committed a.dwg");
    committed_[L"b.dwg"] = committed_[L"a.dwg"];
    know("b.dwg");
    known_[1].digest.fill(0xaa);
    repo.write("c.dwg", "other");
    committed_[L"c.dwg"] = committed_[L"a.dwg"];
    know("c.dwg");
    known_[2].digest.fill(0xaa);
    EXPECT_THAT(unchanged(compare()), ElementsAre("a.dwg", "b.dwg"));
    EXPECT_THAT(modified(compare()), ElementsAre("c.dwg"));
}

struct StampRow {
    char const* name;
    void (*change)(tav::FileStamp& stamp);
};

class CompareStamps
    : public Compare
    , public testing::WithParamInterface<StampRow> {};

TEST_P(CompareStamps, ReadsAFileThatHasAnother)
{
    commit("a.dwg");
    commit("b.dwg");
    repo.write("b.dwg", "other");
    know("a.dwg");
    know("b.dwg");
    GetParam().change(known_[0].stamp);
    GetParam().change(known_[1].stamp);
    EXPECT_THAT(unchanged(compare()), ElementsAre("a.dwg"));
    EXPECT_THAT(modified(compare()), ElementsAre("b.dwg"));
}

INSTANTIATE_TEST_SUITE_P(
    Parts, CompareStamps,
    testing::Values(
        StampRow{"Size", [](tav::FileStamp& stamp) { ++stamp.size; }},
        StampRow{"Inode", [](tav::FileStamp& stamp) { ++stamp.inode; }},
        StampRow{"TimeOfChange", [](tav::FileStamp& stamp) { --stamp.changed; }},
        StampRow{"TimeOfModification", [](tav::FileStamp& stamp) { --stamp.modified; }}),
    [](auto const& row) { return std::string(row.param.name); });

TEST_F(Compare, SaysWhatItHasReadAndFoundUnchanged)
{
    for (char const* const name : {"known.dwg", "other.dwg", "read.dwg"}) {
        commit(name);
    }
    know("known.dwg");
    repo.write("other.dwg", "other");
    tav::VerifiedFileList verified;
    tav::compare(repo.root(), tav::matchFolder(repo.root(), committedFiles(), known_), &verified);
    ASSERT_EQ(verified.size(), 1U);
    EXPECT_EQ(verified[0].path, "read.dwg");
    EXPECT_EQ(L"po:" + support::fromUtf8(tav::hexOf(verified[0].digest)), committed_[L"read.dwg"]);
    EXPECT_EQ(verified[0].stamp, *tav::FolderView(repo.root()).look(L"read.dwg").stamp);
}

TEST_F(Compare, KnowsNothingOfAFileThatWasReplacedAfterItWasLookedAt)
{
    commit("a.dwg");
    tav::FolderMatch match = tav::matchFolder(repo.root(), committedFiles(), known_);
    match.committed[0].sight.stamp->inode += 1;
    tav::VerifiedFileList verified;
    EXPECT_THAT(unchanged(tav::compare(repo.root(), match, &verified)), ElementsAre("a.dwg"));
    EXPECT_THAT(verified, IsEmpty());
}

TEST_F(Compare, TakesAFileThatCannotBeReadForModified)
{
    committed_[L"a.dwg"] = L"po:" + generateSha("", 0);
    ASSERT_EQ(mkfifo(repo.pathTo("a.dwg").c_str(), 0600), 0);
    EXPECT_THAT(modified(compare()), ElementsAre("a.dwg"));
}

TEST_F(Compare, FollowsALinkToAFileAndNoticesWhatItLeadsTo)
{
    commit("a.dwg");
    repo.write("elsewhere/plan.txt", "committed a.dwg");
    unlink(repo.pathTo("a.dwg").c_str());
    repo.makeLink("a.dwg", "elsewhere/plan.txt");
    EXPECT_THAT(unchanged(compare()), ElementsAre("a.dwg"));
    know("a.dwg");
    repo.write("elsewhere/plan.txt", "longer than what was committed");
    EXPECT_THAT(modified(compare()), ElementsAre("a.dwg"));
}

TEST_F(Compare, ReadsNothingBehindALinkToAFolder)
{
    commit("plans/a.dwg");
    commit("plans/deep/b.dwg");
    commit("plans-2/c.dwg");
    ASSERT_EQ(rename(repo.pathTo("plans").c_str(), repo.pathTo(".moved").c_str()), 0);
    repo.makeLink("plans", ".moved");
    tav::FolderChanges const changes = compare();
    EXPECT_THAT(unchanged(changes), ElementsAre("plans-2/c.dwg"));
    EXPECT_THAT(removed(changes), IsEmpty());
    EXPECT_THAT(untracked(changes), IsEmpty());
    ASSERT_EQ(changes.unreachable.size(), 2U);
    EXPECT_EQ(changes.unreachable[0].path, OdString(L"plans/a.dwg"));
    EXPECT_EQ(changes.unreachable[1].path, OdString(L"plans/deep/b.dwg"));
}

TEST_F(Compare, TakesNothingForRemovedBehindALinkThatLeadsNowhere)
{
    commit("plans/a.dwg");
    ASSERT_EQ(rename(repo.pathTo("plans").c_str(), repo.pathTo(".moved").c_str()), 0);
    repo.makeLink("plans", "/nowhere");
    tav::FolderChanges const changes = compare();
    EXPECT_THAT(removed(changes), IsEmpty());
    EXPECT_EQ(changes.unreachable.size(), 1U);
}

TEST_F(Compare, TakesFilesForRemovedWhenAFileHasReplacedTheirFolder)
{
    commit("plans/a.dwg");
    ASSERT_EQ(rename(repo.pathTo("plans").c_str(), repo.pathTo(".moved").c_str()), 0);
    repo.add({"plans"});
    EXPECT_THAT(removed(compare()), ElementsAre("plans/a.dwg"));
}

TEST_F(Compare, KnowsOnlyCommittedFiles)
{
    repo.add({"new.dwg"});
    know("new.dwg");
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
    tav::FolderChanges const changes = compare();
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
        EXPECT_EQ(failure.what, "The ignore file has a rule that is not a valid regular expression.");
        EXPECT_EQ(failure.next, "Correct '.tav/properties/ignore'.");
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
