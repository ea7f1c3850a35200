#include "host/history/tracked_path.h"

#include "tests/support/rows.h"
#include "tests/support/temp_folder.h"

#include <gtest/gtest.h>

#include <optional>
#include <string>

namespace {

std::string verdict(OdString const& path)
{
    return tav::whyUnsafe(path).value_or("safe");
}

struct Row {
    char const* name;
    OdString path;
    std::string verdict;
};

class RecordedPath : public testing::TestWithParam<Row> {};

TEST_P(RecordedPath, IsUsedOrRefusedWithItsFault)
{
    EXPECT_EQ(verdict(GetParam().path), GetParam().verdict);
}

OdString times(std::size_t count, wchar_t c)
{
    OdString text;
    for (std::size_t i = 0; i < count; ++i) {
        text += c;
    }
    return text;
}

OdString longPath(std::size_t bytes)
{
    OdString path = times(100, L'a');
    while (path.getLength() + 101 <= bytes) {
        path += L"/" + times(100, L'a');
    }
    return path + times(bytes - path.getLength(), L'b');
}

OdString held(char const* bytes)
{
    OdString text;
    for (char const* byte = bytes; *byte; ++byte) {
        text += static_cast<wchar_t>(0xDC00 + static_cast<unsigned char>(*byte));
    }
    return text;
}

std::string because(std::string const& quoted, std::string const& fault)
{
    return "The path '" + quoted + "' " + fault + ".";
}

std::string const kAbsolute = "is absolute; a recorded path is relative to the working folder";
std::string const kDrive = "begins with a drive; a recorded path is relative to the working folder";
std::string const kLong = "is longer than 4096 bytes";
std::string const kControl = "holds a control character or a line end";
std::string const kBackslash = "holds a backslash, which separates folders on other systems";
std::string const kUnsound = "holds a character that no file name has";
std::string const kEmptyPart = "has an empty part between its slashes";
std::string const kDots = "has a part that consists of dots and spaces, which may lead out of the working folder";
std::string const kLongPart = "has a part that is longer than 255 bytes";
std::string const kOwn = "leads into the folder '.tav', which belongs to the repository";

INSTANTIATE_TEST_SUITE_P(
    Clean, RecordedPath,
    testing::Values(
        Row{"AFile", L"plan.dwg", "safe"}, Row{"AFileInFolders", L"house/north/plan.dwg", "safe"},
        Row{"Hidden", L".gitignore", "safe"}, Row{"HiddenFolder", L".a/.b", "safe"}, Row{"LeadingDash", L"-rf", "safe"},
        Row{"Blanks", L"my plan.dwg", "safe"}, Row{"DotsAndBlanksAtTheEnd", L"plan. .", "safe"},
        Row{"ThreeDotsAndMore", L"...a", "safe"}, Row{"OtherScript", L"\u041F\u043B\u0430\u043D/\u56F3.dwg", "safe"},
        Row{"BeyondTheBasicPlane", L"\U0001F600.dwg", "safe"}, Row{"StrayBytes", held("\xFF\xFE"), "safe"},
        Row{"InvisibleCharacters", L"a\u200Cb", "safe"}, Row{"ColonBehindTheFirstPart", L"plan:a", "safe"},
        Row{"ColonAtTheFirstPlace", L":a", "safe"}, Row{"LongestPart", times(255, L'a'), "safe"},
        Row{"LongestPath", longPath(4096), "safe"}, Row{"Properties", L".tav/properties/ignore", "safe"},
        Row{"PropertiesInFolders", L".tav/properties/a/b", "safe"}, Row{"LongerThanTheOwnFolder", L".tavern", "safe"},
        Row{"TavWithoutDot", L"tav", "safe"}, Row{"LongerThanAShortName", L"TAV~1.dwg", "safe"},
        Row{"TildeWithoutNumber", L"TAV~", "safe"}, Row{"NumberAndMore", L"TAV~1a", "safe"},
        Row{"NoHexadecimalDigitsInAShortName", L"TAXXXX~1", "safe"}, Row{"DashFirst", L"--all/-", "safe"},
        Row{"WideLettersWithoutADot", L"\uFF54\uFF41\uFF56", "safe"}, Row{"WideSlash", L"a\uFF0Fb", "safe"},
        Row{"Ellipsis", L"\u2026", "safe"}, Row{"Composed", L"\u00E9.dwg", "safe"},
        Row{"Decomposed", L"e\u0301.dwg", "safe"}, Row{"DeviceOfAnotherSystem", L"nul.dwg", "safe"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OutOfTheFolder, RecordedPath,
    testing::Values(
        Row{"Empty", L"", "The path is empty."}, Row{"Absolute", L"/etc/passwd", because("/etc/passwd", kAbsolute)},
        Row{"OnlyASlash", L"/", because("/", kAbsolute)}, Row{"Drive", L"C:", because("C:", kDrive)},
        Row{"FileOnADrive", L"c:/a", because("c:/a", kDrive)}, Row{"RelativeToADrive", L"z:a", because("z:a", kDrive)},
        Row{"Share", L"\\\\server\\a", because("\\\\server\\a", kBackslash)},
        Row{"Backslash", L"a\\b", because("a\\b", kBackslash)},
        Row{"BackslashDots", L"..\\a", because("..\\a", kBackslash)}, Row{"Up", L"..", because("..", kDots)},
        Row{"UpFirst", L"../a", because("../a", kDots)}, Row{"UpInside", L"a/../../b", because("a/../../b", kDots)},
        Row{"UpLast", L"a/..", because("a/..", kDots)}, Row{"Here", L".", because(".", kDots)},
        Row{"HereInside", L"a/./b", because("a/./b", kDots)}, Row{"UpAndBlank", L".. /a", because(".. /a", kDots)},
        Row{"UpAndInvisible", L".\u200B./a", because(".\\u200B./a", kDots)},
        Row{"UpInWideDots", L"\uFF0E\uFF0E/a", because("\uFF0E\uFF0E/a", kDots)},
        Row{"DriveBehindSlashes", L"//c:/a", because("//c:/a", kAbsolute)},
        Row{"DeviceSpace", L"\\\\?\\c:\\a", because("\\\\?\\c:\\a", kBackslash)},
        Row{"OnlyABackslash", L"\\", because("\\", kBackslash)}, Row{"ThreeDots", L"a/...", because("a/...", kDots)},
        Row{"Blank", L"a/ /b", because("a/ /b", kDots)}, Row{"EmptyInside", L"a//b", because("a//b", kEmptyPart)},
        Row{"SlashAtTheEnd", L"a/", because("a/", kEmptyPart)}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    Characters, RecordedPath,
    testing::Values(
        Row{"LineFeed", L"a\nb", because("a\\x0Ab", kControl)},
        Row{"CarriageReturn", L"a\rb", because("a\\x0Db", kControl)},
        Row{"Escape", L"a\x1B[2J", because("a\\x1B[2J", kControl)},
        Row{"Nul", OdString(L"a\0b", 3), because("a\\x00b", kControl)},
        Row{"Delete", L"a\x7F", because("a\\x7F", kControl)}, Row{"NextLine", L"a\x85", because("a\\x85", kControl)},
        Row{"SequenceIntroducer", L"a\x9B", because("a\\x9B", kControl)},
        Row{"LineSeparator", L"a\u2028", because("a\\u2028", kControl)},
        Row{"ParagraphSeparator", L"a\u2029", because("a\\u2029", kControl)},
        Row{"HighSurrogate", L"a\xD83D", because("a\\uD83D", kUnsound)},
        Row{"LowSurrogate", L"a\xDE00", because("a\\uDE00", kUnsound)},
        Row{"SurrogateBelowTheStrayBytes", L"a\xDC7F", because("a\\uDC7F", kUnsound)},
        Row{"StrayBytesThatAreNone", held("\xC3\xA9"), because("\\xC3\\xA9", kUnsound)},
        Row{"BeyondUnicode", OdString(L"a\x7FFFFFFF"), because("a\xEF\xBF\xBD", kUnsound)}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    Lengths, RecordedPath,
    testing::Values(
        Row{"LongPart", times(256, L'a'), because(std::string(100, 'a') + "...", kLongPart)},
        Row{"LongPartOfWideCharacters", L"a/" + times(128, L'\u00E9'),
            because(
                "a/" +
                    [] {
                        std::string text;
                        for (int i = 0; i < 98; ++i) {
                            text += "\xC3\xA9";
                        }
                        return text;
                    }() +
                    "...",
                kLongPart)},
        Row{"LongPath", longPath(4097), because(std::string(100, 'a') + "...", kLong)}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OwnFolder, RecordedPath,
    testing::Values(
        Row{"Itself", L".tav", because(".tav", kOwn)},
        Row{"Inside", L".tav/tav.state", because(".tav/tav.state", kOwn)},
        Row{"Below", L"a/.tav/b", because("a/.tav/b", kOwn)}, Row{"Capitals", L".TAV/a", because(".TAV/a", kOwn)},
        Row{"OneCapital", L".tAv", because(".tAv", kOwn)}, Row{"Dot", L".tav./a", because(".tav./a", kOwn)},
        Row{"BlankAtTheEnd", L".tav /a", because(".tav /a", kOwn)},
        Row{"DotsAndBlanks", L".tav. . ", because(".tav. . ", kOwn)},
        Row{"Joiner", L".t\u200Dav", because(".t\\u200Dav", kOwn)},
        Row{"NonJoiner", L"\u200C.tav", because("\\u200C.tav", kOwn)},
        Row{"MarkOfDirection", L".ta\u202Ev", because(".ta\\u202Ev", kOwn)},
        Row{"WordJoiner", L".ta\u2060v", because(".ta\\u2060v", kOwn)},
        Row{"ByteOrderMark", L".tav\uFEFF/a", because(".tav\\uFEFF/a", kOwn)},
        Row{"SoftHyphen", L".ta\u00ADv", because(".ta\\xADv", kOwn)},
        Row{"VariationSelector", L".t\uFE0Fav", because(".t\\uFE0Fav", kOwn)},
        Row{"SupplementaryVariationSelector", L".t\U000E0100av", because(".t\\uE0100av", kOwn)},
        Row{"InvisibleBehindTheDot", L".tav.\u200B", because(".tav.\\u200B", kOwn)},
        Row{"ShortName", L"TAV~1/a", because("TAV~1/a", kOwn)},
        Row{"ShortNameInSmall", L"tav~2", because("tav~2", kOwn)},
        Row{"LaterShortName", L"TAV~12", because("TAV~12", kOwn)},
        Row{"HashedShortName", L"TA3F0C~1/a", because("TA3F0C~1/a", kOwn)},
        Row{"ShortNameAndStream", L"TAV~1::$DATA", because("TAV~1::$DATA", kOwn)},
        Row{"InvisibleInAShortName", L"TAV\u2061~1", because("TAV\\u2061~1", kOwn)},
        Row{"WideLetters", L".\uFF34\uFF41\uFF56", because(".\uFF34\uFF41\uFF56", kOwn)},
        Row{"WideDot", L"\uFF0Etav/a", because("\uFF0Etav/a", kOwn)},
        Row{"DotLeader", L"\u2024tav", because("\u2024tav", kOwn)},
        Row{"MathematicalLetters", L".\U0001D42D\U0001D41A\U0001D42F",
            because(".\U0001D42D\U0001D41A\U0001D42F", kOwn)},
        Row{"CircledLetters", L".\u24E3\u24B6\u24E5", because(".\u24E3\u24B6\u24E5", kOwn)},
        Row{"RomanNumeral", L".ta\u2174", because(".ta\u2174", kOwn)},
        Row{"RaisedLetters", L".\u1D57\u1D43\u1D5B", because(".\u1D57\u1D43\u1D5B", kOwn)},
        Row{"WideShortName", L"TAV\uFF5E\uFF11", because("TAV\uFF5E\uFF11", kOwn)},
        Row{"ShortNameAndDot", L"TAV~1.", because("TAV~1.", kOwn)}, Row{"Stream", L".tav:x", because(".tav:x", kOwn)},
        Row{"StreamOfAFolder", L".tav::$INDEX_ALLOCATION/a", because(".tav::$INDEX_ALLOCATION/a", kOwn)},
        Row{"BlankBeforeAStream", L".tav :x", because(".tav :x", kOwn)},
        Row{"PropertiesItself", L".tav/properties", because(".tav/properties", kOwn)},
        Row{"PropertiesInCapitals", L".tav/Properties/a", because(".tav/Properties/a", kOwn)},
        Row{"PropertiesAndDot", L".tav/properties./a", because(".tav/properties./a", kOwn)},
        Row{"PropertiesOfCapitals", L".TAV/properties/a", because(".TAV/properties/a", kOwn)},
        Row{"PropertiesBelow", L"a/.tav/properties/b", because("a/.tav/properties/b", kOwn)},
        Row{"OutOfProperties", L".tav/properties/../a", because(".tav/properties/../a", kDots)},
        Row{"SlashBehindProperties", L".tav/properties/", because(".tav/properties/", kEmptyPart)},
        Row{"InProperties", L".tav/properties/.tav/a", because(".tav/properties/.tav/a", kOwn)}),
    support::rowName);

struct Range {
    char const* name;
    wchar_t first;
    wchar_t last;
};

class InvisibleCharacters : public testing::TestWithParam<Range> {};

TEST_P(InvisibleCharacters, HideNoNameOfTheOwnFolder)
{
    std::wstring const own = L".tav";
    for (wchar_t c = GetParam().first; c <= GetParam().last; ++c) {
        for (std::size_t place = 0; place <= own.size(); ++place) {
            std::wstring name = own;
            name.insert(place, 1, c);
            std::optional<std::string> const fault = tav::whyUnsafe(name.c_str());
            ASSERT_TRUE(fault.has_value()) << std::hex << static_cast<unsigned>(c);
            EXPECT_NE(fault->find(kOwn), std::string::npos) << *fault;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(
    Ranges, InvisibleCharacters,
    testing::Values(
        Range{"JoinersAndMarks", 0x200B, 0x200F}, Range{"Directions", 0x202A, 0x202E},
        Range{"InvisibleOperators", 0x2060, 0x206F}, Range{"VariationSelectors", 0xFE00, 0xFE0F},
        Range{"ByteOrderMark", 0xFEFF, 0xFEFF}, Range{"Tags", 0xE0000, 0xE007F}),
    support::rowName);

TEST(ControlCharacters, StandInNoPath)
{
    for (wchar_t c = 0; c < 0xA0; ++c) {
        bool const isControl = c < 0x20 || c >= 0x7F;
        wchar_t const path[] = {L'a', c, L'b'};
        std::optional<std::string> const fault = tav::whyUnsafe(OdString(path, 3));
        bool const isNamed = fault && fault->find(kControl) != std::string::npos;
        EXPECT_EQ(isNamed, isControl) << std::hex << static_cast<unsigned>(c);
    }
}

std::string obstacle(support::TempFolder const& folder, wchar_t const* path)
{
    return tav::linkOnTheWay(folder.path(), path).value_or("none");
}

TEST(LinkOnTheWay, IsNoneForWhatExistsAndWhatDoesNot)
{
    support::TempFolder const folder;
    folder.write("a/b/c", "");
    EXPECT_EQ(obstacle(folder, L"a/b/c"), "none");
    EXPECT_EQ(obstacle(folder, L"a/b"), "none");
    EXPECT_EQ(obstacle(folder, L"a/x/y/z"), "none");
    EXPECT_EQ(obstacle(folder, L"x"), "none");
}

TEST(LinkOnTheWay, IsALinkWhereverItStandsAndWhateverItNames)
{
    support::TempFolder const folder;
    folder.write("a/b/c", "");
    folder.makeLink("a/there", folder.pathTo("a/b"));
    folder.makeLink("a/file", folder.pathTo("a/b/c"));
    folder.makeLink("gone", "/nowhere at all");
    std::string const isLink = " is a symbolic link, which may lead out of the working folder.";
    EXPECT_EQ(obstacle(folder, L"a/there/c"), "'a/there'" + isLink);
    EXPECT_EQ(obstacle(folder, L"a/there/x/y"), "'a/there'" + isLink);
    EXPECT_EQ(obstacle(folder, L"a/there"), "'a/there'" + isLink);
    EXPECT_EQ(obstacle(folder, L"a/file"), "'a/file'" + isLink);
    EXPECT_EQ(obstacle(folder, L"gone"), "'gone'" + isLink);
    EXPECT_EQ(obstacle(folder, L"gone/a"), "'gone'" + isLink);
}

TEST(LinkOnTheWay, IsAFileWhereAFolderShouldBe)
{
    support::TempFolder const folder;
    folder.write("a/b", "");
    EXPECT_EQ(obstacle(folder, L"a/b/c/d"), "'a/b' is not a folder.");
}

TEST(LinkOnTheWay, LetsTheWorkingFolderItselfBeALink)
{
    support::TempFolder const folder;
    folder.write("work/a", "");
    folder.makeLink("link", folder.pathTo("work"));
    EXPECT_EQ(tav::linkOnTheWay(folder.pathTo("link"), L"a").value_or("none"), "none");
}

TEST(LinkOnTheWay, IsALinkThatNamesItself)
{
    support::TempFolder const folder;
    folder.makeLink("loop", folder.pathTo("loop"));
    EXPECT_EQ(obstacle(folder, L"loop/a"), "'loop' is a symbolic link, which may lead out of the working folder.");
}

TEST(LinkOnTheWay, SaysWhatCannotBeExamined)
{
    support::TempFolder const folder;
    EXPECT_EQ(
        tav::linkOnTheWay("/nowhere at all", L"a").value_or("none"),
        "'/nowhere at all' cannot be examined: No such file or directory.");
}

} // namespace
