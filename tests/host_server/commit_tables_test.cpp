#include "host/errors/failure.h"
#include "host/history/commit_tables.h"

#include "tests/host_server/server_test.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <random>
#include <sstream>

namespace {

using server::wideText;

OdString hashOf(char c)
{
    return wideText(std::string(64, c));
}

bool isSameFile(tav::ListedFile const& listed, tav::Tree::value_type const& file)
{
    return listed.path == file.first && wideText(listed.url) == file.second;
}

class CommitTablesTest : public testing::Test {
protected:
    CommitTablesTest() { tav::CommitTables::create(database); }

    /// Adds a commit behind `parents` whose files are `lines`, each as "path url" or "path url previous".
    void add(char hash, std::string const& parents, std::vector<std::string> const& lines)
    {
        tav::CommitRecord commit{tables.lastNumber() + 1, hashOf(hash), L"ann", L"message", 1709647629, {}};
        for (char const parent : parents) {
            commit.parents.push_back(hashOf(parent));
        }
        std::vector<tav::FileRecord> files;
        for (std::string const& line : lines) {
            std::istringstream words(line);
            std::string path, url, previous;
            words >> path >> url >> previous;
            files.push_back({wideText(path), wideText(url), wideText(previous)});
        }
        tav::WriteTransaction transaction(database);
        tables.add(commit, files);
        transaction.commit();
    }

    std::string files(char hash) const
    {
        std::string text;
        for (auto const& [path, url] : tables.files(hashOf(hash))) {
            text += path.ansi_str() + " " + url.ansi_str() + ";";
        }
        return text;
    }

    std::string changes(char hash) const
    {
        std::string text;
        for (tav::FileRecord const& file : tables.changes(hashOf(hash))) {
            text += file.path.ansi_str() + " " + file.url.ansi_str() + " " + file.previousPath.ansi_str() + ";";
        }
        return text;
    }

    static std::string inWords(std::vector<tav::CommitRecord> const& commits)
    {
        std::string text;
        for (tav::CommitRecord const& commit : commits) {
            text += std::to_string(commit.number) + static_cast<char>(commit.hash.getAt(0)) + "(";
            for (OdString const& parent : commit.parents) {
                text += static_cast<char>(parent.getAt(0));
            }
            text += ")";
        }
        return text;
    }

    support::TempFolder folder;
    tav::Database database{folder.pathTo("a.db")};
    tav::CommitTables tables{database, 1};
};

TEST_F(CommitTablesTest, BeginEmpty)
{
    EXPECT_EQ(tables.lastNumber(), 0);
    EXPECT_FALSE(tables.find(hashOf('a')));
    EXPECT_FALSE(tables.find(1));
    EXPECT_EQ(inWords(tables.after(0)), "");
    EXPECT_TRUE(tables.files(OdString()).empty());
    EXPECT_TRUE(tables.references().empty());
}

TEST_F(CommitTablesTest, PutTreesTogetherThroughChangesRemovalsAndRenames)
{
    add('a', "", {"plan 1", "notes 2", "old 3"});
    add('b', "a", {"plan 4", "notes 2", "new 3 old"});
    add('c', "b", {"new 3", "old 5"});
    EXPECT_EQ(files('a'), "notes 2;old 3;plan 1;");
    EXPECT_EQ(files('b'), "new 3;notes 2;plan 4;");
    EXPECT_EQ(files('c'), "new 3;old 5;");
    EXPECT_EQ(changes('a'), "notes 2 ;old 3 ;plan 1 ;");
    EXPECT_EQ(changes('b'), "new 3 old;old  ;plan 4 ;");
    EXPECT_EQ(changes('c'), "notes  ;old 5 ;plan  ;");
}

TEST_F(CommitTablesTest, KeepARenameOntoAPathThatWasThere)
{
    add('a', "", {"one 1", "two 2"});
    add('b', "a", {"two 1 one"});
    EXPECT_EQ(files('b'), "two 1;");
    EXPECT_EQ(changes('b'), "one  ;two 1 one;");
}

TEST_F(CommitTablesTest, PutTreesOfBranchesAndMergesTogether)
{
    add('a', "", {"plan 1", "notes 1"});
    add('b', "a", {"plan 2", "notes 1"});
    add('c', "a", {"plan 1", "notes 3", "more 3"});
    add('d', "bc", {"plan 2", "notes 3", "more 3"});
    add('e', "cb", {"plan 2", "notes 3"});
    EXPECT_EQ(files('b'), "notes 1;plan 2;");
    EXPECT_EQ(files('c'), "more 3;notes 3;plan 1;");
    EXPECT_EQ(files('d'), "more 3;notes 3;plan 2;");
    EXPECT_EQ(changes('d'), "more 3 ;notes 3 ;");
    EXPECT_EQ(files('e'), "notes 3;plan 2;");
    EXPECT_EQ(inWords({*tables.find(hashOf('d'))}), "4d(bc)");
    EXPECT_EQ(inWords({*tables.find(5)}), "5e(cb)");
}

TEST_F(CommitTablesTest, PutTreesTogetherAfterManyCommitsOfAllSizes)
{
    std::mt19937 random(7);
    // Some names are no UTF-8, and others have characters beyond those that stand for the bytes of such names.
    std::map<std::string, int> content;
    std::string before;
    for (int number = 1; number <= 60; ++number) {
        for (unsigned changed = 1U << random() % 8; changed > 0; --changed) {
            char const byte = static_cast<char>(0x80 + random() % 0x40);
            std::string const path = (random() % 2 == 0 ? "\xF0\x9F\x98" : "\xFF") + std::string(1, byte);
            if (random() % 3 == 0) {
                content.erase(path);
            } else {
                content[path] = number;
            }
        }
        std::vector<std::string> lines;
        std::map<OdString, OdString> expected;
        for (auto const& [path, url] : content) {
            lines.push_back(path + " " + std::to_string(url));
            expected.emplace(wideText(path), wideText(std::to_string(url)));
        }
        char const hash = static_cast<char>(number + '0');
        add(hash, before, lines);
        before = hash;
        EXPECT_EQ(tables.files(hashOf(hash)), expected) << number;
        tav::FileList const list = tables.fileList(hashOf(hash));
        EXPECT_TRUE(std::equal(list.begin(), list.end(), expected.begin(), expected.end(), isSameFile)) << number;
    }
}

TEST_F(CommitTablesTest, KnowWhichCommitsLieBefore)
{
    add('a', "", {});
    add('b', "a", {});
    add('c', "a", {});
    add('d', "bc", {});
    EXPECT_EQ(inWords(tables.history(hashOf('d'))), "4d(bc)3c(a)2b(a)1a()");
    EXPECT_EQ(inWords(tables.history(hashOf('c'))), "3c(a)1a()");
    EXPECT_EQ(inWords(tables.history(OdString())), "");
    EXPECT_EQ(inWords(tables.after(2)), "3c(a)4d(bc)");
    EXPECT_TRUE(tables.isBefore(hashOf('a'), hashOf('d')));
    EXPECT_TRUE(tables.isBefore(hashOf('c'), hashOf('d')));
    EXPECT_TRUE(tables.isBefore(hashOf('b'), hashOf('b')));
    EXPECT_FALSE(tables.isBefore(hashOf('b'), hashOf('c')));
    EXPECT_FALSE(tables.isBefore(hashOf('d'), hashOf('a')));
    EXPECT_FALSE(tables.isBefore(hashOf('0'), hashOf('a')));
    EXPECT_FALSE(tables.isBefore(hashOf('a'), hashOf('0')));
}

TEST_F(CommitTablesTest, FindCommitsByTheBeginningOfTheirHash)
{
    add('a', "", {});
    add('b', "a", {});
    EXPECT_EQ(inWords(tables.withPrefix(L"aaa")), "1a()");
    EXPECT_EQ(inWords(tables.withPrefix(L"")), "1a()2b(a)");
    EXPECT_EQ(inWords(tables.withPrefix(L"c")), "");
}

TEST_F(CommitTablesTest, ListEachUrlOnce)
{
    add('a', "", {"plan 1", "notes 2"});
    add('b', "a", {"plan 2"});
    EXPECT_EQ(tables.urls(), (std::vector<OdString>{L"1", L"2"}));
}

TEST_F(CommitTablesTest, MoveReferences)
{
    add('a', "", {});
    add('b', "a", {});
    tables.set({L"main", hashOf('a'), common::EType::branch});
    tables.set({L"first", hashOf('a'), common::EType::tag});
    tables.set({L"main", hashOf('b'), common::EType::branch});
    auto const references = tables.references();
    ASSERT_EQ(references.size(), 2u);
    EXPECT_EQ(references[0].name, L"first");
    EXPECT_EQ(references[0].type, common::EType::tag);
    EXPECT_EQ(references[1].commitHash, hashOf('b'));
    EXPECT_EQ(tables.reference(L"first")->commitHash, hashOf('a'));
    EXPECT_FALSE(tables.reference(L"nothing"));
}

TEST_F(CommitTablesTest, KeepRepositoriesApart)
{
    add('a', "", {"plan 1"});
    tav::CommitTables const other(database, 2);
    EXPECT_FALSE(other.find(hashOf('a')));
    EXPECT_EQ(other.lastNumber(), 0);
    EXPECT_TRUE(other.urls().empty());
}

TEST_F(CommitTablesTest, RefuseAParentThatIsNotThere)
{
    try {
        add('b', "a", {});
        FAIL();
    } catch (tav::Failure const& failure) {
        EXPECT_EQ(failure.what, "There is no commit '" + std::string(64, 'a') + "'.");
    }
    EXPECT_EQ(tables.lastNumber(), 0);
}

} // namespace
