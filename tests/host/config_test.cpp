#include "tests/host/tav_test.h"
#include "tests/support/rows.h"
#include "tests/support/temp_folder.h"

#include <filesystem>
#include <string>
#include <vector>

namespace host_tests {
namespace {

/// A user with an own folder for configuration, in a repository.
class Config : public TavTest {
protected:
    Outcome config(Arguments arguments, std::vector<std::string> const& environment = {}) const
    {
        arguments.insert(arguments.begin(), "config");
        Setting user = setting();
        user.environment = {"XDG_CONFIG_HOME=" + home_.path(), "VISUAL=", "EDITOR=", "PAGER="};
        user.environment.insert(user.environment.end(), environment.begin(), environment.end());
        return run(user, arguments);
    }

    /// Some systems have a name for the editor of their users' choice.
    static std::string standardEditor() { return std::filesystem::exists("/usr/bin/editor") ? "editor" : "vi"; }

    std::string userFile() const { return home_.pathTo("tav/config"); }

    support::TempFolder const home_;
};

TEST_F(Config, SetsForTheUser)
{
    EXPECT_EQ(config({"user.name", "Анна 山田"}), done("'user.name' is 'Анна 山田' for you.\n"));
    EXPECT_EQ(config({"user.name"}), done("Анна 山田\n"));
    EXPECT_EQ(home_.read("tav/config"), "{\n    \"user.name\" : \"Анна 山田\"\n}\n");
    EXPECT_FALSE(repo.has(".tav/config"));
}

TEST_F(Config, OfTheRepositoryComesBeforeThatOfTheUser)
{
    config({"user.name", "Ann"});
    EXPECT_EQ(config({"--repository", "user.name", "Bob"}), done("'user.name' is 'Bob' for this repository.\n"));
    EXPECT_EQ(config({"user.name"}), done("Bob\n"));
    EXPECT_EQ(config({"--user", "user.name"}), done("Ann\n"));
    EXPECT_EQ(
        config({"user.name", "Eve"}),
        (Outcome{
            0, "'user.name' is 'Eve' for you.\n", "tav: Here the value is 'Bob': this repository has its own.\n"}));
}

TEST_F(Config, OfTheEnvironmentComesFirst)
{
    repo.write(".tav/config", R"({"color":"always"})");
    EXPECT_EQ(config({"color"}), done("always\n"));
    EXPECT_EQ(config({"color"}, {"NO_COLOR=1"}), done("never\n"));
    EXPECT_EQ(config({"editor"}, {"TAV_EDITOR=ed"}), done("ed\n"));
}

TEST_F(Config, OfTheUserComesBeforeTheEditorOfTheSystem)
{
    EXPECT_EQ(config({"editor"}), done(standardEditor() + "\n"));
    EXPECT_EQ(config({"editor"}, {"EDITOR=ed"}), done("ed\n"));
    EXPECT_EQ(config({"editor"}, {"EDITOR=ed", "VISUAL=nano -w"}), done("nano -w\n"));
    config({"editor", "emacs"});
    EXPECT_EQ(config({"editor"}, {"EDITOR=ed"}), done("emacs\n"));
}

TEST_F(Config, ListsEachSettingWithItsOrigin)
{
    config({"user.name", "Ann"});
    config({"--repository", "log.date", "relative"});
    EXPECT_EQ(
        config({"--list"}, {"NO_COLOR=1"}), done(
                                                "color = never  (environment)\n"
                                                "editor = " +
                                                standardEditor() +
                                                "  (default)\n"
                                                "log.date = relative  (repository)\n"
                                                "open.program = xdg-open  (default)\n"
                                                "pager =   (environment)\n"
                                                "undo.size = 1 GB  (default)\n"
                                                "user.name = Ann  (user)\n"));
    EXPECT_EQ(config({"--list", "--repository"}), done("log.date = relative  (repository)\n"));
    EXPECT_EQ(config({"--list", "--user"}), done("user.name = Ann  (user)\n"));
}

TEST_F(Config, TakesSizesWithTheirUnits)
{
    EXPECT_EQ(config({"undo.size", "20 MB"}).code, 0);
    EXPECT_EQ(config({"undo.size"}), done("20 MB\n"));
    EXPECT_EQ(
        config({"undo.size", "much"}),
        failed("tav: 'much' is not a value of 'undo.size'. Give a size like '500 MB'.\n"));
}

TEST_F(Config, HasADocument)
{
    config({"user.name", "Ünal \"U\""});
    EXPECT_EQ(config({"user.name", "--json"}), done(R"([
    {
        "ignored" : false,
        "key" : "user.name",
        "origin" : "user",
        "value" : "Ünal \"U\""
    }
]
)"));
}

TEST_F(Config, OfARepositoryRunsNoProgram)
{
    std::string const message = " names a program, and a repository may come from anybody. Set it for yourself only.\n";
    repo.write(".tav/config", R"({"editor":"touch evil","pager":"touch evil","open.program":"touch evil"})");
    for (std::string const key : {"editor", "pager", "open.program"}) {
        EXPECT_EQ(config({"--repository", key, "ed"}), failed("tav: '" + key + "'" + message));
        EXPECT_NE(config({key}).out, "touch evil\n");
        config({key, "ed"});
        EXPECT_EQ(config({key}, {key == "pager" ? "TAV_PAGER=ed" : "VISUAL="}), done("ed\n"));
    }
    EXPECT_EQ(
        config({"--list", "--repository"}), done("editor = touch evil  (repository, ignored)\n"
                                                 "open.program = touch evil  (repository, ignored)\n"
                                                 "pager = touch evil  (repository, ignored)\n"));
}

TEST_F(Config, ListsWhatIsIgnored)
{
    repo.write(".tav/config", R"({"color":"pink","future\u001b":"x","user.name":["Ann"],"log.date":"absolute"})");
    EXPECT_EQ(
        config({"--list", "--repository"}), done("color = pink  (repository, ignored)\n"
                                                 "future\\x1B = x  (repository, ignored)\n"
                                                 "log.date = absolute  (repository)\n"
                                                 "user.name =   (repository, ignored)\n"));
    EXPECT_EQ(config({"color"}), done("auto\n"));
}

TEST_F(Config, KeepsMembersThatItDoesNotKnow)
{
    home_.write("tav/config", R"({"future":{"a":[1]}})");
    config({"user.name", "Ann"});
    EXPECT_EQ(home_.read("tav/config").find("\"future\""), 6U);
}

TEST_F(Config, RemovesASetting)
{
    config({"user.name", "Ann"});
    EXPECT_EQ(config({"--unset", "user.name"}), done("'user.name' is no longer set for you.\n"));
    EXPECT_EQ(home_.read("tav/config"), "{\n}\n");
    EXPECT_EQ(
        config({"--unset", "user.name"}),
        failed("tav: 'user.name' is not set for you. Run 'tav config --list' to see what is set.\n"));
}

TEST_F(Config, FailsForAValueThatTheFileDoesNotHave)
{
    EXPECT_EQ(
        config({"--repository", "user.name"}),
        failed("tav: 'user.name' is not set for this repository. Run 'tav config --list' to see what is in effect.\n"));
}

/// Somebody who commits for the first time.
class Author : public Config {
protected:
    Author()
    {
        tav({"init"});
        tav({"add", "--all"});
    }

    Outcome commit(std::string const& typed, Arguments const& more = {}) const
    {
        Setting user = setting();
        user.environment = {"XDG_CONFIG_HOME=" + home_.path()};
        user.isOnTerminal = true;
        user.input = typed;
        Arguments arguments = {"commit", "-m", "First"};
        arguments.insert(arguments.end(), more.begin(), more.end());
        return run(user, arguments);
    }

    std::string author() const
    {
        std::string const text = tav({"log", "--json"}).out;
        std::size_t const start = text.find("\"author\" : \"") + 12;
        return text.substr(start, text.find('"', start) - start);
    }
};

TEST_F(Author, IsAskedForOnce)
{
    std::string const usual = config({"user.name"}).out;
    EXPECT_EQ(commit("Анна\n").err, "Your name for commits [" + usual.substr(0, usual.size() - 1) + "]: ");
    EXPECT_EQ(author(), "Анна");
    EXPECT_EQ(config({"user.name"}), done("Анна\n"));
    repo.write("a.txt", "2");
    tav({"add", "--all"});
    EXPECT_EQ(commit("Bob\n").err, "");
    EXPECT_EQ(author(), "Анна");
}

TEST_F(Author, IsTheUsualOneForAnEmptyAnswer)
{
    std::string const usual = config({"user.name"}).out;
    EXPECT_EQ(commit("\n").code, 0);
    EXPECT_EQ(author() + "\n", usual);
    EXPECT_EQ(config({"--user", "user.name"}), done(usual));
}

TEST_F(Author, IsNotAskedForWhenItIsNamed)
{
    EXPECT_EQ(commit("Bob\n", {"--author", "Ann"}).err, "");
    EXPECT_EQ(author(), "Ann");
    EXPECT_FALSE(home_.has("tav/config"));
}

TEST_F(Author, IsNotAskedForWithoutATerminal)
{
    std::string const usual = config({"user.name"}).out;
    Setting user = setting();
    user.environment = {"XDG_CONFIG_HOME=" + home_.path()};
    EXPECT_EQ(run(user, {"commit", "-m", "First"}).err, "");
    EXPECT_EQ(author() + "\n", usual);
    EXPECT_FALSE(home_.has("tav/config"));
}

TEST_F(Author, IsNotAskedForWithYes)
{
    EXPECT_EQ(commit("Bob\n", {"--yes"}).err, "");
    EXPECT_FALSE(home_.has("tav/config"));
}

TEST_F(Author, OfTheRepositoryIsTaken)
{
    config({"--repository", "user.name", "Ann of the bridge"});
    EXPECT_EQ(commit("Bob\n").err, "");
    EXPECT_EQ(author(), "Ann of the bridge");
}

TEST_F(Config, WorksOutsideOfRepositories)
{
    Setting user;
    user.folder = "/";
    user.environment = {"XDG_CONFIG_HOME=" + home_.path()};
    EXPECT_EQ(run(user, {"config", "log.date", "absolute"}), done("'log.date' is 'absolute' for you.\n"));
    EXPECT_EQ(run(user, {"config", "log.date"}), done("absolute\n"));
}

struct RefusalRow {
    char const* name;
    Arguments arguments;
    std::string message;
};

class ConfigRefusal
    : public Config
    , public testing::WithParamInterface<RefusalRow> {};

TEST_P(ConfigRefusal, ChangesNothing)
{
    EXPECT_EQ(config(GetParam().arguments), failed("tav: " + GetParam().message + "\n"));
    EXPECT_FALSE(home_.has("tav/config"));
}

INSTANTIATE_TEST_SUITE_P(
    Values, ConfigRefusal,
    testing::Values(
        RefusalRow{
            "UnknownKey",
            {"user.nmae", "Ann"},
            "There is no setting 'user.nmae'. Run 'tav config --list' to see those that there are."},
        RefusalRow{
            "UnknownKeyToShow",
            {"план"},
            "There is no setting 'план'. Run 'tav config --list' to see those that there are."},
        RefusalRow{
            "NotOneOfTheValues",
            {"color", "pink"},
            "'pink' is not a value of 'color'. Give 'auto', 'always' or 'never'."},
        RefusalRow{
            "TwoLines",
            {"user.name", "Ann\nBob"},
            "'Ann Bob' is not a value of 'user.name'. Give a line of text that is not empty."},
        RefusalRow{
            "Blank", {"user.name", " "}, "' ' is not a value of 'user.name'. Give a line of text that is not empty."}),
    support::rowName);

TEST_F(Config, RefusesAFileOfAnotherForm)
{
    for (char const* const text : {"", "[]", "{", "\"a\""}) {
        home_.write("tav/config", text);
        EXPECT_EQ(
            config({"user.name", "Ann"}),
            failed(
                "tav: The settings '" + userFile() + "' are not a JSON object. Correct that file, or move it away.\n"));
        EXPECT_EQ(home_.read("tav/config"), text);
    }
}

TEST_F(Config, RefusesAFileThatIsTooLong)
{
    repo.write(".tav/config", std::string((1 << 20) + 1, ' '));
    EXPECT_EQ(
        config({}),
        failed("tav: The settings '" + repo.pathTo(".tav/config") + "' have more than 1 MiB. Move that file away.\n"));
}

TEST_F(Config, OfARepositoryIsNotALink)
{
    repo.write("shared", "{}");
    repo.makeLink(".tav/config", repo.pathTo("shared"));
    EXPECT_EQ(
        config({"--repository", "user.name", "Ann"}),
        failed(
            "tav: '" + repo.pathTo(".tav/config") +
            "' is a link, and may lead to another repository. Put the file itself in its place.\n"));
    EXPECT_EQ(repo.read("shared"), "{}");
}

TEST_F(Config, KeepsBothOfTwoSettingsMadeAtTheSameTime)
{
    Setting user = setting();
    user.environment = {"XDG_CONFIG_HOME=" + home_.path()};
    for (int round = 0; round < 5; ++round) {
        Process first(user, {"config", "user.name", "Ann"});
        Process second(user, {"config", "log.date", "both"});
        EXPECT_EQ(first.wait().code, 0);
        EXPECT_EQ(second.wait().code, 0);
        EXPECT_EQ(home_.read("tav/config"), "{\n    \"log.date\" : \"both\",\n    \"user.name\" : \"Ann\"\n}\n");
        home_.write("tav/config", "{}");
    }
}

} // namespace
} // namespace host_tests
