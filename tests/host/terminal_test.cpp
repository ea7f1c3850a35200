#include "tests/host/history_test.h"

#include <string>

namespace host_tests {
namespace {

/// A repository with one commit.
class Terminal : public HistoryTest {
protected:
    Terminal()
    {
        repo.write("屋根.txt", "1\n");
        commitAll("Рисует крышу");
    }

    Outcome paged(std::string const& pager, Arguments const& arguments) const
    {
        return tavOnTerminal(arguments, {"TERM=xterm", "TAV_PAGER=" + pager});
    }

    static constexpr char const* kRed = "\x1b[31m";
};

TEST_F(Terminal, ShowsLongOutputWithThePager)
{
    for (char const* const command : {"log", "show"}) {
        EXPECT_EQ(paged("sed 's/^/|/'", {command}).out.front(), '|') << command;
    }
    repo.write("屋根.txt", "2\n");
    EXPECT_EQ(paged("sed 's/^/|/'", {"diff", "--stat"}).out.front(), '|');
    EXPECT_NE(paged("sed 's/^/|/'", {"status"}).out.front(), '|');
}

TEST_F(Terminal, ShowsWhatIsWithoutAPager)
{
    std::string const text = tavOnTerminal({"log", "--oneline"}).out;
    EXPECT_EQ(text, "1  Рисует крышу  (master)\n");
    EXPECT_EQ(paged("cat", {"log", "--oneline"}), done(text));
    EXPECT_EQ(paged("", {"log", "--oneline"}), done(text));
    EXPECT_EQ(paged("sed 's/^/|/'", {"--no-pager", "log", "--oneline"}), done(text));
    EXPECT_EQ(paged("sed 's/^/|/'", {"log", "--oneline", "--no-pager"}), done(text));
    EXPECT_EQ(tavOnTerminal({"log", "--oneline"}, {"TERM=dumb", "TAV_PAGER=rev"}), done(text));
    Setting piped = setting();
    piped.environment = {"TERM=xterm", "TAV_PAGER=sed 's/^/|/'"};
    EXPECT_EQ(run(piped, {"log", "--oneline"}), done(text));
}

TEST_F(Terminal, TakesNoPagerFromARepository)
{
    repo.write(".tav/config", R"({"pager":"touch evil"})");
    tavOnTerminal({"log"}, {"TERM=xterm", "PAGER=cat"});
    EXPECT_FALSE(repo.has("evil"));
}

TEST_F(Terminal, EndsQuietlyWithThePager)
{
    repo.write("long", std::string(1 << 20, '1') + "\n");
    repo.write("屋根.txt", "2\n");
    tav({"add", "屋根.txt"});
    EXPECT_EQ(tav({"commit", "-F", "long"}).code, 0);
    EXPECT_EQ(paged("head -c 6", {"show"}), done("Commit"));
}

TEST_F(Terminal, FailsBehindThePager)
{
    EXPECT_EQ(
        paged("sed 's/^/|/'", {"log", "нет"}),
        failed("tav: No commit has a file 'нет'. Run 'tav files' to see the names.\n"));
}

TEST_F(Terminal, HasColoursAsTheUserWants)
{
    repo.write("屋根.txt", "2\n");
    auto const isRed = [](Outcome const& outcome) { return outcome.out.find(kRed) != std::string::npos; };
    EXPECT_TRUE(isRed(tavOnTerminal({"status"})));
    EXPECT_FALSE(isRed(tavOnTerminal({"status", "--color", "never"})));
    EXPECT_FALSE(isRed(tavOnTerminal({"status"}, {"NO_COLOR=1"})));
    EXPECT_TRUE(isRed(tavOnTerminal({"status", "--color=always"}, {"NO_COLOR=1"})));
    EXPECT_FALSE(isRed(tav({"status"})));
    EXPECT_TRUE(isRed(tav({"--color", "always", "status"})));
    repo.write(".tav/config", R"({"color":"always"})");
    EXPECT_TRUE(isRed(tav({"status"})));
    EXPECT_FALSE(isRed(tav({"status", "--color", "auto"})));
    EXPECT_EQ(tav({"status", "--color", "pink"}).code, 2);
}

TEST_F(Terminal, SaysNothingOfWhatWasDone)
{
    repo.write("屋根.txt", "2\n");
    EXPECT_EQ(tav({"-q", "add", "--all"}), done(""));
    EXPECT_EQ(tav({"commit", "-q", "-m", "Second"}), done(""));
    EXPECT_EQ(tav({"checkout", "1", "--quiet"}), done(""));
    EXPECT_EQ(tav({"-q", "log", "--oneline"}), done("1  Рисует крышу\n"));
    EXPECT_EQ(tav({"-q", "commit", "-m", "Third"}).code, 1);
}

TEST_F(Terminal, TakesAllBehindDashesForNames)
{
    repo.write("--all", "1");
    repo.write("-q", "1");
    EXPECT_EQ(tav({"add", "--", "--all", "-q"}), done("Staged 2 files.\n"));
    EXPECT_EQ(tav({"unstage", "--", "-q"}), done("Took 1 file out of the next commit.\n"));
    EXPECT_EQ(tav({"commit", "-m", "Second"}).code, 0);
    EXPECT_EQ(tav({"mv", "--", "--all", "-a"}), done("Renamed '--all' to '-a'.\n"));
    EXPECT_EQ(tav({"commit", "-m", "Third"}).code, 0);
    EXPECT_EQ(tav({"rm", "--", "-a"}), done("Removed 1 file; the next commit takes that.\n"));
    EXPECT_EQ(tav({"restore", "--", "-a"}), done("1 file as in commit 3, 1 written.\n"));
}

} // namespace
} // namespace host_tests
