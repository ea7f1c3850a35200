#include "tests/host/history_test.h"

#include <filesystem>
#include <string>

namespace host_tests {
namespace {

/// A commit on a terminal, with a shell command as the editor.
class CommitMessage : public HistoryTest {
protected:
    CommitMessage()
    {
        repo.write("планы/крыша.dwg", "1");
        tav({"add", "--all"});
    }

    Outcome commit(std::string const& editor, Arguments const& more = {}) const
    {
        Setting terminal = setting();
        terminal.isOnTerminal = true;
        terminal.input = "\n"; // The usual name, should it be asked for.
        terminal.environment = {"TAV_EDITOR=" + editor, "XDG_CONFIG_HOME=" + repo.pathTo(".tav/home")};
        Arguments arguments = {"commit", "--author", "ann@studio"};
        arguments.insert(arguments.end(), more.begin(), more.end());
        return run(terminal, arguments);
    }

    std::string message() const { return values({"log", "-1"}, "message").front(); }

    static constexpr char const* kWrite = "f() { printf 'Рисует крышу\\n\\n# no\\nmore  \\n\\n' >\"$1\"; }; f";
};

TEST_F(CommitMessage, IsWrittenInAnEditor)
{
    EXPECT_EQ(commit(kWrite).code, 0);
    EXPECT_EQ(message(), "Рисует крышу\\n\\nmore");
    EXPECT_FALSE(repo.has(".tav/COMMIT_MESSAGE"));
}

TEST_F(CommitMessage, BeginsWithWhatWillBeCommitted)
{
    commit("f() { cp \"$1\" seen; printf First >\"$1\"; }; f");
    EXPECT_EQ(
        repo.read("seen"), "\n# Say what has changed, and why. Lines that begin with '#' are ignored.\n"
                           "# Without a message, nothing is committed.\n"
                           "#\n"
                           "# This will be committed:\n"
                           "#   new:      .tav/properties/ignore\n"
                           "#   new:      планы/крыша.dwg\n");
}

TEST_F(CommitMessage, ThatIsEmptyCommitsNothing)
{
    EXPECT_EQ(commit("true"), failed("tav: The message is empty. Say what has changed, and who made the change.\n"));
    EXPECT_EQ(values({"log"}, "number").size(), 0U);
    EXPECT_FALSE(repo.has(".tav/COMMIT_MESSAGE"));
}

TEST_F(CommitMessage, OfAnEditorThatFailsCommitsNothing)
{
    EXPECT_EQ(
        commit("false"),
        failed("tav: The editor 'false' failed. Nothing has been committed; give the message with -m, or name another "
               "editor with 'tav config editor'.\n"));
    EXPECT_EQ(values({"log"}, "number").size(), 0U);
}

TEST_F(CommitMessage, IsKeptWhenTheCommitIsRefused)
{
    repo.write(".tav/conflict/крыша.theirs.dwg", "2");
    std::string const path = repo.pathTo(".tav/COMMIT_MESSAGE");
    Outcome const refused = commit(kWrite);
    EXPECT_EQ(refused.code, 1);
    std::string const detail = "  Your message is kept: tav commit -F '" + path + "'\n";
    EXPECT_EQ(refused.err.substr(refused.err.size() - detail.size()), detail);
    std::filesystem::remove(repo.pathTo(".tav/conflict/крыша.theirs.dwg"));
    EXPECT_EQ(tav({"commit", "-F", path}).code, 0);
    EXPECT_EQ(message(), "Рисует крышу\\n\\nmore");
}

TEST_F(CommitMessage, ThatWasKeptIsOfferedAgain)
{
    repo.write(".tav/COMMIT_MESSAGE", "Kept\n");
    commit("true");
    EXPECT_EQ(message(), "Kept");
}

TEST_F(CommitMessage, IsWrittenThroughNoLink)
{
    repo.write("notes.txt", "mine");
    repo.makeLink(".tav/COMMIT_MESSAGE", repo.pathTo("notes.txt"));
    EXPECT_EQ(commit(kWrite).code, 0);
    EXPECT_EQ(repo.read("notes.txt"), "mine");
}

TEST_F(CommitMessage, IsNotAskedForWhereNothingHasChanged)
{
    commit(kWrite);
    EXPECT_EQ(commit("touch opened; true").code, 1);
    EXPECT_FALSE(repo.has("opened"));
}

TEST_F(CommitMessage, NeedsATerminalOrAnOption)
{
    EXPECT_EQ(
        tav({"commit"}), misused("tav: There is no terminal for an editor. Give a message with -m. Run 'tav commit "
                                 "--help' to see how it is used.\n"));
}

TEST_F(CommitMessage, ComesFromAFile)
{
    repo.write("message.txt", "\n# 1 屋根\n\n");
    EXPECT_EQ(tav({"commit", "-F", "message.txt"}).code, 0);
    EXPECT_EQ(message(), "# 1 屋根");
    EXPECT_EQ(
        tav({"commit", "-F", "none.txt"}),
        failed("tav: 'none.txt' cannot be read: No such file or directory. Nothing has been committed.\n"));
}

TEST_F(CommitMessage, FromAFileIsUtf8)
{
    repo.write("message.txt", "Caf\xe9");
    EXPECT_EQ(
        tav({"commit", "-F", "message.txt"}),
        failed("tav: The message in 'message.txt' is not UTF-8. Nothing has been committed; save the message as UTF-8, "
               "or give it with -m.\n"));
}

TEST_F(CommitMessage, WithAllTakesChangedFilesAndNoNewOnes)
{
    tav({"commit", "-m", "First"});
    repo.write("планы/крыша.dwg", "2");
    repo.write("new.txt", "1");
    EXPECT_EQ(tav({"commit", "-am", "Second"}).code, 0);
    EXPECT_EQ(values({"show"}, "path"), std::vector<std::string>{"планы/крыша.dwg"});
    EXPECT_EQ(status(), "New, not staged:\n  (use 'tav add NAME' or 'tav add --all' to stage)\n        new.txt\n\n");
}

TEST_F(CommitMessage, WithAllThatFailsStagesNothing)
{
    tav({"commit", "-m", "First"});
    repo.write("планы/крыша.dwg", "2");
    repo.write(".tav/conflict/крыша.theirs.dwg", "2");
    std::string const before = state();
    EXPECT_EQ(tav({"commit", "-am", "Second"}).code, 1);
    EXPECT_EQ(state(), before);
}

TEST_F(CommitMessage, WithAllShowsChangedFilesInTheEditor)
{
    tav({"commit", "-m", "First"});
    repo.write("планы/крыша.dwg", "2");
    commit("f() { cp \"$1\" seen; }; f", {"-a"});
    EXPECT_NE(repo.read("seen").find("#   modified: планы/крыша.dwg\n"), std::string::npos);
}

} // namespace
} // namespace host_tests
