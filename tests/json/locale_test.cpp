// What the locale of the process decides, and what not.
#include "tests/json/documents.h"
#include "tests/support/rows.h"

#include <algorithm>
#include <clocale>
#include <gtest/gtest.h>
#include <locale>
#include <sstream>

namespace {

using namespace documents;
using kutils::json::write_string;

template <class Char>
class CommaAndGroups : public std::numpunct<Char> {
    Char do_decimal_point() const override { return ','; }
    Char do_thousands_sep() const override { return '.'; }
    std::string do_grouping() const override { return "\3"; }
};

/// Makes a locale of the C library current, if the machine has it, and one with decimal comma and groups of digits the
/// global one of the C++ library.
class Locale {
public:
    explicit Locale(char const* name)
        : cBefore_(std::setlocale(LC_ALL, nullptr))
        , cppBefore_(std::locale::global(
              std::locale(std::locale(std::locale::classic(), new CommaAndGroups<char>), new CommaAndGroups<wchar_t>)))
        , exists_(std::setlocale(LC_ALL, name) != nullptr)
    {
    }
    Locale(Locale const&) = delete;
    Locale& operator=(Locale const&) = delete;
    ~Locale()
    {
        std::locale::global(cppBefore_);
        std::setlocale(LC_ALL, cBefore_.c_str());
    }

    bool exists() const { return exists_; }

private:
    std::string cBefore_;
    std::locale cppBefore_;
    bool exists_;
};

class JsonUnder : public testing::TestWithParam<char const*> {};

INSTANTIATE_TEST_SUITE_P(
    Locales, JsonUnder, testing::Values("C", "C.UTF-8", "de_DE.UTF-8", "de_DE", "fr_FR.UTF-8", "hi_IN.UTF-8", "tr_TR"),
    [](auto const& row) {
        std::string name = row.param;
        std::replace_if(
            name.begin(), name.end(), [](char c) { return c == '.' || c == '-'; }, '_');
        return name;
    });

TEST_P(JsonUnder, NumbersAreWrittenTheSame)
{
    Locale const locale(GetParam());
    std::wostringstream stream;
    stream << 1234567 << L' ' << 0.5;
    ASSERT_EQ(stream.str(), L"1.234.567 0,5") << "the locale is not what this test is about";
    Value const value = Array{1234567, -1234567, std::uint64_t{12345678901234567890U}, 1234567.5, 1e20};
    EXPECT_EQ(
        write_string(value, false),
        L"[1234567,-1234567,12345678901234567890,1234567.5000000000000000,100000000000000000000.0000000000000000]");
}

TEST_P(JsonUnder, NumbersAreReadTheSame)
{
    Locale const locale(GetParam());
    Value const expected = Array{1234567, -1234567, 1234567.5, 1.5e-7, 5};
    EXPECT_EQ(read(L"[1234567,-1234567,1234567.5,1.5e-7,5]"), expected);
    EXPECT_FALSE(reads(L"[1.234.567]"));
}

TEST_P(JsonUnder, BlanksAndDigitsAreTheSame)
{
    Locale const locale(GetParam());
    EXPECT_FALSE(reads(L"\x00A0 1"));
    EXPECT_FALSE(reads(L"\x2003 1"));
    EXPECT_FALSE(reads(L"\x0661"));
    EXPECT_FALSE(reads(L"TRUE"));
}

TEST_P(JsonUnder, TheNextWriteFollowsTheLocaleOfThatMoment)
{
    Value const value = L"\x00E4";
    {
        Locale const locale("C.UTF-8");
        ASSERT_TRUE(locale.exists());
        EXPECT_EQ(write_string(value, false), L"\"\x00E4\"");
    }
    EXPECT_EQ(write_string(value, false), L"\"\\u00E4\"");
}

struct PrintableRow {
    char const* name;
    wchar_t character;
    std::wstring underC;
    std::wstring underUtf8;
};

class JsonPrintable : public testing::TestWithParam<PrintableRow> {};

INSTANTIATE_TEST_SUITE_P(
    Characters, JsonPrintable,
    testing::Values(
        PrintableRow{"Letter", L'a', L"a", L"a"}, PrintableRow{"Delete", L'\x7F', L"\\u007F", L"\\u007F"},
        PrintableRow{"NextLine", L'\x85', L"\\u0085", L"\\u0085"},
        PrintableRow{"Umlaut", L'\x00E4', L"\\u00E4", L"\x00E4"},
        PrintableRow{"Cyrillic", L'\x0416', L"\\u0416", L"\x0416"},
        PrintableRow{"Ideograph", L'\x6F22', L"\\u6F22", L"\x6F22"},
        PrintableRow{"LineSeparator", L'\x2028', L"\\u2028", L"\\u2028"},
        PrintableRow{"HeldByte", L'\xDC80', L"\\uDC80", L"\\uDC80"},
        PrintableRow{"Emoji", L'\x1F600', L"\\uF600", L"\x1F600"},
        PrintableRow{"LastCharacter", L'\x10FFFF', L"\\uFFFF", L"\\uFFFF"}),
    support::rowName);

TEST_P(JsonPrintable, IsDecidedByTheLocale)
{
    Value const value = Object{{std::wstring(1, GetParam().character), std::wstring(1, GetParam().character)}};
    auto const document = [](std::wstring const& c) { return L"{\"" + c + L"\":\"" + c + L"\"}"; };
    {
        Locale const locale("C");
        EXPECT_EQ(write_string(value, false), document(GetParam().underC));
    }
    Locale const locale("C.UTF-8");
    ASSERT_TRUE(locale.exists());
    EXPECT_EQ(write_string(value, false), document(GetParam().underUtf8));
}

TEST(JsonPrintableText, IsWrittenWholeUnderUtf8)
{
    Locale const locale("C.UTF-8");
    ASSERT_TRUE(locale.exists());
    EXPECT_EQ(write_string(L"Grundri\x00DF \x1F600\n", false), L"\"Grundri\x00DF \x1F600\\n\"");
    EXPECT_EQ(kutils::json::detail::add_esc_chars(L"Grundri\x00DF\x01"), L"Grundri\x00DF\\u0001");
}

} // namespace
