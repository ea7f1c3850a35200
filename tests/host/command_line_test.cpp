#include "tests/host/tav_test.h"
#include "tests/support/rows.h"

namespace host_tests {
namespace {

using CommandLine = TavTest;

struct HelpRow {
    char const* name;
    Arguments arguments;
    char const* text;
};

constexpr char const* kMainHelp = R"(Keeps the versions of a folder of drawings.
Usage: tav [OPTIONS] COMMAND

Options:
  -h,--help                   Show this help and do nothing else
  --version                   Show the version and do nothing else
  -C FOLDER                   Work as if started in FOLDER
  --color WHEN                When to use colours: auto, always or never
  --no-pager                  Do not use a pager
  -q,--quiet                  Do not report what was done
  --yes                       Do not ask questions; take the default answer

Commands:
  init                        Make a folder of drawings a repository, or complete one
  status, st                  Show what has changed and what is staged
  add                         Stage changed and new files for the next commit
  unstage                     Take files out of the next commit; they stay as they are
  mv                          Rename a file or folder, and stage that
  rm                          Remove committed files, and stage that
  commit, ci                  Keep what is staged, removed and renamed as a new commit
  revert                      Make a commit that does the opposite of another one
  stash, shelve               Put unfinished work aside, and bring it back
  log                         Show the history, newest first
  show                        Show a commit and what it changed, or a file of it
  cat                         Print a file as a commit has it
  open                        Open a read-only copy of a file as a commit has it
  diff                        Show what is different from the last commit, or between commits
  preview                     Show the preview picture of a drawing
  compare                     Show two versions of a drawing as pictures, and what differs
  restore                     Bring files back as a commit has them
  checkout, co                Make the working folder what it was at a commit
  switch                      Continue on another branch
  undo                        Take back the last command that changed files, what is staged, or commits
  redo                        Do again what 'tav undo' has taken back
  branch                      List the branches, or create, rename or delete one
  tag                         List the tags, or create or delete one
  fetch                       Get the commits, branches and tags that the server has
  server                      Show where the history is kept, or name its new place
  files                       List the files that the repository keeps
  ignore                      Show, add or remove rules for names to ignore
  config                      Show or change settings
  projects                    List the repositories that you have made
  verify                      Read every stored version and check it against its digest
  gc                          Remove what no commit needs from the storage
  export                      Write the files of a commit into a folder of their own

)";

constexpr char const* kInitHelp = R"(Make a folder of drawings a repository, or complete one
Usage: tav init [OPTIONS] [FOLDER]

Arguments:
  FOLDER                      The folder of your drawings, by default this one; it is made when it is missing

Options:
  -h,--help                   Show this help and do nothing else
  --server FOLDER             Where the history is kept; by default 'tav/server' in your folder for data
  --nested                    Make a repository of its own inside of another one

)";

constexpr char const* kStatusHelp = R"(Show what has changed and what is staged
Usage: tav status [OPTIONS]

Options:
  -h,--help                   Show this help and do nothing else
  --ignored                   Show the files that the ignore rules keep out, too
  -s,--short                  Show two letters and the path of each file, as git does
  --json                      Print a document for programs

)";

constexpr char const* kAddHelp = R"(Stage changed and new files for the next commit
Usage: tav add [OPTIONS] [NAME...]

Arguments:
  NAME...                     Paths of files or folders, or the end of a path that only one changed file matches

Options:
  -h,--help                   Show this help and do nothing else
  --all                       Stage every changed and new file

)";

constexpr char const* kUnstageHelp = R"(Take files out of the next commit; they stay as they are
Usage: tav unstage [OPTIONS] [NAME...]

Arguments:
  NAME...                     Paths of files or folders, or the end of a path that only one staged file matches

Options:
  -h,--help                   Show this help and do nothing else
  --all                       Unstage all files

)";

constexpr char const* kMvHelp = R"(Rename a file or folder, and stage that
Usage: tav mv [OPTIONS] OLD NEW

Arguments:
  OLD                         Path of a file or folder of the repository
  NEW                         Its new path, or an existing folder to move it into

Options:
  -h,--help                   Show this help and do nothing else
  --dry-run                   Only show what would be renamed

)";

constexpr char const* kRmHelp = R"(Remove committed files, and stage that
Usage: tav rm [OPTIONS] NAME...

Arguments:
  NAME...                     Paths of files or folders, or the end of a path

Options:
  -h,--help                   Show this help and do nothing else
  --dry-run                   Only show what would be removed

)";

constexpr char const* kFilesHelp = R"(List the files that the repository keeps
Usage: tav files [OPTIONS] [FOLDER]

Arguments:
  FOLDER                      The folder of a repository; by default the one you are in

Options:
  -h,--help                   Show this help and do nothing else
  --hash                      Show the SHA-256 digest of each file, in the form of sha256sum
  --long                      Show the last commit of each file, its date and its author
  --at COMMIT                 List the files of a commit; --long does so with the current one
  --json                      Print a document for programs

Examples:
  tav files --long            who changed each file last, and when
  tav files --at master~10    the files of an earlier commit
)";

constexpr char const* kIgnoreHelp = R"(Show, add or remove rules for names to ignore
Usage: tav ignore [OPTIONS]

Options:
  -h,--help                   Show this help and do nothing else
  --add PATTERN               A wildcard like '*.plt', or a regular expression; files and folders whose whole name matches it are ignored
  --remove PATTERN            A rule, or the wildcard it is for
  --why NAME                  Say which rule makes a file or folder ignored
  --dry-run                   Only show what --add or --remove would do
  --json                      Print a document for programs

Examples:
  tav ignore --add '*.plt'         ignore all plot files
  tav ignore --why plans/roof.bak  say why a file is not listed
)";

class Help
    : public TavTest
    , public testing::WithParamInterface<HelpRow> {};

TEST_P(Help, TellsHowTheCommandIsUsedAndDoesNothingElse)
{
    EXPECT_EQ(tavIn("/", GetParam().arguments), done(GetParam().text));
}

INSTANTIATE_TEST_SUITE_P(
    Levels, Help,
    testing::Values(
        HelpRow{"Main", {"--help"}, kMainHelp}, HelpRow{"MainShort", {"-h"}, kMainHelp},
        HelpRow{"Init", {"init", "--help"}, kInitHelp}, HelpRow{"InitShort", {"init", "-h"}, kInitHelp},
        HelpRow{"HelpAlone", {"help"}, kMainHelp}, HelpRow{"HelpOfACommand", {"help", "init"}, kInitHelp},
        HelpRow{"HelpOfAnAlias", {"help", "st"}, kStatusHelp}, HelpRow{"BeforeTheCommand", {"-h", "init"}, kInitHelp},
        HelpRow{"BesideNames", {"add", "x", "--help"}, kAddHelp}, HelpRow{"Status", {"status", "--help"}, kStatusHelp},
        HelpRow{"Add", {"add", "--help"}, kAddHelp}, HelpRow{"Unstage", {"unstage", "--help"}, kUnstageHelp},
        HelpRow{"Mv", {"mv", "--help"}, kMvHelp}, HelpRow{"Rm", {"rm", "--help"}, kRmHelp},
        HelpRow{"Files", {"files", "--help"}, kFilesHelp}, HelpRow{"Ignore", {"ignore", "--help"}, kIgnoreHelp}),
    support::rowName);

struct MisuseRow {
    char const* name;
    Arguments arguments;
    char const* message;
};

class Misuse
    : public TavTest
    , public testing::WithParamInterface<MisuseRow> {};

TEST_P(Misuse, IsToldInOneLineAndChangesNothing)
{
    repo.add({"a.dwg"});
    std::vector<std::string> const before = repo.list();
    EXPECT_EQ(tav(GetParam().arguments), misused(GetParam().message));
    EXPECT_EQ(repo.list(), before);
    EXPECT_EQ(state(), kFreshState);
}

INSTANTIATE_TEST_SUITE_P(
    Cases, Misuse,
    testing::Values(
        MisuseRow{"NoCommand", {}, kMainHelp}, MisuseRow{"NoCommandInAFolder", {"-C", "."}, kMainHelp},
        MisuseRow{
            "UnknownCommand",
            {"statsu", "--json"},
            "tav: There is no command 'statsu'. Run 'tav --help' to see how it is used.\n"},
        MisuseRow{
            "HelpOfUnknownCommand",
            {"help", "statsu"},
            "tav: There is no command 'statsu'. Run 'tav --help' to see how it is used.\n"},
        MisuseRow{
            "UnknownCommandWithHelp",
            {"statsu", "--help"},
            "tav: There is no command 'statsu'. Run 'tav --help' to see how it is used.\n"},
        MisuseRow{
            "EmptyPathOfAnOption",
            {"restore", "--from", "1", "--to", "", "a.dwg"},
            "tav: --to: The path is empty. Run 'tav restore --help' to see how it is used.\n"},
        MisuseRow{
            "EmptyMessageFile",
            {"commit", "-F", ""},
            "tav: --file: The path is empty. Run 'tav commit --help' to see how it is used.\n"},
        MisuseRow{
            "UndoListOfNone",
            {"undo", "-n", "0", "--list"},
            "tav: --count: '0' is not a number, 1 or more. Run 'tav undo --help' to see how it is used.\n"},
        MisuseRow{
            "UnknownCommandInBrackets",
            {"[status]"},
            "tav: There is no command '[status]'. Run 'tav --help' to see how it is used.\n"},
        MisuseRow{
            "TwoCommands",
            {"status", "files"},
            "tav: The following argument was not expected: files. Run 'tav status --help' to see how it is used.\n"},
        MisuseRow{
            "UnknownOption",
            {"add", "a.dwg", "--frob"},
            "tav: The following argument was not expected: --frob. Run 'tav add --help' to see how it is used. Write "
            "'./--frob', or '--' before it, for a name that begins with '-'.\n"},
        MisuseRow{
            "NameWithDashForOneOfSeveral",
            {"add", "a.dwg", "-leading.dwg"},
            "tav: The following argument was not expected: -leading.dwg. Run 'tav add --help' to see how it is used. "
            "Write './-leading.dwg', or '--' before it, for a name that begins with '-'.\n"},
        MisuseRow{
            "OnlyANameWithDash",
            {"rm", "-leading.dwg"},
            "tav: NAME is required. Run 'tav rm --help' to see how it is used. Write './-leading.dwg', or '--' before "
            "it, for a name that begins with '-'.\n"},
        MisuseRow{
            "NameThatBeginsWithAKnownOption",
            {"rm", "-quay.dwg"},
            "tav: NAME is required. Run 'tav rm --help' to see how it is used. Write './-quay.dwg', or '--' before "
            "it, for a name that begins with '-'.\n"},
        MisuseRow{
            "UnknownOptionWithEscapes",
            {"add", "a.dwg", "--\x1b[31m\n\xff"},
            "tav: The following argument was not expected: --\\x1B[31m \\xFF. Run 'tav add --help' to see how it is "
            "used. Write './--\\x1B[31m \\xFF', or '--' before it, for a name that begins with '-'.\n"},
        MisuseRow{
            "SurplusNameInBrackets",
            {"init", "x", "[y]"},
            "tav: The following argument was not expected: [y]. Run 'tav init --help' to see how it is used.\n"},
        MisuseRow{
            "FolderMissingAfterC",
            {"-C"},
            "tav: -C: 1 required FOLDER missing. Run 'tav --help' to see how it is used.\n"},
        MisuseRow{
            "AddNothing", {"add"}, "tav: NAME or --all is required. Run 'tav add --help' to see how it is used.\n"},
        MisuseRow{
            "AddNamesAndAll",
            {"add", "a.dwg", "--all"},
            "tav: NAME excludes --all. Run 'tav add --help' to see how it is used.\n"},
        MisuseRow{
            "UnstageNothing",
            {"unstage"},
            "tav: NAME or --all is required. Run 'tav unstage --help' to see how it is used.\n"},
        MisuseRow{
            "UnstageNamesAndAll",
            {"unstage", "a.dwg", "--all"},
            "tav: NAME excludes --all. Run 'tav unstage --help' to see how it is used.\n"},
        MisuseRow{"MvOneName", {"mv", "a.dwg"}, "tav: NEW is required. Run 'tav mv --help' to see how it is used.\n"},
        MisuseRow{
            "MvThreeNames",
            {"mv", "a.dwg", "b.dwg", "c.dwg"},
            "tav: The following argument was not expected: c.dwg. Run 'tav mv --help' to see how it is used.\n"},
        MisuseRow{"RmNothing", {"rm"}, "tav: NAME is required. Run 'tav rm --help' to see how it is used.\n"},
        MisuseRow{
            "FilesTwoFolders",
            {"files", ".", "x"},
            "tav: The following argument was not expected: x. Run 'tav files --help' to see how it is used.\n"},
        MisuseRow{
            "StatusName",
            {"status", "a.dwg"},
            "tav: The following argument was not expected: a.dwg. Run 'tav status --help' to see how it is used.\n"},
        MisuseRow{
            "IgnoreAddWithoutRule",
            {"ignore", "--add"},
            "tav: --add: 1 required PATTERN missing. Run 'tav ignore --help' to see how it is used.\n"},
        MisuseRow{
            "IgnoreAddAsDocument",
            {"ignore", "--add", "x", "--json"},
            "tav: --add excludes --json. Run 'tav ignore --help' to see how it is used.\n"}),
    support::rowName);

TEST_F(CommandLine, WorksInTheFolderOfTheOptionC)
{
    repo.add({"a.dwg"});
    EXPECT_EQ(tavIn("/", {"-C", repo.path(), "files"}), done("a.dwg\n"));
}

TEST_F(CommandLine, TakesNamesAndFoldersFromTheFolderOfTheOptionC)
{
    repo.add({"plans/roof.dwg"});
    EXPECT_EQ(tav({"-C", "plans", "add", "roof.dwg"}), done("Staged 1 file.\n"));
    EXPECT_EQ(tav({"-C", "plans", "files", ".."}), done("plans/roof.dwg\n"));
}

TEST_F(CommandLine, GoesOnFromTheFolderOfAnEarlierOptionC)
{
    repo.makeFolder("a/b");
    EXPECT_EQ(
        tavIn("/", {"-C", repo.path(), "-C", "a", "-C", "b", "init", "--nested", "c"}),
        done("Made a repository in 'c'.\n"));
    EXPECT_TRUE(repo.has("a/b/c/.tav"));
}

TEST_F(CommandLine, FailsWhenTheFolderOfTheOptionCCannotBeEntered)
{
    EXPECT_EQ(
        tav({"-C", "no\nwhere", "status"}),
        failed("tav: The folder 'no where' cannot be entered. Check its name and your permissions for it.\n"));
    EXPECT_EQ(
        tav({"-C", "", "status"}),
        failed("tav: The folder '' cannot be entered. Check its name and your permissions for it.\n"));
}

TEST_F(CommandLine, TakesNamesThatReadLikeCommandsForNames)
{
    repo.add({"status", "add"});
    EXPECT_EQ(tav({"add", "status", "add"}), done("Staged 2 files.\n"));
    EXPECT_EQ(state(), stateWithAdded({"status", "add"}));
}

TEST_F(CommandLine, TakesNamesThatReadLikeOptionsBehindTwoDashes)
{
    repo.add({"--all", "-C"});
    EXPECT_EQ(tav({"add", "--", "--all"}), done("Staged 1 file.\n"));
    EXPECT_EQ(state(), stateWithAdded({"--all"}));
}

TEST_F(CommandLine, TakesNamesInBracketsWhole)
{
    repo.add({"[a,b]", "[old]/plan.dwg", "{}", "%%", "[]"});
    EXPECT_EQ(tav({"add", "[old]", "[a,b]", "{}", "%%", "[]"}), done("Staged 5 files.\n"));
    EXPECT_EQ(state(), stateWithAdded({"[old]/plan.dwg", "[a,b]", "{}", "%%", "[]"}));
    EXPECT_EQ(tav({"mv", "[a,b]", "[c]"}), done("Renamed '[a,b]' to '[c]'.\n"));
    EXPECT_EQ(tav({"unstage", "[c]", "[old]"}), done("Took 2 files out of the next commit.\n"));
    EXPECT_EQ(tav({"init", "--nested", "[d]"}), done("Made a repository in '[d]'.\n"));
    EXPECT_EQ(tav({"-C", "[d]", "files"}), done(".tav/properties/ignore\n"));
    EXPECT_EQ(tav({"files", "[d]"}), done(".tav/properties/ignore\n"));
}

TEST_F(CommandLine, TakesWordsBehindDashesForNames)
{
    repo.add({"a.dwg", "--all", "-b", "план.dwg"});
    EXPECT_EQ(tav({"add", "a.dwg", "--", "--all", "-b"}), done("Staged 3 files.\n"));
    EXPECT_EQ(tav({"unstage", "--", "--all"}), done("Took 1 file out of the next commit.\n"));
    EXPECT_EQ(
        tav({"add", "--", "--"}),
        failed("tav: No changed file matches '--'. Run 'tav status --ignored' to see what there is.\n"));
}

TEST_F(CommandLine, TakesNamesThatBeginWithAControlCharacterWhole)
{
    repo.add({"\x01", "\x01[a]"});
    EXPECT_EQ(
        tav({"add", "\x01", "\x01[a]"}),
        failed("tav: No commit can keep these names. Nothing has been staged; rename the files, or leave them out with "
               "'tav ignore':\n"
               "  The path '\\x01' holds a control character or a line end.\n"
               "  The path '\\x01[a]' holds a control character or a line end.\n"));
}

TEST_F(CommandLine, FailsOutsideOfARepository)
{
    support::TempFolder const elsewhere;
    std::string const message =
        "tav: Path: " + elsewhere.path() +
        " is not a tav directory. Run 'tav init' in the folder of your drawings to make it one.\n";
    for (Arguments const& arguments :
         {Arguments{"status"}, {"add", "a"}, {"unstage", "a"}, {"mv", "a", "b"}, {"rm", "a"}, {"files"}, {"ignore"}}) {
        EXPECT_EQ(tavIn(elsewhere.path(), arguments), failed(message)) << arguments.front();
    }
    EXPECT_TRUE(elsewhere.list().empty());
}

TEST_F(CommandLine, FindsTheRepositoryFromAnyFolderInIt)
{
    repo.add({"a/b/c.dwg"});
    EXPECT_EQ(tavIn(repo.pathTo("a/b"), {"files"}), done("a/b/c.dwg\n"));
    EXPECT_EQ(tavIn(repo.pathTo(".tav"), {"files"}), done("a/b/c.dwg\n"));
}

TEST_F(CommandLine, TakesTheInnermostRepository)
{
    repo.add({"a/b.dwg", "c.dwg"});
    repo.makeFolder("a/.tav");
    EXPECT_EQ(tavIn(repo.pathTo("a"), {"files"}), done("b.dwg\n"));
}

struct FullDiskRow {
    char const* name;
    Arguments arguments;
};

class FullDisk
    : public TavTest
    , public testing::WithParamInterface<FullDiskRow> {};

TEST_P(FullDisk, MakesACommandFailWhoseOutputIsLost)
{
    repo.add({"a.dwg", "b.dwg"});
    EXPECT_EQ(
        tavInto("/dev/full", GetParam().arguments),
        failed("tav: The output could not be written. Check the disk or the program that reads it.\n"));
}

INSTANTIATE_TEST_SUITE_P(
    Commands, FullDisk,
    testing::Values(
        FullDiskRow{"Help", {"--help"}}, FullDiskRow{"HelpOfACommand", {"init", "--help"}},
        FullDiskRow{"Init", {"init"}}, FullDiskRow{"Status", {"status"}},
        FullDiskRow{"StatusAsDocument", {"status", "--json"}}, FullDiskRow{"Add", {"add", "a.dwg"}},
        FullDiskRow{"Unstage", {"unstage", "--all"}}, FullDiskRow{"Mv", {"mv", "a.dwg", "c.dwg"}},
        FullDiskRow{"Files", {"files"}}, FullDiskRow{"FilesWithDigests", {"files", "--hash"}},
        FullDiskRow{"FilesAsDocument", {"files", "--json"}}, FullDiskRow{"Ignore", {"ignore"}},
        FullDiskRow{"IgnoreAdd", {"ignore", "--add", "a*"}}),
    support::rowName);

} // namespace
} // namespace host_tests
