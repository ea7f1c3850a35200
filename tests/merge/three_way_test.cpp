#include "host/merge/three_way.h"

#include <gmock/gmock.h>

#include <map>
#include <set>
#include <sstream>
#include <string>

namespace {

using tav::FileValue;
using tav::MergeConflict;
using tav::MergedFile;
using tav::MergeInput;

using Files = std::map<std::string, std::string>;   ///< contents by path
using Renames = std::map<std::string, std::string>; ///< the new path by the old one

OdString wide(std::string const& text)
{
    return OdString(text.c_str(), CP_UTF_8);
}

FileValue valueOf(std::string const& content)
{
    FileValue value;
    value.url = wide("url of " + content);
    value.digest[0] = static_cast<unsigned char>(content[0]);
    return value;
}

struct Sides {
    Files base;
    Files mine;
    Files theirs;
    Renames myRenames;
    Renames theirRenames;
};

MergeInput inputOf(Sides const& sides)
{
    MergeInput input;
    for (auto const& [files, value] :
         {std::pair(&sides.base, &tav::PathValues::base), std::pair(&sides.mine, &tav::PathValues::mine),
          std::pair(&sides.theirs, &tav::PathValues::theirs)}) {
        for (auto const& [path, content] : *files) {
            input.paths[wide(path)].*value = valueOf(content);
        }
    }
    for (auto const& [from, to] : sides.myRenames) {
        input.myRenames[wide(from)] = wide(to);
    }
    for (auto const& [from, to] : sides.theirRenames) {
        input.theirRenames[wide(from)] = wide(to);
    }
    Files const base = sides.base;
    input.isInBase = [base](OdString const& path) {
        std::string const name = path.ansi_str();
        auto const next = base.lower_bound(name);
        return next != base.end() && (next->first == name || next->first.rfind(name + '/', 0) == 0);
    };
    return input;
}

std::string pathOr(OdString const& path)
{
    return path.isEmpty() ? "-" : path.ansi_str();
}

std::string contentOf(FileValue const& value)
{
    return value ? std::string(1, static_cast<char>(value.digest[0])) : "none";
}

/// What the merge does, a line each: "mine theirs -> path content (conflict)".
std::string merged(Sides const& sides)
{
    std::ostringstream text;
    for (MergedFile const& file : tav::mergeThreeWays(inputOf(sides))) {
        text << pathOr(file.myPath) << ' ' << pathOr(file.theirPath) << " -> " << pathOr(file.path) << ' '
             << contentOf(file.result);
        if (file.conflict) {
            text << " (" << nameOf(*file.conflict) << ')';
        }
        text << '\n';
    }
    return text.str();
}

// One file, by what each side has.

struct OneFile {
    char const* name;
    char const* base;
    char const* mine;
    char const* theirs;
    char const* expected;
};

class MergeOfOneFile : public testing::TestWithParam<OneFile> {};

TEST_P(MergeOfOneFile, FollowsTheTable)
{
    Sides sides;
    auto const put = [](Files& files, std::string const& content) {
        if (!content.empty()) {
            files["a"] = content;
        }
    };
    put(sides.base, GetParam().base);
    put(sides.mine, GetParam().mine);
    put(sides.theirs, GetParam().theirs);
    EXPECT_EQ(merged(sides), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(
    Table, MergeOfOneFile,
    testing::Values(
        OneFile{"Unchanged", "A", "A", "A", ""}, OneFile{"TheirsChanged", "A", "A", "B", "a a -> a B\n"},
        OneFile{"MineChanged", "A", "B", "A", ""}, OneFile{"BothChangedAlike", "A", "B", "B", ""},
        OneFile{"BothChanged", "A", "B", "C", "a a -> a B (both changed)\n"},
        OneFile{"TheirsRemoved", "A", "A", "", "a - -> - none\n"}, OneFile{"MineRemoved", "A", "", "A", ""},
        OneFile{"BothRemoved", "A", "", "", ""},
        OneFile{"MineChangedTheirsRemoved", "A", "B", "", "a - -> a B (changed and removed)\n"},
        OneFile{"MineRemovedTheirsChanged", "A", "", "B", "- a -> - none (changed and removed)\n"},
        OneFile{"MineAdded", "", "B", "", ""}, OneFile{"TheirsAdded", "", "", "B", "- a -> a B\n"},
        OneFile{"BothAddedAlike", "", "B", "B", ""}, OneFile{"BothAdded", "", "B", "C", "a a -> a B (both added)\n"}),
    [](auto const& row) { return row.param.name; });

TEST(ThreeWayMerge, ComparesDigestsAndNotUrls)
{
    MergeInput input = inputOf({{{"a", "A"}}, {{"a", "B"}}, {{"a", "B"}}, {}, {}});
    input.paths[wide("a")].theirs.url = wide("another URL");
    EXPECT_TRUE(tav::mergeThreeWays(input).empty());
}

// Renames.

TEST(ThreeWayMerge, JoinsMyRenameAndTheirChange)
{
    EXPECT_EQ(merged({{{"a", "A"}}, {{"b", "A"}}, {{"a", "B"}}, {{"a", "b"}}, {}}), "b a -> b B\n");
}

TEST(ThreeWayMerge, JoinsTheirRenameAndMyChange)
{
    EXPECT_EQ(merged({{{"a", "A"}}, {{"a", "B"}}, {{"b", "A"}}, {}, {{"a", "b"}}}), "a b -> b B\n");
}

TEST(ThreeWayMerge, LeavesAFileThatBothRenamedAlike)
{
    EXPECT_EQ(merged({{{"a", "A"}}, {{"b", "A"}}, {{"b", "A"}}, {{"a", "b"}}, {{"a", "b"}}}), "");
}

TEST(ThreeWayMerge, LeavesMineWhereBothRenamedDifferently)
{
    EXPECT_EQ(
        merged({{{"a", "A"}}, {{"b", "A"}}, {{"c", "B"}}, {{"a", "b"}}, {{"a", "c"}}}), "b c -> b A (two names)\n");
}

TEST(ThreeWayMerge, LeavesMineWhereItIsWhenBothChangedAndTheirsRenamed)
{
    EXPECT_EQ(merged({{{"a", "A"}}, {{"a", "B"}}, {{"b", "C"}}, {}, {{"a", "b"}}}), "a b -> a B (both changed)\n");
}

TEST(ThreeWayMerge, TakesARenameForWorkThatARemovalWouldLose)
{
    EXPECT_EQ(merged({{{"a", "A"}}, {{"b", "A"}}, {}, {{"a", "b"}}, {}}), "b - -> b A (changed and removed)\n");
    EXPECT_EQ(merged({{{"a", "A"}}, {}, {{"b", "A"}}, {}, {{"a", "b"}}}), "- b -> - none (changed and removed)\n");
}

TEST(ThreeWayMerge, TellsANewFileFromTheOneThatHadItsNameBefore)
{
    EXPECT_EQ(merged({{{"a", "A"}}, {{"a", "N"}, {"b", "A"}}, {{"a", "B"}}, {{"a", "b"}}, {}}), "b a -> b B\n");
}

TEST(ThreeWayMerge, TellsAFileThatIsGoneFromTheOneThatTookItsName)
{
    EXPECT_EQ(
        merged({{{"a", "A"}, {"b", "B"}}, {{"a", "B"}}, {{"a", "C"}, {"b", "B"}}, {{"b", "a"}}, {}}),
        "- a -> - none (changed and removed)\n");
}

TEST(ThreeWayMerge, FollowsTwoFilesThatChangedNames)
{
    EXPECT_EQ(
        merged(
            {{{"a", "A"}, {"b", "B"}},
             {{"a", "A"}, {"b", "B"}},
             {{"a", "B"}, {"b", "A"}},
             {},
             {{"a", "b"}, {"b", "a"}}}),
        "a b -> b A\nb a -> a B\n");
}

// Several files at one name.

TEST(ThreeWayMerge, LeavesTheirFileWhereMineHasAnotherOne)
{
    EXPECT_EQ(
        merged({{{"b", "B"}}, {{"b", "B"}, {"c", "C"}}, {{"c", "B"}}, {}, {{"b", "c"}}}), "b c -> b B (two files)\n");
    EXPECT_EQ(
        merged(
            {{{"a", "A"}, {"b", "B"}}, {{"b", "B"}, {"c", "A"}}, {{"a", "A"}, {"c", "B"}}, {{"a", "c"}}, {{"b", "c"}}}),
        "b c -> b B (two files)\n");
}

TEST(ThreeWayMerge, HasNoPlaceForANewFileWhereMineRenamedOneTo)
{
    EXPECT_EQ(
        merged({{{"a", "A"}}, {{"c", "A"}}, {{"a", "A"}, {"c", "C"}}, {{"a", "c"}}, {}}),
        "- c -> - none (two files)\n");
}

TEST(ThreeWayMerge, SendsBackOneAfterTheOtherWhenTheFirstCannotMove)
{
    EXPECT_EQ(
        merged(
            {{{"a", "A"}, {"b", "B"}},
             {{"a", "A"}, {"b", "B"}, {"c", "C"}},
             {{"b", "A"}, {"c", "B"}, {"a", "N"}},
             {},
             {{"a", "b"}, {"b", "c"}}}),
        "a b -> a A (two files)\n- a -> - none (two files)\nb c -> b B (two files)\n");
}

TEST(ThreeWayMerge, TellsFilesFromFolders)
{
    EXPECT_EQ(merged({{}, {{"a/x", "A"}}, {{"a", "B"}}, {}, {}}), "- a -> - none (file and folder)\n");
    EXPECT_EQ(merged({{}, {{"a", "A"}}, {{"a/x/y", "B"}}, {}, {}}), "- a/x/y -> - none (file and folder)\n");
    EXPECT_EQ(
        merged({{{"a/x", "A"}}, {{"a/x", "B"}}, {{"a", "C"}}, {}, {}}),
        "- a -> - none (file and folder)\na/x - -> a/x B (changed and removed)\n");
    EXPECT_EQ(
        merged({{{"z", "Z"}}, {{"a", "A"}, {"z", "Z"}}, {{"a/z", "Z"}}, {}, {{"z", "a/z"}}}),
        "z a/z -> z Z (file and folder)\n");
}

TEST(ThreeWayMerge, LetsAFileTakeThePlaceOfAFolderThatTheirsEmptied)
{
    EXPECT_EQ(merged({{{"a/x", "A"}}, {{"a/x", "A"}}, {{"a", "C"}}, {}, {}}), "- a -> a C\na/x - -> - none\n");
}

// Names that differ only in letter case or Unicode form.

TEST(ThreeWayMerge, TellsNewNamesThatDifferOnlyInLetterCaseOrForm)
{
    EXPECT_EQ(merged({{}, {{"Plan", "A"}}, {{"plan", "A"}}, {}, {}}), "- plan -> - none (names that collide)\n");
    EXPECT_EQ(
        merged({{}, {{"Stra\u00DFe \u00E4", "A"}}, {{"stra\u00DFe a\u0308", "B"}}, {}, {}}),
        "- stra\u00DFe a\u0308 -> - none (names that collide)\n");
    EXPECT_EQ(merged({{}, {{"Haus/a", "A"}}, {{"haus/b", "B"}}, {}, {}}), "- haus/b -> - none (names that collide)\n");
    EXPECT_EQ(
        merged({{{"x", "X"}}, {{"Neu", "X"}}, {{"x", "X"}, {"NEU", "N"}}, {{"x", "Neu"}}, {}}),
        "- NEU -> - none (names that collide)\n");
}

TEST(ThreeWayMerge, LeavesWhatHasCollidedBefore)
{
    EXPECT_EQ(
        merged({{{"haus/x", "X"}}, {{"haus/x", "X"}, {"Haus/a", "A"}}, {{"haus/x", "X"}, {"haus/b", "B"}}, {}, {}}),
        "- haus/b -> haus/b B\n");
    EXPECT_EQ(merged({{{"Plan", "A"}}, {{"Plan", "A"}}, {{"Plan", "A"}, {"plan", "B"}}, {}, {}}), "- plan -> plan B\n");
}

// The whole matrix of two paths, with a rename on either side: nothing that somebody made is ever left out in silence.

bool isTree(Files const& files)
{
    return files.count("a") == 0 || files.count("a/x") == 0;
}

std::vector<Files> allTrees()
{
    std::vector<Files> trees;
    for (std::string const a : {"", "A", "B", "C"}) {
        for (std::string const inside : {"", "A", "D"}) {
            for (std::string const b : {"", "A", "B", "E"}) {
                Files files;
                for (auto const& [path, content] : {std::pair("a", a), std::pair("a/x", inside), std::pair("b", b)}) {
                    if (!content.empty()) {
                        files[path] = content;
                    }
                }
                if (isTree(files)) {
                    trees.push_back(files);
                }
            }
        }
    }
    return trees;
}

std::vector<Renames> allRenames(Files const& base, Files const& side)
{
    std::vector<Renames> all{{}};
    for (auto const& [from, unused] : base) {
        for (auto const& [to, unused2] : side) {
            if (from != to) {
                all.push_back({{from, to}});
            }
        }
    }
    return all;
}

/// The result of the merge as a folder.
Files resultOf(Sides const& sides, std::vector<MergedFile> const& files)
{
    Files result = sides.mine;
    for (MergedFile const& file : files) {
        result.erase(file.myPath.ansi_str());
    }
    for (MergedFile const& file : files) {
        if (!file.path.isEmpty()) {
            EXPECT_TRUE(result.emplace(file.path.ansi_str(), contentOf(file.result)).second) << merged(sides);
        }
    }
    return result;
}

std::multiset<std::string> contentsOf(Files const& files)
{
    std::multiset<std::string> contents;
    for (auto const& [path, content] : files) {
        contents.insert(content);
    }
    return contents;
}

/// Each content that one side has made and base has not is in the result, or a conflict says where it is.
void expectNothingLost(Sides const& sides)
{
    std::vector<MergedFile> const files = tav::mergeThreeWays(inputOf(sides));
    Files const result = resultOf(sides, files);
    EXPECT_TRUE(isTree(result)) << merged(sides);
    std::multiset<std::string> kept = contentsOf(result);
    for (MergedFile const& file : files) {
        if (file.conflict) {
            kept.insert(contentOf(file.values.theirs));
        }
    }
    std::multiset<std::string> const before = contentsOf(sides.base);
    for (Files const* side : {&sides.mine, &sides.theirs}) {
        for (std::string const& content : contentsOf(*side)) {
            EXPECT_TRUE(before.count(content) > 0 || kept.count(content) > 0) << content << '\n' << merged(sides);
        }
    }
}

TEST(ThreeWayMerge, LosesNothingInTheWholeMatrix)
{
    std::vector<Files> const trees = allTrees();
    for (Files const& base : trees) {
        for (Files const& mine : trees) {
            for (Files const& theirs : trees) {
                for (Renames const& my : allRenames(base, mine)) {
                    for (Renames const& their : allRenames(base, theirs)) {
                        expectNothingLost({base, mine, theirs, my, their});
                    }
                }
                if (HasFailure()) {
                    return;
                }
            }
        }
    }
}

TEST(ThreeWayMerge, GivesTheirsWhereMineIsAsBase)
{
    for (Files const& base : allTrees()) {
        for (Files const& theirs : allTrees()) {
            for (Renames const& their : allRenames(base, theirs)) {
                Sides const sides{base, base, theirs, {}, their};
                EXPECT_EQ(resultOf(sides, tav::mergeThreeWays(inputOf(sides))), theirs) << merged(sides);
            }
        }
    }
}

TEST(ThreeWayMerge, ChangesNothingWhereTheirsIsAsBase)
{
    for (Files const& base : allTrees()) {
        for (Files const& mine : allTrees()) {
            for (Renames const& my : allRenames(base, mine)) {
                EXPECT_EQ(merged({base, mine, base, my, {}}), "");
            }
        }
    }
}

} // namespace
