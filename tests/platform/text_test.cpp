#include "platform/ut/text.h"

#include "tests/support/as_ordinary_user.h"
#include "tests/support/failing_call.h"
#include "tests/support/rows.h"
#include "tests/support/temp_folder.h"

#include <cerrno>
#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

using support::FailingCall;
using support::TempFolder;

std::string readBack(std::string const& content)
{
    TempFolder const folder;
    folder.write("file", content);
    return ut::readEntireFile(folder.widePathTo("file")).ansi_str();
}

std::string failureOf(OdString const& path)
{
    try {
        return "read: " + ut::readEntireFile(path).ansi_str();
    } catch (OdError const& error) {
        return error.description().ansi_str();
    }
}

TEST(ReadEntireFile, GivesTheContentAsItStands)
{
    for (std::string const& content :
         {std::string(), std::string("a"), std::string("a\r\nb\n\rc\n"), std::string("a\0b\0", 4),
          std::string("\xC3\xA4\xF0\x9F\x98\x80"), std::string("\xFF\xC3\x00\x80", 4), std::string(3'000'000, 'x')}) {
        EXPECT_EQ(readBack(content), content);
    }
}

TEST(ReadEntireFile, SkipsOneByteOrderMark)
{
    EXPECT_EQ(readBack("\xEF\xBB\xBF"), "");
    EXPECT_EQ(readBack("\xEF\xBB\xBF{}"), "{}");
    EXPECT_EQ(readBack("\xEF\xBB\xBF\xEF\xBB\xBF{}"), "\xEF\xBB\xBF{}");
    EXPECT_EQ(readBack(" \xEF\xBB\xBF"), " \xEF\xBB\xBF");
    EXPECT_EQ(readBack("\xEF\xBB"), "\xEF\xBB");
}

TEST(ReadEntireFile, TakesNoFileForEmptyThatMemoryIsTooShortFor)
{
    TempFolder const folder;
    folder.write("file", "content");
    FailingCall const failing(0, ENOMEM);
    EXPECT_THROW(ut::readEntireFile(folder.widePathTo("file")), std::bad_alloc);
}

TEST(ReadEntireFile, ReadsThroughALink)
{
    TempFolder const folder;
    folder.write("file", "content");
    folder.makeLink("link", "file");
    EXPECT_EQ(ut::readEntireFile(folder.widePathTo("link")), OdString(L"content"));
}

TEST(ReadEntireFile, ReadsOnWhenSignalsInterruptIt)
{
    TempFolder const folder;
    folder.write("file", "content");
    int const calls = support::countCalls([&] { ut::readEntireFile(folder.widePathTo("file")); });
    for (int n = 0; n < calls; ++n) {
        FailingCall const failing(n, EINTR);
        EXPECT_EQ(failureOf(folder.widePathTo("file")), "read: content") << failing.name();
    }
}

TEST(ReadEntireFile, NamesTheFileThatItCannotRead)
{
    TempFolder const folder;
    folder.makeFolder("sub");
    folder.makeLink("loop", "loop");
    folder.makeLink("device", "/dev/zero");
    ASSERT_EQ(mkfifo(folder.pathTo("pipe").c_str(), 0600), 0);
    std::string const path = "Could not read file '" + folder.path();
    EXPECT_EQ(failureOf(folder.widePathTo("missing")), path + "/missing': No such file or directory");
    EXPECT_EQ(failureOf(folder.widePathTo("\xC3\xA4\xFF")), path + "/\xC3\xA4\xFF': No such file or directory");
    EXPECT_EQ(failureOf(folder.widePathTo("sub")), path + "/sub': Is a directory");
    EXPECT_EQ(failureOf(folder.widePathTo("pipe")), path + "/pipe': Not a regular file");
    EXPECT_EQ(failureOf(folder.widePathTo("device")), path + "/device': Not a regular file");
    EXPECT_EQ(failureOf(folder.widePathTo("loop")), path + "/loop': Too many levels of symbolic links");
    EXPECT_EQ(failureOf(OdString()), "Could not read file '': No such file or directory");
}

TEST(ReadEntireFile, DoesNotTakeTheBeginningOfAPathForThePath)
{
    TempFolder const folder;
    folder.write("file", "content");
    EXPECT_EQ(
        failureOf(folder.widePathTo("file") + L'\0'),
        "Could not read file '" + folder.path() + "/file': Invalid or incomplete multibyte or wide character");
}

TEST(ReadEntireFile, NamesTheFileWhoseReadingFails)
{
    TempFolder const folder;
    folder.write("file", "content");
    FailingCall const failing(1, EIO);
    EXPECT_EQ(
        failureOf(folder.widePathTo("file")), "Could not read file '" + folder.path() + "/file': Input/output error");
    EXPECT_EQ(failing.name(), "1: read");
}

TEST(ReadEntireFile, NamesTheFileThatMayNotBeRead)
{
    TempFolder const folder;
    folder.write("secret", "content");
    ASSERT_EQ(chmod(folder.path().c_str(), 0755), 0);
    ASSERT_EQ(chmod(folder.pathTo("secret").c_str(), 0), 0);
    EXPECT_EQ(
        support::asOrdinaryUser([&] { return failureOf(folder.widePathTo("secret")); }),
        "Could not read file '" + folder.path() + "/secret': Permission denied");
}

TEST(CorrectSlashes, LeavesEveryPathAsItIs)
{
    for (OdString const& path : {OdString(), OdString(L"/a//b/"), OdString(L"a\\b"), OdString(L"a\0b", 3)}) {
        EXPECT_EQ(ut::correctSlashes(path), path);
    }
}

struct Split {
    char const* name;
    wchar_t const* text;
    std::vector<std::string> pieces;
    std::vector<std::string> allPieces;
};

void PrintTo(Split const& row, std::ostream* out)
{
    *out << row.name;
}

class SplitByChar : public testing::TestWithParam<Split> {};

std::vector<std::string> pieces(wchar_t const* text, bool keepEmpty)
{
    std::vector<std::string> result;
    for (OdString const& piece : ut::splitByChar(text, L'@', keepEmpty)) {
        result.push_back(piece.ansi_str());
    }
    return result;
}

TEST_P(SplitByChar, GivesThesePieces)
{
    EXPECT_EQ(pieces(GetParam().text, false), GetParam().pieces);
    EXPECT_EQ(pieces(GetParam().text, true), GetParam().allPieces);
}

INSTANTIATE_TEST_SUITE_P(
    Texts, SplitByChar,
    testing::Values(
        Split{"Empty", L"", {}, {""}}, Split{"NoSeparator", L"ann", {"ann"}, {"ann"}},
        Split{"Address", L"ann@example.com", {"ann", "example.com"}, {"ann", "example.com"}},
        Split{"SeparatorFirst", L"@ann", {"ann"}, {"", "ann"}}, Split{"SeparatorLast", L"ann@", {"ann"}, {"ann", ""}},
        Split{"OnlyASeparator", L"@", {}, {"", ""}}, Split{"TwoSeparators", L"a@@b", {"a", "b"}, {"a", "", "b"}},
        Split{"ManyPieces", L"a@b@c", {"a", "b", "c"}, {"a", "b", "c"}}),
    support::rowName);

TEST(SplitByChar, SplitsAtNulsToo)
{
    OdArray<OdString> const result = ut::splitByChar(OdString(L"a\0b", 3), L'\0', false);
    ASSERT_EQ(result.size(), 2U);
    EXPECT_EQ(result[1], OdString(L"b"));
}

} // namespace
