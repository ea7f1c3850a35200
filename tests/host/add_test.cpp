#include "tests/host/tav_test.h"
#include "tests/support/rows.h"

#include <gmock/gmock.h>

namespace host_tests {
namespace {

using testing::IsSupersetOf;

using Add = TavTest;

Outcome unknown(std::string const& name)
{
    return failed("tav: No changed file matches '" + name + "'. Run 'tav status --ignored' to see what there is.\n");
}

Outcome outside(std::string const& name, std::string const& root)
{
    return failed("tav: '" + name + "' is not located in the current repository. Name a file below '" + root + "'.\n");
}

TEST_F(Add, StagesAFile)
{
    repo.add({"a.dwg", "b.dwg"});
    EXPECT_EQ(tav({"add", "a.dwg"}), done("Staged 1 file.\n"));
    EXPECT_EQ(state(), stateWithAdded({"a.dwg"}));
}

TEST_F(Add, StagesFilesInTheOrderOfTheirNames)
{
    repo.add({"a.dwg", "b.dwg", "c.dwg"});
    EXPECT_EQ(tav({"add", "c.dwg", "a.dwg"}), done("Staged 2 files.\n"));
    EXPECT_EQ(tav({"add", "b.dwg"}), done("Staged 1 file.\n"));
    EXPECT_EQ(state(), stateWithAdded({"c.dwg", "a.dwg", "b.dwg"}));
}

TEST_F(Add, StagesAFileOnce)
{
    repo.add({"a.dwg"});
    EXPECT_EQ(tav({"add", "a.dwg", "./a.dwg", "a"}), done("Staged 1 file.\n"));
    EXPECT_EQ(tav({"add", "a.dwg"}), done("Nothing new to stage.\n"));
    EXPECT_EQ(state(), stateWithAdded({"a.dwg"}));
}

TEST_F(Add, KeepsWhatElseTheStateHolds)
{
    repo.add({"a.dwg"});
    repo.write(".tav/tav.state", R"({
        "head" : { "reference" : "north" },
        "index" : [ { "data" : { "last_checked" : 7, "modified" : true }, "path" : "x" } ],
        "renames" : [ { "new" : "y", "previous" : "z" } ]
    })");
    EXPECT_EQ(tav({"add", "a.dwg"}), done("Staged 1 file.\n"));
    EXPECT_EQ(state(), R"({
    "head" : {
        "reference" : "north"
    },
    "index" : [
        {
            "data" : {
                "last_checked" : 7,
                "modified" : true
            },
            "path" : "x"
        }
    ],
    "renames" : [
        {
            "new" : "y",
            "previous" : "z"
        }
    ],
    "staged_files" : [
        {
            "file_change" : "added",
            "path" : "a.dwg"
        }
    ]
})");
}

TEST_F(Add, StagesEverything)
{
    repo.add({"b.dwg", "a/c.dwg", "x.bak", ".hidden"});
    repo.ignore("^.*\\.bak$");
    EXPECT_EQ(tav({"add", "--all"}), done("Staged 3 files.\n"));
    EXPECT_EQ(state(), stateWithAdded({".tav/properties/ignore", "a/c.dwg", "b.dwg"}));
    EXPECT_EQ(tav({"add", "--all"}), done("Nothing new to stage.\n"));
}

TEST_F(Add, StagesEverythingFromASubFolderToo)
{
    repo.add({"a/c.dwg", "b.dwg"});
    EXPECT_EQ(tavIn(repo.pathTo("a"), {"add", "--all"}), done("Staged 2 files.\n"));
}

TEST_F(Add, HasNothingToStageInAnEmptyFolder)
{
    EXPECT_EQ(tav({"add", "--all"}), done("Nothing new to stage.\n"));
    EXPECT_EQ(tav({"add", "."}), done("Nothing new to stage.\n"));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(Add, StagesWhatLiesInAFolder)
{
    repo.add({"plans/b.dwg", "plans/a/c.dwg", "plans.dwg", "plansX/d.dwg", "plans/x.bak"});
    EXPECT_EQ(tav({"add", "plans"}), done("Staged 2 files.\n"));
    EXPECT_EQ(state(), stateWithAdded({"plans/a/c.dwg", "plans/b.dwg"}));
}

struct PathRow {
    char const* name;
    char const* folder;
    Arguments names;
    std::vector<std::string> staged;
};

class AddPaths
    : public TavTest
    , public testing::WithParamInterface<PathRow> {};

TEST_P(AddPaths, AreTakenFromTheCurrentFolder)
{
    repo.add({"a.dwg", "plans/a.dwg", "plans/b.dwg", "plans/north/a.dwg"});
    Arguments arguments = {"add"};
    arguments.insert(arguments.end(), GetParam().names.begin(), GetParam().names.end());
    EXPECT_EQ(tavIn(repo.pathTo(GetParam().folder), arguments).err, "");
    std::string expected;
    for (std::string const& path : GetParam().staged) {
        expected += "        new:      " + path + "\n";
    }
    std::string const status = tav({"status"}).out;
    std::size_t const start = status.find("take a file out)\n") + 17;
    EXPECT_EQ(status.substr(start, status.find("\n\n", start) + 1 - start), expected);
}

INSTANTIATE_TEST_SUITE_P(
    Folders, AddPaths,
    testing::Values(
        PathRow{"Here", ".", {"a.dwg"}, {"a.dwg"}}, PathRow{"InSubFolder", "plans", {"a.dwg"}, {"plans/a.dwg"}},
        PathRow{"Above", "plans", {"../a.dwg"}, {"a.dwg"}},
        PathRow{"TwiceAbove", "plans/north", {"../../a.dwg"}, {"a.dwg"}},
        PathRow{"Beside", "plans/north", {"../b.dwg"}, {"plans/b.dwg"}},
        PathRow{"WithDots", ".", {"./plans/.././plans/north/a.dwg"}, {"plans/north/a.dwg"}},
        PathRow{"ThroughAFolderThatIsNot", ".", {"nowhere/../a.dwg"}, {"a.dwg"}},
        PathRow{"DoubledSlashes", ".", {"plans//north///a.dwg"}, {"plans/north/a.dwg"}},
        PathRow{"CurrentFolder", "plans", {"."}, {"plans/a.dwg", "plans/b.dwg", "plans/north/a.dwg"}},
        PathRow{"WorkingFolder", ".", {"."}, {"a.dwg", "plans/a.dwg", "plans/b.dwg", "plans/north/a.dwg"}},
        PathRow{
            "WorkingFolderFromInside",
            "plans/north",
            {"../.."},
            {"a.dwg", "plans/a.dwg", "plans/b.dwg", "plans/north/a.dwg"}},
        PathRow{"FolderWithSlash", ".", {"plans/north/"}, {"plans/north/a.dwg"}},
        PathRow{"FolderAbove", "plans/north", {".."}, {"plans/a.dwg", "plans/b.dwg", "plans/north/a.dwg"}},
        PathRow{"Several", "plans", {"north", "../a.dwg"}, {"a.dwg", "plans/north/a.dwg"}},
        PathRow{"PartOfAPathElsewhere", "plans/north", {"plans/b"}, {"plans/b.dwg"}}),
    support::rowName);

TEST_F(Add, TakesAbsolutePaths)
{
    repo.add({"a.dwg", "b/c.dwg"});
    EXPECT_EQ(tavIn(repo.pathTo("b"), {"add", repo.pathTo("a.dwg"), repo.path()}), done("Staged 2 files.\n"));
    EXPECT_EQ(state(), stateWithAdded({"a.dwg", "b/c.dwg"}));
}

TEST_F(Add, FailsForPathsOutsideOfTheRepository)
{
    repo.add({"a.dwg"});
    for (std::string const name : {"..", "../a.dwg", "/", "/etc/passwd", "a/../../a.dwg"}) {
        EXPECT_EQ(tav({"add", name}), outside(name, repo.path()));
    }
    EXPECT_EQ(tav({"add", repo.path() + "X/a.dwg"}), outside(repo.path() + "X/a.dwg", repo.path()));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(Add, FailsForAnEmptyName)
{
    repo.add({"a.dwg"});
    EXPECT_EQ(tav({"add", ""}), failed("tav: The name is empty. Type '.' for the folder that you are in.\n"));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(Add, FailsForNamesOfNoChangedFile)
{
    repo.add({"a.dwg", "x.bak", ".hidden", "empty/.keep"});
    for (std::string const name :
         {"nothing.dwg", "x.bak", ".hidden", "empty", ".tav/tav.state", "A.dwg", "a.dwg.dwg"}) {
        EXPECT_EQ(tav({"add", name}), unknown(name));
    }
    EXPECT_EQ(tav({"add", "no\n\x1b\xff"}), unknown("no \\x1B\\xFF"));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(Add, FindsTheOneFileThatPartOfAPathMatches)
{
    repo.add({"plans/ground floor.dwg", "plans/roof.dwg", "notes.txt"});
    EXPECT_EQ(tav({"add", "roof"}), done("Staged 1 file.\n"));
    EXPECT_EQ(tav({"add", "floor.dwg"}), done("Staged 1 file.\n"));
    EXPECT_EQ(tav({"add", "n[a-z]tes"}), done("Staged 1 file.\n"));
    EXPECT_EQ(state(), stateWithAdded({"plans/roof.dwg", "plans/ground floor.dwg", "notes.txt"}));
}

TEST_F(Add, ListsTheFilesThatAnAmbiguousNameMatches)
{
    repo.add({"drawings/plan.dwg", "drawings/floorplan.dwg", "roof.dwg", "plan.old.dwg", "plan"});
    EXPECT_EQ(tav({"add", "drawings/plan"}), done("Staged 1 file.\n"));
    EXPECT_EQ(
        tav({"add", "lan"}), failed("tav: More that one file found with name lan. Type more of the path of the one "
                                    "you mean:\n"
                                    "  drawings/floorplan.dwg\n"
                                    "  drawings/plan.dwg\n"
                                    "  plan.old.dwg\n"));
    EXPECT_EQ(state(), stateWithAdded({"drawings/plan.dwg"}));
}

TEST_F(Add, EscapesTheFilesThatAnAmbiguousNameMatches)
{
    repo.add({"a\t\xff/plan.dwg", "b\x1b[31m/plan.dwg"});
    EXPECT_EQ(
        tav({"add", "plan.dwg"}), failed("tav: More that one file found with name plan.dwg. Type more of the path of "
                                         "the one you mean:\n"
                                         "  a \\xFF/plan.dwg\n"
                                         "  b\\x1B[31m/plan.dwg\n"));
}

TEST_F(Add, PrefersTheFileOfExactlyThatPath)
{
    repo.add({"plan.dwg", "floorplan.dwg", "plan_dwg", "plans/plan.dwg"});
    EXPECT_EQ(tav({"add", "plan.dwg"}), done("Staged 1 file.\n"));
    EXPECT_EQ(state(), stateWithAdded({"plan.dwg"}));
}

TEST_F(Add, PrefersAFolderToPartOfAPath)
{
    repo.add({"plan/a.dwg", "floorplan.dwg"});
    EXPECT_EQ(tav({"add", "plan"}), done("Staged 1 file.\n"));
    EXPECT_EQ(state(), stateWithAdded({"plan/a.dwg"}));
}

TEST_F(Add, TakesNamesWithTheCharactersOfExpressionsAsTheyStand)
{
    repo.add({"a (1).dwg", "b[2].dwg", "c+.dwg", "(", "[", "*", "^f$", "{g/h.dwg"});
    EXPECT_EQ(tav({"add", "a (1).dwg", "b[2].dwg", "c+.dwg", "(", "[", "*", "^f$", "{g"}), done("Staged 8 files.\n"));
    EXPECT_EQ(state(), stateWithAdded({"a (1).dwg", "b[2].dwg", "c+.dwg", "(", "[", "*", "^f$", "{g/h.dwg"}));
}

TEST_F(Add, FailsForANameThatIsNeitherAFileNorAnExpression)
{
    repo.add({"a.dwg"});
    for (std::string const name : {"[", "a (1.dwg", "(a*)*b("}) {
        EXPECT_EQ(
            tav({"add", name}),
            failed(
                "tav: No file is named '" + name +
                "', and it is not a valid expression. Type the path of a file as 'tav status' shows it.\n"));
    }
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(Add, AnswersForAnExpressionThatCouldTakeForEver)
{
    repo.add({"aaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaaa"});
    EXPECT_EQ(tav({"add", "(a*)*b.c"}), unknown("(a*)*b.c"));
}

TEST_F(Add, StagesNamesOfEveryScriptAndOfNone)
{
    repo.add({"План.dwg", "図面.dwg", "\xf0\x9f\x8f\xa0.dwg", "\xff\xfe.dwg"});
    EXPECT_EQ(tav({"add", "План.dwg", "図面.dwg", "\xf0\x9f\x8f\xa0.dwg", "\xff\xfe.dwg"}), done("Staged 4 files.\n"));
    EXPECT_EQ(state(), stateWithAdded({"План.dwg", "図面.dwg", "\xf0\x9f\x8f\xa0.dwg", "\\uDCFF\\uDCFE.dwg"}));
    EXPECT_EQ(tav({"unstage", "\xff\xfe.dwg", "\xf0\x9f\x8f\xa0.dwg"}), done("Took 2 files out of the next commit.\n"));
}

TEST_F(Add, NamesAllFilesThatNoCommitCanKeep)
{
    std::string const noCharacter = "\xf0\x9f\xbf\xbe.dwg"; // Its code is set apart for ever.
    repo.add({"a.dwg", noCharacter, "b\n.dwg", "c\x1b.dwg"});
    std::string const refusal = "tav: No commit can keep these names. Nothing has been staged; rename the files, or "
                                "leave them out with 'tav ignore':\n";
    std::string const ofNoCharacter = "  The path '" + noCharacter + "' holds a character that cannot be recorded.\n";
    for (char const* const name : {"--all", "."}) {
        EXPECT_EQ(
            tav({"add", name}), failed(
                                    refusal +
                                    "  The path 'b\\x0A.dwg' holds a control character or a line end.\n"
                                    "  The path 'c\\x1B.dwg' holds a control character or a line end.\n" +
                                    ofNoCharacter));
    }
    EXPECT_EQ(tav({"add", "a.dwg", noCharacter}), failed(refusal + ofNoCharacter));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(Add, ChangesNothingWhenOneOfItsNamesIsBad)
{
    repo.add({"good.dwg", "better.dwg"});
    tav({"add", "better.dwg"});
    std::string const before = state();
    EXPECT_EQ(tav({"add", "good.dwg", "bad.dwg"}), unknown("bad.dwg"));
    EXPECT_EQ(state(), before);
    EXPECT_EQ(tav({"add", "good.dwg", "../bad.dwg"}), outside("../bad.dwg", repo.path()));
    EXPECT_EQ(state(), before);
}

TEST_F(Add, FollowsNoLinksToFolders)
{
    repo.add({"a/b.dwg"});
    repo.makeLink("link", "a");
    EXPECT_EQ(tav({"add", "link"}), unknown("link"));
    EXPECT_EQ(
        tav({"add", "link/b.dwg"}), failed("tav: 'link/b.dwg' is behind a link to a folder, which tav does not enter. "
                                           "Replace the link with the folder itself.\n"));
}

TEST_F(Add, CountsBothOfTwoCommandsAtTheSameTime)
{
    repo.add({"a.dwg", "b.dwg"});
    for (int round = 0; round < 10; ++round) {
        repo.write(".tav/tav.state", kFreshState);
        Process first(setting(), {"add", "a.dwg"});
        Process second(setting(), {"add", "b.dwg"});
        EXPECT_EQ(first.wait(), done("Staged 1 file.\n"));
        EXPECT_EQ(second.wait(), done("Staged 1 file.\n"));
        EXPECT_THAT(
            (std::vector<std::string>{stateWithAdded({"a.dwg", "b.dwg"}), stateWithAdded({"b.dwg", "a.dwg"})}),
            testing::Contains(state()));
    }
}

using Unstage = TavTest;

TEST_F(Unstage, TakesFilesOutAndLeavesThemInTheFolder)
{
    repo.add({"a.dwg", "b.dwg", "c.dwg"});
    tav({"add", "c.dwg", "b.dwg", "a.dwg"});
    EXPECT_EQ(tav({"unstage", "b.dwg"}), done("Took 1 file out of the next commit.\n"));
    EXPECT_EQ(state(), stateWithAdded({"c.dwg", "a.dwg"}));
    EXPECT_EQ(tav({"unstage", "a.dwg", "c.dwg"}), done("Took 2 files out of the next commit.\n"));
    EXPECT_EQ(state(), kFreshState);
    EXPECT_THAT(repo.list(), IsSupersetOf({"a.dwg", "b.dwg", "c.dwg"}));
}

TEST_F(Unstage, TakesFoldersPartsOfPathsAndEverything)
{
    repo.add({"plans/a.dwg", "plans/b.dwg", "roof.dwg", "notes.txt", "x.dwg"});
    tav({"add", "--all"});
    EXPECT_EQ(tavIn(repo.pathTo("plans"), {"unstage", "."}), done("Took 2 files out of the next commit.\n"));
    EXPECT_EQ(
        tav({"unstage", "roo"}),
        failed("tav: No staged file matches 'roo'. Run 'tav status' to see what is staged.\n"));
    EXPECT_EQ(tav({"unstage", "oof"}), done("Took 1 file out of the next commit.\n"));
    EXPECT_EQ(tav({"unstage", "--all"}), done("Took 2 files out of the next commit.\n"));
    EXPECT_EQ(tav({"unstage", "--all"}), done("Took 0 files out of the next commit.\n"));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(Unstage, TakesOutFilesThatAreGoneOrIgnoredByNow)
{
    repo.write(".tav/tav.state", stateWithAdded({"gone.dwg", "x.bak", "../outside.dwg"}));
    repo.add({"x.bak"});
    EXPECT_EQ(tav({"unstage", "gone.dwg", "x.bak"}), done("Took 2 files out of the next commit.\n"));
    EXPECT_EQ(tav({"unstage", "--all"}), done("Took 1 file out of the next commit.\n"));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(Unstage, TakesOutEveryEntryOfAPath)
{
    repo.write(".tav/tav.state", stateWithAdded({"a.dwg", "b.dwg", "a.dwg"}));
    EXPECT_EQ(tav({"unstage", "a.dwg"}), done("Took 2 files out of the next commit.\n"));
    EXPECT_EQ(state(), stateWithAdded({"b.dwg"}));
}

TEST_F(Unstage, ForgetsThatAFileWasRenamed)
{
    repo.add({"a.dwg"});
    tav({"mv", "a.dwg", "b.dwg"});
    EXPECT_EQ(tav({"unstage", "b.dwg"}), done("Took 1 file out of the next commit.\n"));
    EXPECT_EQ(state(), kFreshState);
}

TEST_F(Unstage, ListsTheFilesThatAnAmbiguousNameMatches)
{
    repo.write(".tav/tav.state", stateWithAdded({"plans/b.dwg", "plans/a/b.dwg", "c.dwg"}));
    EXPECT_EQ(
        tav({"unstage", "b"}), failed("tav: More that one file found with name b. Type more of the path of the one you "
                                      "mean:\n"
                                      "  plans/a/b.dwg\n"
                                      "  plans/b.dwg\n"));
}

TEST_F(Unstage, ChangesNothingWhenOneOfItsNamesIsBad)
{
    std::string const before = stateWithAdded({"a.dwg", "b.dwg"});
    repo.write(".tav/tav.state", before);
    repo.add({"c.dwg"});
    EXPECT_EQ(
        tav({"unstage", "a.dwg", "c.dwg"}),
        failed("tav: No staged file matches 'c.dwg'. Run 'tav status' to see what is staged.\n"));
    EXPECT_EQ(tav({"unstage", "a.dwg", "/x"}), outside("/x", repo.path()));
    EXPECT_EQ(
        tav({"unstage", "a.dwg", "("}), failed("tav: No file is named '(', and it is not a valid expression. "
                                               "Type the path of a file as 'tav status' "
                                               "shows it.\n"));
    EXPECT_EQ(
        tav({"unstage", "a.dwg", ""}), failed("tav: The name is empty. Type '.' for the folder that you are in.\n"));
    EXPECT_EQ(state(), before);
}

} // namespace
} // namespace host_tests
