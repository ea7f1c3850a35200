// Read-only copies of versions, opened by a program of the user's.
#include "tests/host/history_test.h"
#include "tests/support/drawing_bytes.h"
#include "tests/support/rows.h"
#include "tests/support/temp_folder.h"

#include "host/pictures/png_file.h"

#include <chrono>
#include <filesystem>
#include <fstream>
#include <sys/stat.h>

namespace host_tests {
namespace {

namespace fs = std::filesystem;

std::string contentOf(std::string const& path)
{
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

unsigned permissionsOf(std::string const& path)
{
    return static_cast<unsigned>(fs::status(path).permissions());
}

/// A user with own folders, and a program that notes what it is to open.
class Open : public HistoryTest {
protected:
    Open()
    {
        user.write("program", "#!/bin/sh\nprintf '%s' \"$2\" >'" + user.pathTo("opened") + "'\n");
        fs::permissions(user.pathTo("program"), fs::perms::owner_all);
        EXPECT_EQ(tavHere({"config", "open.program", user.pathTo("program") + " -x"}).code, 0);
    }

    void commitFile(std::string const& path, std::string const& content) const
    {
        repo.write(path, content);
        EXPECT_EQ(commitAll("changes it").code, 0);
    }

    Outcome tavHere(Arguments const& arguments) const
    {
        Setting own = setting();
        own.environment = {"XDG_CONFIG_HOME=" + user.path(), "XDG_CACHE_HOME=" + user.pathTo("cache")};
        return run(own, arguments);
    }

    /// Opens a file, and returns the path that the program got.
    std::string open(std::string const& name) const
    {
        Outcome const outcome = tavHere({"open", "--", name});
        std::string const copy = user.read("opened");
        EXPECT_EQ(outcome, done("Opening '" + copy + "', a read-only copy.\n"));
        return copy;
    }

    std::string copyOf(std::string const& name) const
    {
        std::string const out = tavHere({"open", "--print", "--", name}).out;
        return out.substr(0, out.find('\n'));
    }

    support::TempFolder const user;
};

TEST_F(Open, LikeShowAndCatSaysThatThereIsNoSuchCommit)
{
    commitFile("plan.dwg", "one");
    for (std::string const command : {"open", "show", "cat"}) {
        EXPECT_EQ(
            tavHere({command, "9:plan.dwg"}), failed("tav: There is no commit, branch or tag '9'. Run 'tav log' or "
                                                     "'tav branch' to see them, or 'tav fetch' for those of "
                                                     "others.\n"));
    }
}

TEST_F(Open, NamesTheSettingWhenThereIsNoProgram)
{
    commitFile("plan.dwg", "one");
    tavHere({"config", "--unset", "open.program"});
    Setting own = setting();
    own.environment = {"XDG_CONFIG_HOME=" + user.path(), "XDG_CACHE_HOME=" + user.pathTo("cache"), "PATH=/nowhere"};
    EXPECT_EQ(
        run(own, {"open", "plan.dwg"}).err,
        "tav: 'xdg-open' cannot be started: No such file or directory. Install it, or name another program with 'tav "
        "config open.program'.\n");
}

TEST_F(Open, ShowsTheVersionOfACommitWhereNobodyElseLooks)
{
    commitFile("план \"1\".dwg", "one");
    commitFile("план \"1\".dwg", "two");
    std::string const copy = open("1:план \"1\".dwg");
    EXPECT_EQ(fs::path(copy).filename(), "план \"1\" (commit 1).dwg");
    EXPECT_EQ(contentOf(copy), "one");
    EXPECT_EQ(permissionsOf(copy), 0400U);
    EXPECT_EQ(permissionsOf(fs::path(copy).parent_path()), 0700U);
    EXPECT_EQ(copy.compare(0, user.pathTo("cache/tav/open/").size(), user.pathTo("cache/tav/open/")), 0);
    EXPECT_EQ(status(), kClean);
}

struct NameRow {
    char const* name;
    std::string file;
    std::string copy;
};

class OpenNames
    : public Open
    , public testing::WithParamInterface<NameRow> {};

TEST_P(OpenNames, AreThoseOfTheFilesWithTheCommit)
{
    commitFile(GetParam().file, "one");
    std::string const copy = open(GetParam().file);
    EXPECT_EQ(fs::path(copy).filename(), GetParam().copy);
    EXPECT_EQ(contentOf(copy), "one");
}

INSTANTIATE_TEST_SUITE_P(
    Files, OpenNames,
    testing::Values(
        NameRow{"InAFolder", "sub folder/图.dwg", "图 (commit 1).dwg"},
        NameRow{"LeadingDash", "-a.dwg", "-a (commit 1).dwg"},
        NameRow{"CombiningAccent", "e\xCC\x81tage.dwg", "e\xCC\x81tage (commit 1).dwg"},
        NameRow{"NoEnding", "plan", "plan (commit 1)"},
        NameRow{"Quotes", "it's \"$HOME\" `x`.dwg", "it's \"$HOME\" `x` (commit 1).dwg"}),
    support::rowName);

TEST_F(Open, CutsANameThatIsTooLongBetweenTwoCharacters)
{
    std::string name;
    for (int i = 0; i < 122; ++i) {
        name += "я";
    }
    commitFile("a" + name + ".dwg", "one");
    std::string const copy = fs::path(open("a" + name + ".dwg")).filename();
    EXPECT_EQ(copy, "a" + name.substr(0, 238) + " (commit 1).dwg");
}

TEST_F(Open, GivesTwoFilesOfOneNameTheirOwnCopies)
{
    commitFile("a/plan.dwg", "one");
    commitFile("b/plan.dwg", "two");
    EXPECT_EQ(contentOf(copyOf("a/plan.dwg")), "one");
    EXPECT_EQ(contentOf(copyOf("b/plan.dwg")), "two");
}

TEST_F(Open, LeavesACopyThatSomebodyHasChanged)
{
    commitFile("plan.dwg", "one");
    std::string const first = copyOf("plan.dwg");
    fs::permissions(first, fs::perms::owner_all);
    std::ofstream(first) << "my work";
    std::string const second = copyOf("plan.dwg");
    EXPECT_EQ(fs::path(second).filename(), "plan (commit 1, 2).dwg");
    EXPECT_EQ(contentOf(first), "my work");
    EXPECT_EQ(contentOf(second), "one");
    EXPECT_EQ(copyOf("plan.dwg"), second);
}

TEST_F(Open, RemovesOldCopiesThatNobodyHasChanged)
{
    commitFile("plan.dwg", "one");
    commitFile("notes.txt", "two");
    std::string const old = copyOf("plan.dwg");
    std::string const changed = copyOf("notes.txt");
    fs::permissions(changed, fs::perms::owner_all);
    std::ofstream(changed) << "my work";
    for (std::string const& copy : {old, changed}) {
        fs::last_write_time(
            fs::path(copy).parent_path(), fs::file_time_type::clock::now() - std::chrono::hours(31 * 24));
    }
    commitFile("plan.dwg", "three");
    copyOf("plan.dwg");
    EXPECT_FALSE(fs::exists(fs::path(old).parent_path()));
    EXPECT_EQ(contentOf(changed), "my work");
}

class OpenedProgram
    : public Open
    , public testing::WithParamInterface<NameRow> {};

TEST_P(OpenedProgram, IsRefused)
{
    commitFile(GetParam().file, GetParam().copy);
    std::string const copy = copyOf(GetParam().file);
    EXPECT_EQ(
        tavHere({"open", GetParam().file}),
        failed(
            "tav: '" + copy +
            "' may be a program, and opening it could run it. Look at it with 'tav cat', or open "
            "the copy yourself.\n"));
    EXPECT_FALSE(user.has("opened"));
}

INSTANTIATE_TEST_SUITE_P(
    Files, OpenedProgram,
    testing::Values(
        NameRow{"Desktop", "plan.Desktop", "x"}, NameRow{"Lisp", "plan.LSP", "x"}, NameRow{"Shell", "a.dwg.sh", "x"},
        NameRow{"Script", "plan.dwg", "#!/bin/sh\n"},
        NameRow{
            "Elf", "plan",
            "\x7f"
            "ELF"},
        NameRow{"DesktopEntry", "plan", "# x\n[Desktop Entry]\nExec=x\n"}),
    support::rowName);

TEST_F(Open, TakesItsProgramFromNoRepository)
{
    commitFile("plan.dwg", "one");
    repo.write("evil", "#!/bin/sh\ntouch '" + user.pathTo("evil was here") + "'\n");
    fs::permissions(repo.pathTo("evil"), fs::perms::owner_all);
    repo.write(".tav/config", "{\"open.program\":\"" + repo.pathTo("evil") + "\"}");
    open("plan.dwg");
    EXPECT_FALSE(user.has("evil was here"));
}

TEST_F(Open, FailsWhenTheProgramDoes)
{
    commitFile("plan.dwg", "one");
    tavHere({"config", "open.program", "false"});
    EXPECT_EQ(
        tavHere({"-q", "open", "plan.dwg"}), failed(
                                                 "tav: The program to open '" + copyOf("plan.dwg") +
                                                 "' has failed. Name another one with 'tav config "
                                                 "open.program'.\n"));
}

TEST_F(Open, FailsForWhatThereIsNot)
{
    EXPECT_EQ(tavHere({"open", "plan.dwg"}), failed("tav: There is no commit yet. Open the file itself.\n"));
    commitFile("plan.dwg", "one");
    EXPECT_EQ(
        tavHere({"open", "1:none.dwg"}),
        failed("tav: Commit 1 has no file 'none.dwg'. Run 'tav files --at 1' to see its files.\n"));
}

TEST_F(Open, ShowsAComparisonInTheSameWay)
{
    tav::Image image(8, 4, {255, 255, 255});
    commitFile("plan.dwg", support::drawingOf({{6, tav::encodePng(image)}}));
    image.row(0)[0] = {0, 0, 0};
    commitFile("plan.dwg", support::drawingOf({{6, tav::encodePng(image)}}));
    Outcome const outcome = tavHere({"compare", "plan.dwg", "1", "--open"});
    std::string const copy = user.read("opened");
    EXPECT_EQ(
        outcome, done(
                     "Opening '" + copy +
                     "', a read-only copy.\n"
                     "plan.dwg (commit 1) and plan.dwg. Pixels that differ: 0 removed, 1 added, 0 recolored.\n"));
    EXPECT_EQ(fs::path(copy).filename(), "plan (compared).png");
    EXPECT_TRUE(tav::decodePng(contentOf(copy), 1U << 20U));
}

} // namespace
} // namespace host_tests
