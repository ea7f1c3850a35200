// Nothing in the platform follows the process's locale.
#include "platform/sdk/OdError.h"
#include "platform/sdk/OdString.h"
#include "platform/sdk/OdTimeStamp.h"
#include "platform/ut/text.h"
#include "tests/support/foreign_locale.h"
#include "tests/support/temp_folder.h"

#include <algorithm>
#include <clocale>
#include <gmock/gmock.h>
#include <string>

namespace {

class UnderLocale : public testing::TestWithParam<char const*> {
    support::ForeignLocale const locale_{GetParam()};
};

INSTANTIATE_TEST_SUITE_P(
    Locales, UnderLocale,
    testing::Values("C", "C.UTF-8", "de_DE.UTF-8", "de_DE", "fr_FR.UTF-8", "hi_IN.UTF-8", "tr_TR"),
    [](auto const& row) {
        std::string name = row.param;
        std::replace_if(
            name.begin(), name.end(), [](char c) { return c == '.' || c == '-'; }, '_');
        return name;
    });

TEST_P(UnderLocale, TextsAreConvertedTheSame)
{
    std::string const bytes = "\xC3\xA4\xF0\x9F\x98\x80\xFF";
    OdString const text(bytes.c_str(), CP_UTF_8);
    EXPECT_EQ(text, OdString(L"\x00E4\x1F600\xDCFF"));
    EXPECT_EQ(text.ansi_str(), bytes);
}

TEST_P(UnderLocale, TextsAreFormattedTheSame)
{
    OdString text;
    text.format(L"%ls %d %.2f %'d %s", L"\x00E4\xDCFF", 1'234'567, 1.5, 1'234'567, "plan");
    EXPECT_EQ(text, OdString(L"\x00E4\xDCFF 1234567 1.50 1234567 plan"));
}

TEST_P(UnderLocale, FormattingLeavesTheLocaleOfTheProcessAlone)
{
    std::string const name = std::setlocale(LC_ALL, nullptr);
    std::string const point = std::localeconv()->decimal_point;
    OdString text;
    text.format(L"%.2f", 1.5);
    EXPECT_EQ(std::setlocale(LC_ALL, nullptr), name);
    EXPECT_EQ(std::localeconv()->decimal_point, point);
}

TEST_P(UnderLocale, MomentsAreRenderedTheSame)
{
    OdTimeStamp stamp;
    stamp.setPackedValue(253402300800);
    OdString text;
    stamp.strftime(L"%a %#d %b %Y %H:%M:%S", text);
    EXPECT_EQ(text, OdString(L"Sat 1 Jan 10000 00:00:00"));
    stamp.setPackedValue(1709647629);
    stamp.ctime(text);
    EXPECT_EQ(text, OdString(L"Tue Mar  5 14:07:09 2024"));
}

TEST_P(UnderLocale, MessagesOfTheDiskAreEnglish)
{
    support::TempFolder const folder;
    try {
        ut::readEntireFile(folder.widePathTo("plan \xC3\xA4\xFF"));
        FAIL() << "nothing was thrown";
    } catch (OdError const& error) {
        EXPECT_EQ(
            std::string(error.what()),
            "Could not read file '" + folder.path() + "/plan \xC3\xA4\xFF': No such file or directory");
    }
}

} // namespace
