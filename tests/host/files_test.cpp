#include "tests/host/history_test.h"

#include "common/mu_common_versions.h"

#include <gmock/gmock.h>

#include <regex>

namespace host_tests {
namespace {

using Files = TavTest;

constexpr char const* kDigestOfNothing = "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855";
constexpr char const* kDigestOfAbc = "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad";

TEST_F(Files, ListsTheFilesOfAFolderBeforeThoseOfItsFoldersAndThePropertiesLast)
{
    repo.add({"b/z.dwg", "b/a/y.dwg", "c.dwg", "Z.txt", "b.bak", ".hidden", ".folder/x.dwg", "c.DWL"});
    repo.ignore("^.*\\.bak$");
    EXPECT_EQ(tav({"files"}), done("Z.txt\nc.DWL\nc.dwg\nb/z.dwg\nb/a/y.dwg\n.tav/properties/ignore\n"));
}

TEST_F(Files, ListsNothingOfAnEmptyRepository)
{
    EXPECT_EQ(tav({"files"}), done(""));
    EXPECT_EQ(tav({"files", "--hash"}), done(""));
    EXPECT_EQ(tav({"files", "--json"}), done("[\n]\n"));
}

TEST_F(Files, TakesTheFolderOfARepository)
{
    repo.add({"a.dwg"});
    EXPECT_EQ(tavIn("/", {"files", repo.path() + "/"}), done("a.dwg\n"));
}

TEST_F(Files, FailsForAFolderInsideOfARepository)
{
    repo.add({"a/b.dwg"});
    EXPECT_EQ(
        tav({"files", "a"}),
        failed("tav: Path: a is not a tav directory. Run 'tav init' in the folder of your drawings to make it one.\n"));
}

TEST_F(Files, NeedsNoState)
{
    repo.add({"a.dwg"});
    repo.write(".tav/tav.state", "broken");
    EXPECT_EQ(tav({"files"}), done("a.dwg\n"));
}

TEST_F(Files, FollowsLinksToFilesButNotToFolders)
{
    repo.add({"a.dwg", "b/c.dwg"});
    repo.makeLink("link.dwg", "a.dwg");
    repo.makeLink("folder", "b");
    repo.makeLink("dangling.dwg", "nowhere");
    repo.makeLink("b/up", "..");
    EXPECT_EQ(tav({"files"}), done("a.dwg\nlink.dwg\nb/c.dwg\n"));
}

TEST_F(Files, ShowsDigests)
{
    repo.add({"empty.dwg"});
    repo.write("letters.dwg", "abc");
    EXPECT_EQ(
        tav({"files", "--hash"}),
        done(std::string(kDigestOfNothing) + "  empty.dwg\n" + kDigestOfAbc + "  letters.dwg\n"));
}

TEST_F(Files, DigestsLargeFilesWhole)
{
    std::string const content(std::size_t{3} << 20, 'x');
    repo.write("large.dwg", content);
    std::string const digest = generateSha(content.data(), static_cast<int>(content.size())).ansi_str();
    EXPECT_EQ(tav({"files", "--hash"}), done(digest + "  large.dwg\n"));
}

TEST_F(Files, ShowsADocument)
{
    repo.add({"empty.dwg"});
    repo.write("a/letters.dwg", "abc");
    EXPECT_EQ(tav({"files", "--json"}), done(R"([
    {
        "path" : "empty.dwg"
    },
    {
        "path" : "a/letters.dwg"
    }
]
)"));
    EXPECT_EQ(tav({"files", "--json", "--hash"}), done(std::string(R"([
    {
        "path" : "empty.dwg",
        "sha256" : ")") + kDigestOfNothing + R"("
    },
    {
        "path" : "a/letters.dwg",
        "sha256" : ")" + kDigestOfAbc + R"("
    }
]
)"));
}

/// Names that terminals, documents or lists of digests may stumble over.
class FilesWithOddNames : public TavTest {
protected:
    FilesWithOddNames()
    {
        repo.add(
            {"a b.dwg", "back\\slash", "bell\a", "c1\xc2\x9b.dwg", "carriage\rreturn", "esc\x1b[31m.dwg", "line\nfeed",
             "not\xff\xfeutf8.dwg", "План.dwg", "図面.dwg", "\xf0\x9f\x8f\xa0.dwg"});
    }
};

TEST_F(FilesWithOddNames, AreOneLineEachInPipes)
{
    EXPECT_EQ(
        tav({"files"}),
        done("a b.dwg\nback\\slash\nbell\\x07\nc1\\x9B.dwg\ncarriage\\x0Dreturn\nesc\\x1B[31m.dwg\nline\\x0Afeed\n"
             "not\xff\xfeutf8.dwg\nПлан.dwg\n図面.dwg\n\xf0\x9f\x8f\xa0.dwg\n"));
}

TEST_F(Files, ShowsOnATerminalWhatCannotBeSeen)
{
    repo.add({"direction\xe2\x80\xae.dwg", "join\xe2\x80\x8d.dwg", "line\xe2\x80\xa8.dwg"});
    EXPECT_EQ(tavOnTerminal({"files"}), done("direction\\u202E.dwg\njoin\\u200D.dwg\nline\\u2028.dwg\n"));
    EXPECT_EQ(tav({"files"}), done("direction\xe2\x80\xae.dwg\njoin\xe2\x80\x8d.dwg\nline\\u2028.dwg\n"));
}

TEST_F(FilesWithOddNames, AreEscapedOnATerminal)
{
    EXPECT_EQ(
        tavOnTerminal({"files"}),
        done("a b.dwg\nback\\slash\nbell\\x07\nc1\\x9B.dwg\ncarriage\\x0Dreturn\nesc\\x1B[31m.dwg\nline\\x0Afeed\n"
             "not\\xFF\\xFEutf8.dwg\nПлан.dwg\n図面.dwg\n\xf0\x9f\x8f\xa0.dwg\n"));
}

TEST_F(FilesWithOddNames, AreEscapedOnATerminalBehindDigestsToo)
{
    std::string const output = tavOnTerminal({"files", "--hash"}).out;
    EXPECT_NE(output.find("  esc\\x1B[31m.dwg\n"), std::string::npos);
    EXPECT_EQ(output.find('\x1b'), std::string::npos);
}

TEST_F(FilesWithOddNames, AreWholeInDocuments)
{
    EXPECT_EQ(tav({"files", "--json"}), done(R"([
    {
        "path" : "a b.dwg"
    },
    {
        "path" : "back\\slash"
    },
    {
        "path" : "bell\u0007"
    },
    {
        "path" : "c1\u009B.dwg"
    },
    {
        "path" : "carriage\rreturn"
    },
    {
        "path" : "esc\u001B[31m.dwg"
    },
    {
        "path" : "line\nfeed"
    },
    {
        "path" : "not\uDCFF\uDCFEutf8.dwg"
    },
    {
        "path" : "План.dwg"
    },
    {
        "path" : "図面.dwg"
    },
    {
        "path" : "\uD83C\uDFE0.dwg"
    }
]
)"));
}

TEST_F(FilesWithOddNames, AreListedSoThatSha256sumCanCheckThem)
{
    support::TempFolder const aside;
    aside.write("list", tav({"files", "--hash"}).out);
    Setting sha256sum = setting();
    sha256sum.program = "/usr/bin/sha256sum";
    EXPECT_EQ(run(sha256sum, {"--check", "--strict", "--quiet", aside.pathTo("list")}), done(""));
    repo.write("line\nfeed", "changed");
    EXPECT_EQ(run(sha256sum, {"--check", "--status", aside.pathTo("list")}), failed(""));
}

TEST_F(Files, PrintsTheSameUnderEveryLocale)
{
    repo.add({"План.dwg", "\xf0\x9f\x8f\xa0.dwg"});
    std::string const document = tav({"files", "--json"}).out;
    for (char const* const locale : {"LC_ALL=C", "LC_ALL=C.UTF-8", "LC_ALL=nonsense", "LC_ALL="}) {
        Setting other = setting();
        other.environment = {locale};
        EXPECT_EQ(run(other, {"files"}), done("План.dwg\n\xf0\x9f\x8f\xa0.dwg\n")) << locale;
        EXPECT_EQ(run(other, {"files", "--json"}), done(document)) << locale;
    }
}

TEST_F(Files, FailsForAnIgnoreFileThatCannotBeUsed)
{
    repo.ignore("[");
    EXPECT_EQ(
        tav({"files"}), failed("tav: The ignore file has a rule that is not a valid regular expression. "
                               "Correct '.tav/properties/ignore'.\n"));
}

TEST_F(Files, MakesNothing)
{
    std::vector<std::string> const before = repo.list();
    tav({"files", "--hash"});
    EXPECT_EQ(repo.list(), before);
}

class CommittedFiles : public HistoryTest {
protected:
    CommittedFiles()
    {
        repo.write("план.dwg", "1");
        repo.write("図面/屋根.dwg", "1");
        commitAll("First");
        repo.write("図面/屋根.dwg", "abc");
        EXPECT_EQ(tav({"add", "."}).code, 0);
        EXPECT_EQ(tav({"commit", "-m", "Second", "--author", "Борис@studio"}).code, 0);
        repo.write("図面/屋根.dwg", "not committed");
        repo.write("new.dwg", "not committed");
    }

    /// What it prints, with the same date everywhere.
    std::string lines(Arguments const& arguments) const
    {
        return std::regex_replace(tav(arguments).out, std::regex("\\d{4}-\\d\\d-\\d\\d \\d\\d:\\d\\d"), "DATE");
    }
};

TEST_F(CommittedFiles, AreListedWithTheCommitThatChangedThemLast)
{
    EXPECT_EQ(
        lines({"files", "--long"}), "1  DATE  ann    .tav/properties/ignore\n"
                                    "1  DATE  ann    план.dwg\n"
                                    "2  DATE  Борис  図面/屋根.dwg\n");
    EXPECT_THAT(values({"files", "--long"}, "commit"), testing::ElementsAre("1", "1", "2"));
    EXPECT_THAT(
        values({"files", "--long"}, "author"), testing::ElementsAre("ann@studio", "ann@studio", "Борис@studio"));
    EXPECT_EQ(values({"files", "--long"}, "hash").at(2), values({"show", "2"}, "hash").at(0));
}

TEST_F(CommittedFiles, AreThoseOfTheCommitThatIsNamed)
{
    EXPECT_EQ(tav({"files", "--at", "1"}), done(".tav/properties/ignore\nплан.dwg\n図面/屋根.dwg\n"));
    EXPECT_THAT(values({"files", "--long", "--at", "1"}, "commit"), testing::ElementsAre("1", "1", "1"));
    EXPECT_THAT(values({"files", "--hash", "--at", "@"}, "sha256"), testing::Contains(kDigestOfAbc));
    EXPECT_EQ(
        tav({"files", "--at", "7"}),
        failed("tav: There is no commit, branch or tag '7'. Run 'tav log' or 'tav branch' to see them, or 'tav fetch' "
               "for those of others.\n"));
}

TEST_F(CommittedFiles, ShowTheCommitThatRenamedThem)
{
    EXPECT_EQ(tav({"mv", "план.dwg", "plan.dwg"}).code, 0);
    EXPECT_EQ(tav({"commit", "-m", "Third"}).code, 0);
    EXPECT_THAT(values({"files", "--long"}, "commit"), testing::ElementsAre("1", "3", "2"));
}

} // namespace
} // namespace host_tests
