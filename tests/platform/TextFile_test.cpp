#include "platform/ut/TextFile.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/rows.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <gmock/gmock.h>
#include <sys/stat.h>

namespace {

using support::TempFolder;
using testing::ElementsAre;
using testing::IsEmpty;
using ut::TextFile;

// Empty lines in the middle are given too, so the end is taken from the number of lines asked for.
std::vector<std::string> firstLines(TextFile& file, std::size_t count)
{
    std::vector<std::string> lines;
    for (std::size_t i = 0; i < count; ++i) {
        lines.push_back((i == 0 ? file.getFirstLine() : file.getNextLine()).ansi_str());
    }
    return lines;
}

struct Content {
    char const* name;
    std::string bytes;
    std::vector<std::string> lines; // followed by an empty one: the end
};

void PrintTo(Content const& row, std::ostream* out)
{
    *out << row.name;
}

class TextFileReading : public testing::TestWithParam<Content> {};

TEST_P(TextFileReading, GivesTheseLines)
{
    TempFolder const folder;
    folder.write("ignore", GetParam().bytes);
    TextFile file(folder.widePathTo("ignore"));
    ASSERT_TRUE(file.open());
    std::vector<std::string> expected = GetParam().lines;
    expected.emplace_back();
    expected.emplace_back();
    EXPECT_EQ(firstLines(file, expected.size()), expected);
}

INSTANTIATE_TEST_SUITE_P(
    Contents, TextFileReading,
    testing::Values(
        Content{"Nothing", "", {}}, Content{"OneLine", "a", {"a"}}, Content{"OneLineWithItsEnd", "a\n", {"a"}},
        Content{"TwoLines", "a\nb", {"a", "b"}}, Content{"EmptyLineBetween", "a\n\nb\n", {"a", "", "b"}},
        Content{"EmptyLineFirst", "\na", {"", "a"}}, Content{"OnlyALineEnd", "\n", {""}},
        Content{"CarriageReturns", "a\r\nb\r\n\r\nc\r\n", {"a", "b", "", "c"}},
        Content{"MixedEnds", "a\r\nb\nc", {"a", "b", "c"}},
        Content{"LoneCarriageReturnBelongsToTheLine", "a\rb\nc\r", {"a\rb", "c\r"}},
        Content{"TwoCarriageReturns", "a\r\r\nb", {"a\r", "b"}},
        Content{
            "ByteOrderMark",
            "\xEF\xBB\xBF"
            "a\nb",
            {"a", "b"}},
        Content{"OnlyAByteOrderMark", "\xEF\xBB\xBF", {}},
        Content{
            "SecondByteOrderMarkIsText",
            "\xEF\xBB\xBF\xEF\xBB\xBF"
            "a",
            {"\xEF\xBB\xBF"
             "a"}},
        Content{"HalfAByteOrderMarkIsText", "\xEF\xBB", {"\xEF\xBB"}},
        Content{
            "OtherLineSeparatorsAreText",
            "a\xE2\x80\xA8"
            "b\x0B"
            "c",
            {"a\xE2\x80\xA8"
             "b\x0B"
             "c"}},
        Content{"Blanks", " a \n\t", {" a ", "\t"}},
        Content{"NotAscii", "\xC3\xA4\n\xF0\x9F\x98\x80", {"\xC3\xA4", "\xF0\x9F\x98\x80"}},
        Content{"NotUtf8", "\xFF\n\xC3\n\xA4", {"\xFF", "\xC3", "\xA4"}},
        Content{"Nuls", std::string("a\0b\n\0", 5), {std::string("a\0b", 3), std::string("\0", 1)}}),
    support::rowName);

TEST(TextFile, StartsAgainAtTheFirstLine)
{
    TempFolder const folder;
    folder.write("ignore", "a\nb");
    TextFile file(folder.widePathTo("ignore"));
    ASSERT_TRUE(file.open());
    EXPECT_THAT(firstLines(file, 3), ElementsAre("a", "b", ""));
    EXPECT_THAT(firstLines(file, 2), ElementsAre("a", "b"));
}

TEST(TextFile, BeginsWithTheFirstLineWhoeverAsks)
{
    TempFolder const folder;
    folder.write("ignore", "a\nb");
    TextFile file(folder.widePathTo("ignore"));
    ASSERT_TRUE(file.open());
    EXPECT_EQ(file.getNextLine(), OdString(L"a"));
}

TEST(TextFile, HasNoLinesBeforeItIsOpened)
{
    TempFolder const folder;
    folder.write("ignore", "a");
    TextFile file(folder.widePathTo("ignore"));
    EXPECT_THAT(firstLines(file, 2), ElementsAre("", ""));
}

TEST(TextFile, DoesNotOpenWhatIsNoRegularFile)
{
    TempFolder const folder;
    folder.makeFolder("folder");
    folder.makeLink("dangling", "nowhere");
    ASSERT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    for (char const* name : {"folder", "dangling", "pipe", "missing"}) {
        EXPECT_FALSE(TextFile(folder.widePathTo(name)).open()) << name;
        EXPECT_FALSE(TextFile(folder.widePathTo(name)).exists()) << name;
    }
}

TEST(TextFile, HasNoLinesAfterAFailedOpening)
{
    TempFolder const folder;
    TextFile file(folder.widePathTo("missing"));
    file.addLine(L"a");
    EXPECT_FALSE(file.open());
    EXPECT_THAT(firstLines(file, 1), ElementsAre(""));
}

TEST(TextFile, DoesNotOpenWhenReadingFails)
{
    TempFolder const folder;
    folder.write("ignore", "a");
    TextFile file(folder.widePathTo("ignore"));
    support::FailingCall const failing(1, EIO);
    EXPECT_FALSE(file.open());
    EXPECT_EQ(failing.name(), "1: read");
}

TEST(TextFile, ExistsAsARegularFileOrALinkToOne)
{
    TempFolder const folder;
    folder.write("ignore", "");
    folder.makeLink("link", "ignore");
    EXPECT_TRUE(TextFile(folder.widePathTo("ignore")).exists());
    EXPECT_TRUE(TextFile(folder.widePathTo("link")).exists());
    EXPECT_FALSE(TextFile(folder.widePathTo("ignore") + L'\0').exists());
}

std::string written(std::vector<OdString> const& lines)
{
    TempFolder const folder;
    TextFile file(folder.widePathTo("ignore"));
    for (OdString const& line : lines) {
        file.addLine(line);
    }
    EXPECT_TRUE(file.write());
    return folder.read("ignore");
}

TEST(TextFile, JoinsItsLinesWithLineFeeds)
{
    EXPECT_EQ(written({}), "");
    EXPECT_EQ(written({L""}), "");
    EXPECT_EQ(written({L"a"}), "a");
    EXPECT_EQ(written({L"a", L"b", L"c"}), "a\nb\nc");
    EXPECT_EQ(written({L"a", L"", L"b", L""}), "a\n\nb\n");
}

TEST(TextFile, WritesALineAsItStands)
{
    EXPECT_EQ(written({L"{\n    \"a\" : 1\r\n}"}), "{\n    \"a\" : 1\r\n}");
    EXPECT_EQ(written({OdString(L"a\0b", 3)}), std::string("a\0b", 3));
    EXPECT_EQ(written({L"\uFEFF\u20AC"}), "\xEF\xBB\xBF\xE2\x82\xAC");
    EXPECT_EQ(written({OdString("\xFF\xC3", CP_UTF_8)}), "\xFF\xC3");
}

TEST(TextFile, LeavesTheDiskAloneUntilItIsWritten)
{
    TempFolder const folder;
    folder.write("old", "old");
    for (char const* name : {"old", "new"}) {
        TextFile file(folder.widePathTo(name));
        file.create();
        file.addLine(L"a");
    }
    EXPECT_THAT(folder.list(), ElementsAre("old"));
    EXPECT_EQ(folder.read("old"), "old");
}

TEST(TextFile, ReplacesTheOldContentAsAWhole)
{
    TempFolder const folder;
    folder.write("ignore", "a long old content\n");
    TextFile file(folder.widePathTo("ignore"));
    file.create();
    file.addLine(L"new");
    EXPECT_TRUE(file.write());
    EXPECT_EQ(folder.read("ignore"), "new");
    EXPECT_THAT(folder.list(), ElementsAre("ignore"));
}

TEST(TextFile, CreationForgetsTheLines)
{
    TempFolder const folder;
    folder.write("ignore", "a\nb");
    TextFile file(folder.widePathTo("ignore"));
    ASSERT_TRUE(file.open());
    file.create();
    EXPECT_THAT(firstLines(file, 1), ElementsAre(""));
    file.addLine(L"c");
    EXPECT_TRUE(file.write());
    EXPECT_EQ(folder.read("ignore"), "c");
}

TEST(TextFile, AddsToTheLinesThatItRead)
{
    TempFolder const folder;
    folder.write("ignore", "a\r\nb\n");
    TextFile file(folder.widePathTo("ignore"));
    ASSERT_TRUE(file.open());
    file.addLine(L"c");
    EXPECT_TRUE(file.write());
    EXPECT_EQ(folder.read("ignore"), "a\nb\nc");
}

TEST(TextFile, KeepsPermissionsAndLinks)
{
    TempFolder const folder;
    folder.write("sub/ignore", "old");
    folder.makeLink("link", "sub/ignore");
    ASSERT_EQ(chmod(folder.pathTo("sub/ignore").c_str(), 0640), 0);
    TextFile file(folder.widePathTo("link"));
    file.addLine(L"new");
    EXPECT_TRUE(file.write());
    EXPECT_EQ(folder.read("sub/ignore"), "new");
    EXPECT_THAT(folder.list(), ElementsAre("link", "sub/", "sub/ignore"));
    struct stat status;
    ASSERT_EQ(lstat(folder.pathTo("link").c_str(), &status), 0);
    EXPECT_TRUE(S_ISLNK(status.st_mode));
    ASSERT_EQ(stat(folder.pathTo("link").c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 07777U, 0640U);
}

TEST(TextFile, IsNotWrittenWhereItCannotBe)
{
    TempFolder const folder;
    folder.makeFolder("folder");
    OdString const withNul = folder.widePathTo("plan") + L'\0' + L".dwg";
    for (OdString const& path :
         {folder.widePathTo("folder"), folder.widePathTo("missing/ignore"), OdString(), withNul}) {
        TextFile file(path);
        file.addLine(L"new");
        EXPECT_FALSE(file.write()) << path.ansi_str();
    }
    EXPECT_THAT(folder.list(), ElementsAre("folder/"));
}

TEST(TextFile, FailedWritingLeavesTheOldContent)
{
    TempFolder const folder;
    folder.write("ignore", "old");
    ASSERT_EQ(chmod(folder.path().c_str(), 0555), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] {
            TextFile file(folder.widePathTo("ignore"));
            file.addLine(L"new");
            return file.write() ? "written" : "refused";
        }),
        "refused");
    EXPECT_EQ(folder.read("ignore"), "old");
}

TEST(TextFile, ReadsBackWhatItWrote)
{
    TempFolder const folder;
    TextFile file(folder.widePathTo("ignore"));
    for (wchar_t const* line : {L"^.*\\.dwl$", L"", L" \u20AC\U0001F600 "}) {
        file.addLine(line);
    }
    ASSERT_TRUE(file.write());
    TextFile again(folder.widePathTo("ignore"));
    ASSERT_TRUE(again.open());
    EXPECT_THAT(firstLines(again, 4), ElementsAre("^.*\\.dwl$", "", " \xE2\x82\xAC\xF0\x9F\x98\x80 ", ""));
}

} // namespace
