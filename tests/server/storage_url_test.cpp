#include "tests/server/examples.h"
#include "tests/server/outcome.h"
#include "tests/server/translations.h"

#include "common/mu_common_file_storage.h"
#include "common/mu_common_repo_prop.h"

#include "tests/support/rows.h"
#include "tests/support/small_stack.h"
#include "tests/support/utf8.h"

#include <array>
#include <random>
#include <regex>
#include <sstream>
#include <type_traits>

namespace {

using namespace common;
using namespace server;

static_assert(std::is_same_v<std::underlying_type_t<StorageType>, std::int32_t>);
static_assert(static_cast<int>(StorageType::Tf) == 0);
static_assert(static_cast<int>(StorageType::Object) == 1);

RootPath const kRoot(L"/bridge");
std::string const kHash = "0123456789abcdef0123456789abcdef0123456789abcdef0123456789abcdef";

struct KindRow {
    char const* name;
    char const* text;
    StorageType type;
};

class UrlKind : public testing::TestWithParam<KindRow> {};

INSTANTIATE_TEST_SUITE_P(
    Urls, UrlKind,
    testing::Values(
        KindRow{"Drawing", "tf:plan#1", StorageType::Tf}, KindRow{"TwoLettersAlone", "tf", StorageType::Tf},
        KindRow{"AnythingBehind", "tfX", StorageType::Tf}, KindRow{"LineEndBehind", "tf\n", StorageType::Tf},
        KindRow{"Object", "po1", StorageType::Object}, KindRow{"OneLetter", "t", StorageType::Object},
        KindRow{"Empty", "", StorageType::Object}, KindRow{"Capitals", "TF:plan#1", StorageType::Object},
        KindRow{"OneCapital", "tF:plan#1", StorageType::Object},
        KindRow{"BlankBefore", " tf:plan#1", StorageType::Object},
        KindRow{"OtherLetters", "ft:plan#1", StorageType::Object}),
    support::rowName);

TEST_P(UrlKind, IsToldByTheFirstTwoCharacters)
{
    EXPECT_EQ(urlToType(support::fromUtf8(GetParam().text)), GetParam().type);
}

class FileKind : public testing::TestWithParam<KindRow> {};

INSTANTIATE_TEST_SUITE_P(
    Files, FileKind,
    testing::Values(
        KindRow{"Drawing", "plan.dwg", StorageType::Tf}, KindRow{"InFolders", "/a.b/c/plan.dwg", StorageType::Tf},
        KindRow{"SeveralDots", "plan.old.dwg", StorageType::Tf},
        KindRow{"CapitalExtension", "plan.DWG", StorageType::Object},
        KindRow{"OneCapital", "plan.dwG", StorageType::Object},
        KindRow{"OtherDrawing", "plan.dxf", StorageType::Object}, KindRow{"Longer", "plan.dwgx", StorageType::Object},
        KindRow{"Shorter", "plan.dw", StorageType::Object}, KindRow{"WithoutExtension", "plan", StorageType::Object},
        KindRow{"WithoutDot", "dwg", StorageType::Object},
        KindRow{"NothingButTheExtension", ".dwg", StorageType::Object},
        KindRow{"ExtensionOfAFolder", "plan.dwg/notes", StorageType::Object},
        KindRow{"ExtensionBeforeAnother", "plan.dwg.bak", StorageType::Object},
        KindRow{"EmptyExtension", "plan.dwg.", StorageType::Object},
        KindRow{"BlankBehind", "plan.dwg ", StorageType::Object}, KindRow{"Empty", "", StorageType::Object}),
    support::rowName);

TEST_P(FileKind, IsToldByTheExtension)
{
    EXPECT_EQ(fileToType(support::fromUtf8(GetParam().text)), GetParam().type);
}

/// A URL, the revision and the place that it names; an empty text stands for the error.
struct UrlRow {
    char const* name;
    std::string url;
    std::string revision;
    std::string place;
};

class StorageUrl : public testing::TestWithParam<UrlRow> {};

std::string const kInvalid = "none";

INSTANTIATE_TEST_SUITE_P(
    Drawings, StorageUrl,
    testing::Values(
        UrlRow{"OneMark", "tf:plan#7", "7", "/bridge/.tav/tf/plan.tf"},
        UrlRow{"TwoMarks", "tf:plan#3#7", "7", "/bridge/.tav/tf/plan.tf"},
        UrlRow{"MarkAtTheEnd", "tf:plan#", "", "/bridge/.tav/tf/plan.tf"},
        UrlRow{"TwoMarksAtTheEnd", "tf:plan##", "", "/bridge/.tav/tf/plan.tf"},
        UrlRow{"EmptyName", "tf:#7", "7", "/bridge/.tav/tf/.tf"},
        UrlRow{"NothingButMarks", "tf:#", "", "/bridge/.tav/tf/.tf"}, UrlRow{"NoMark", "tf:plan", kInvalid, kInvalid},
        UrlRow{"NoColon", "tfplan#1", "1", kInvalid}, UrlRow{"ColonLater", "tfX:plan#1", "1", kInvalid},
        UrlRow{"MarkBeforeColon", "tf#:1", ":1", kInvalid}, UrlRow{"LettersAlone", "tf", kInvalid, kInvalid},
        UrlRow{"ColonAlone", "tf:", kInvalid, kInvalid},
        UrlRow{"ColonInName", "tf:a:b#1", "1", "/bridge/.tav/tf/a:b.tf"},
        UrlRow{"FoldersInName", "tf:a/../b#1", "1", "/bridge/.tav/tf/a/../b.tf"},
        UrlRow{"BeyondAscii", "tf:pl\u00E4n#\u00FC", "\u00FC", "/bridge/.tav/tf/pl\u00E4n.tf"},
        UrlRow{"NoValidEncoding", "tf:\xFF#\xFE", "\xFE", "/bridge/.tav/tf/\xFF.tf"},
        UrlRow{
            "Nul", std::string("tf:a\0b#c\0d", 10), std::string("c\0d", 3),
            std::string("/bridge/.tav/tf/a\0b.tf", 22)}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    LineEnds, StorageUrl,
    testing::Values(
        UrlRow{"LineFeedInName", "tf:a\nb#1", kInvalid, kInvalid},
        UrlRow{"LineFeedInRevision", "tf:a#1\n", kInvalid, kInvalid},
        UrlRow{"CarriageReturnInName", "tf:a\rb#1", kInvalid, kInvalid},
        UrlRow{"CarriageReturnInRevision", "tf:a#\r1", kInvalid, kInvalid},
        UrlRow{"LineSeparator", "tf:a\u2028#1", "1", "/bridge/.tav/tf/a\u2028.tf"},
        UrlRow{"InAnObject", "po\n" + kHash, kHash, "/bridge/.tav/objects/" + kHash}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    Objects, StorageUrl,
    testing::Values(
        UrlRow{"HashBehindTheLetters", "po" + kHash, kHash, "/bridge/.tav/objects/" + kHash},
        UrlRow{"MoreBefore", "po:1:" + kHash, kHash, "/bridge/.tav/objects/" + kHash},
        UrlRow{
            "ExactlyAsLongAsAHash", "po" + kHash.substr(2), "po" + kHash.substr(2),
            "/bridge/.tav/objects/po" + kHash.substr(2)},
        UrlRow{"Shorter", "po1", "po1", "/bridge/.tav/objects/po1"},
        UrlRow{"LettersAlone", "po", "po", "/bridge/.tav/objects/po"},
        UrlRow{"Marks", "po#3#7", "po#3#7", "/bridge/.tav/objects/po#3#7"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    OtherTexts, StorageUrl,
    testing::Values(
        UrlRow{"Empty", "", kInvalid, kInvalid}, UrlRow{"Capitals", "TF:plan#1", kInvalid, kInvalid},
        UrlRow{"ObjectInCapitals", "PO" + kHash, kInvalid, kInvalid}, UrlRow{"OneLetter", "p", kInvalid, kInvalid},
        UrlRow{"OtherForm", "http://plan#1", kInvalid, kInvalid}, UrlRow{"HashAlone", kHash, kInvalid, kInvalid},
        UrlRow{"Placeholder", "%ls%n", kInvalid, kInvalid}, UrlRow{"BlankBefore", " tf:plan#1", kInvalid, kInvalid}),
    support::rowName);

TEST_P(StorageUrl, NamesARevision)
{
    UrlRow const& row = GetParam();
    std::string const error = "error: Internal error, invalid url occur: " + row.url;
    EXPECT_EQ(inWords(getRevision(support::fromUtf8(row.url))), row.revision == kInvalid ? error : row.revision);
}

TEST_P(StorageUrl, NamesAPlace)
{
    UrlRow const& row = GetParam();
    std::string const error = "error: invalid url: " + row.url;
    EXPECT_EQ(inWords(getStoragePath(kRoot, support::fromUtf8(row.url))), row.place == kInvalid ? error : row.place);
}

TEST(StorageUrlMessages, AreTranslatedBeforeTheUrlIsFilledIn)
{
    Translations const translations({"Internal error, invalid url occur: %ls", "invalid url: %ls", "tf:plan"});
    EXPECT_EQ(inWords(getRevision(L"tf:plan")), "error: {Internal error, invalid url occur: tf:plan}");
    EXPECT_EQ(inWords(getStoragePath(kRoot, L"tf:plan")), "error: {invalid url: tf:plan}");
}

TEST(StorageUrlOfAnyLength, IsReadOnASmallStack)
{
    OdString const name(std::wstring(1'000'000, L'a').c_str(), 1'000'000);
    std::string outcomes;
    support::onSmallStack([&] {
        outcomes += inWords(getRevision(OdString(L"tf:") + name + L"#" + name)) == inWords(name) ? "read " : "lost ";
        outcomes += inWords(getStoragePath(kRoot, OdString(L"tf:") + name + L"#1")).substr(0, 20);
        outcomes += getRevision(OdString(L"tf:") + name).hasValue() ? " read" : " refused";
    });
    EXPECT_EQ(outcomes, "read /bridge/.tav/tf/aaaa refused");
}

/// What the forms of URLs say, by the standard library's expressions on the narrow text.
class Forms {
public:
    std::string revision(std::string const& url) const
    {
        std::smatch match;
        if (url.substr(0, 2) == "tf" && std::regex_match(url, match, revision_)) {
            return match[1];
        }
        return url.substr(0, 2) == "po" ? lastCharacters(url) : "error: Internal error, invalid url occur: " + url;
    }

    std::string place(std::string const& url) const
    {
        std::smatch match;
        if (url.substr(0, 2) == "tf" && std::regex_match(url, match, place_)) {
            return "/bridge/.tav/tf/" + match[1].str() + ".tf";
        }
        return url.substr(0, 2) == "po" ? "/bridge/.tav/objects/" + lastCharacters(url) : "error: invalid url: " + url;
    }

private:
    static std::string lastCharacters(std::string const& url) { return inWords(support::fromUtf8(url).right(64)); }

    std::regex const revision_{".*#(.*)"};
    std::regex const place_{"tf:(.*?)#.*"};
};

constexpr std::array<char const*, 11> kAlphabet = {"t", "f", "p", "o", ":", "#", "a", "\n", "\r", "\u00E9", "\xA9"};

/// Calls `check` with every text of up to `length` letters of the alphabet behind `start`.
template <class Check>
void forAllTexts(std::string const& start, int length, Check const& check)
{
    check(start);
    if (length == 0) {
        return;
    }
    for (char const* const letter : kAlphabet) {
        forAllTexts(start + letter, length - 1, check);
    }
}

class StorageUrlByItsForm : public testing::Test {
protected:
    void expectTheForms(std::string const& url) const
    {
        EXPECT_EQ(inWords(getRevision(support::fromUtf8(url))), forms.revision(url)) << testing::PrintToString(url);
        EXPECT_EQ(inWords(getStoragePath(kRoot, support::fromUtf8(url))), forms.place(url))
            << testing::PrintToString(url);
    }

    Forms const forms;
};

TEST_F(StorageUrlByItsForm, IsReadAsTheFormSaysWhateverItHolds)
{
    for (char const* const start : {"", "t", "tf", "tf:", "po"}) {
        forAllTexts(start, 3, [&](std::string const& url) { expectTheForms(url); });
    }
}

TEST_F(StorageUrlByItsForm, IsReadAsTheFormSaysWhenItIsLong)
{
    std::mt19937 random(20240305); // NOLINT: the same URLs every time
    constexpr std::array<char const*, 4> kStarts = {"tf", "tf:", "po", ""};
    for (int round = 0; round < 20'000; ++round) {
        std::string url = kStarts[random() % kStarts.size()];
        for (std::size_t length = random() % 90; length > 0; --length) {
            // Line ends are rare: hardly any URL would be valid.
            std::size_t const letter = random() % 100;
            url += letter < kAlphabet.size() ? kAlphabet[letter] : kAlphabet[letter % 7];
        }
        expectTheForms(url);
    }
}

TEST(StorageUrlInWideCharacters, GoesThroughItsNarrowForm)
{
    // Two held bytes that together are a valid character become that character.
    EXPECT_EQ(getRevision(L"tf:a#\xDCC3\xDCA9").value(), OdString(L"\u00E9"));
    EXPECT_EQ(getStoragePath(kRoot, L"tf:\xDCC3\xDCA9#1").value(), OdString(L"/bridge/.tav/tf/\u00E9.tf"));
}

TEST(StoragePath, BelongsToItsRepository)
{
    EXPECT_EQ(inWords(getStoragePath(RootPath(L"a/"), L"tf:plan#1")), "a/.tav/tf/plan.tf");
    EXPECT_EQ(inWords(getStoragePath(RootPath(L"."), L"po1")), "./.tav/objects/po1");
}

TEST(DocumentedExample, OfStorageUrls)
{
    std::istringstream lines(example("storage-urls.md", "# Storage URLs"));
    std::string line;
    std::getline(lines, line); // The titles of the columns.
    int count = 0;
    for (std::string url, kind, revision, place; lines >> url >> kind >> revision >> place; ++count) {
        Expected<OdString> const namedRevision = getRevision(support::fromUtf8(url));
        Expected<OdString> const namedPlace = getStoragePath(kRoot, support::fromUtf8(url));
        EXPECT_EQ(urlToType(support::fromUtf8(url)) == StorageType::Tf ? "drawing" : "object", kind) << url;
        EXPECT_EQ(namedRevision.hasValue() ? inWords(namedRevision.value()) : "-", revision) << url;
        EXPECT_EQ(namedPlace.hasValue() ? inWords(namedPlace.value()) : "-", place) << url;
    }
    EXPECT_EQ(count, 7);
}

} // namespace
