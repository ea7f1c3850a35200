#include "tests/server/test_clock.h"
#include "tests/server/translations.h"
#include "tests/support/rows.h"

#include "common/mu_common_history.h"

#include <cstdlib>
#include <ctime>
#include <gtest/gtest.h>
#include <limits>
#include <string>
#include <type_traits>

namespace {

using common::HistoryItem;
using common::LoadedHistory;
using server::TestClock;
using server::Translations;

static_assert(std::is_base_of_v<qut::IListItem, HistoryItem>);
static_assert(!std::has_virtual_destructor_v<HistoryItem>);

constexpr std::int64_t kSecond = 1000;
constexpr std::int64_t kMinute = 60 * kSecond;
constexpr std::int64_t kHour = 60 * kMinute;
constexpr std::int64_t kDay = 24 * kHour;
constexpr std::int64_t kNow = 1709647629000; // 2024-03-05T14:07:09Z

/// Milliseconds since 1970-01-01T00:00:00Z. Only the clock sets milliseconds.
OdTimeStamp stamp(std::int64_t moment)
{
    TestClock const clock(moment);
    return OdTimeStamp(OdTimeStamp::kInitUniversalTime);
}

HistoryItem item(std::int64_t made, wchar_t const* author = L"")
{
    return {stamp(made), author, L"name", L"detail", 7};
}

std::string infoAt(std::int64_t moment, HistoryItem const& item)
{
    TestClock const clock(moment);
    return item.getInfo().toStdString();
}

struct AgeRow {
    char const* name;
    std::int64_t age;
    std::int64_t now;
    char const* text;
};

class HistoryAge : public testing::TestWithParam<AgeRow> {};

INSTANTIATE_TEST_SUITE_P(
    Thresholds, HistoryAge,
    testing::Values(
        AgeRow{"Nothing", 0, kNow, "less than a minute ago"}, AgeRow{"Millisecond", 1, kNow, "less than a minute ago"},
        AgeRow{"HalfAMinute", 30 * kSecond, kNow, "less than a minute ago"},
        AgeRow{"AlmostAMinute", kMinute - 1, kNow, "less than a minute ago"},
        AgeRow{"Minute", kMinute, kNow, "1  minutes ago"}, AgeRow{"BarelyAMinute", kMinute + 1, kNow, "1  minutes ago"},
        AgeRow{"AlmostTwoMinutes", 2 * kMinute - 1, kNow, "1  minutes ago"},
        AgeRow{"FiveMinutes", 5 * kMinute, kNow, "5  minutes ago"},
        AgeRow{"TenMinutes", 10 * kMinute, kNow, "10  minutes ago"},
        AgeRow{"AlmostAnHour", kHour - 1, kNow, "59  minutes ago"}, AgeRow{"Hour", kHour, kNow, "1 hours ago"},
        AgeRow{"AlmostTwoHours", 2 * kHour - 1, kNow, "1 hours ago"},
        AgeRow{"TwoHoursAndMinutes", 2 * kHour + 59 * kMinute, kNow, "2 hours ago"},
        AgeRow{"TenHours", 10 * kHour, kNow, "10 hours ago"},
        AgeRow{"AlmostADay", 23 * kHour + 59 * kMinute, kNow, "23 hours ago"},
        AgeRow{"MillisecondLessThanADay", kDay - 1, kNow, "23 hours ago"}, AgeRow{"Day", kDay, kNow, "Mar 4, 2024"},
        AgeRow{"DayAndHours", kDay + 5 * kHour, kNow, "Mar 4, 2024"}, AgeRow{"Years", 1000 * kDay, kNow, "Jun 9, 2021"},
        AgeRow{"MillisecondAhead", -1, kNow, "Mar 5, 2024"}, AgeRow{"DaysAhead", -30 * kDay, kNow, "Apr 4, 2024"}),
    support::rowName);

INSTANTIATE_TEST_SUITE_P(
    AcrossMidnight, HistoryAge,
    testing::Values(
        AgeRow{"Seconds", 20 * kSecond, 20000 * kDay + 5 * kSecond, "less than a minute ago"},
        AgeRow{"Minutes", 20 * kMinute, 20000 * kDay + 5 * kMinute, "20  minutes ago"},
        AgeRow{"Hours", 20 * kHour, 20000 * kDay + 5 * kHour, "20 hours ago"},
        AgeRow{"AlmostADay", kDay - 1, 20000 * kDay, "23 hours ago"}, AgeRow{"Day", kDay, 20000 * kDay, "Oct 3, 2024"}),
    support::rowName);

TEST_P(HistoryAge, IsToldInItsUnit)
{
    AgeRow const& row = GetParam();
    EXPECT_EQ(infoAt(row.now, item(row.now - row.age)), row.text);
}

struct DateRow {
    char const* name;
    std::int64_t date;
    char const* text;
};

class HistoryDate : public testing::TestWithParam<DateRow> {};

INSTANTIATE_TEST_SUITE_P(
    Dates, HistoryDate,
    testing::Values(
        DateRow{"OneDigit", 1704067200, "Jan 1, 2024"}, DateRow{"TwoDigits", 946684799, "Dec 31, 1999"},
        DateRow{"LeapDay", 1582934400, "Feb 29, 2020"}, DateRow{"Beginning", 0, "Jan 1, 1970"},
        DateRow{"BeforeTheBeginning", -1, "Dec 31, 1969"}, DateRow{"SmallYear", -62135596800, "Jan 1, 0001"},
        DateRow{"LargeYear", 253402300800, "Jan 1, 10000"}),
    support::rowName);

TEST_P(HistoryDate, IsWrittenOutFromADayOn)
{
    OdTimeStamp date;
    date.setPackedValue(GetParam().date);
    EXPECT_EQ(infoAt(kNow, HistoryItem(date, L"", L"", L"", 0)), GetParam().text);
}

TEST(HistoryDate, IsNotTurnedIntoLocalTime)
{
    setenv("TZ", "XXX-9:30", 1);
    tzset();
    EXPECT_EQ(infoAt(kNow, item(kNow - 10 * kDay)), "Feb 24, 2024");
    EXPECT_EQ(infoAt(kNow, item(kNow - kHour)), "1 hours ago");
    unsetenv("TZ");
    tzset();
}

TEST(HistoryDate, MayBeAnything)
{
    for (std::int64_t const seconds :
         {std::numeric_limits<std::int64_t>::min(), std::numeric_limits<std::int64_t>::max()}) {
        OdTimeStamp date;
        date.setPackedValue(seconds);
        EXPECT_FALSE(infoAt(kNow, HistoryItem(date, L"", L"", L"", 0)).empty());
    }
    EXPECT_EQ(infoAt(kNow, HistoryItem(OdTimeStamp(), L"", L"", L"", 0)), "Nov 24, -4713");
}

struct AuthorRow {
    char const* name;
    wchar_t const* author;
    char const* text;
};

class HistoryAuthor : public testing::TestWithParam<AuthorRow> {};

INSTANTIATE_TEST_SUITE_P(
    Authors, HistoryAuthor,
    testing::Values(
        AuthorRow{"WithDomain", L"ann@example.org", "ann \u2981 1 hours ago"},
        AuthorRow{"WithoutDomain", L"ann", "ann \u2981 1 hours ago"},
        AuthorRow{"TwoSigns", L"ann@bob@example.org", "ann \u2981 1 hours ago"},
        AuthorRow{"SignAtTheEnd", L"ann@", "ann \u2981 1 hours ago"},
        AuthorRow{"SignAtTheBeginning", L"@example.org", "example.org \u2981 1 hours ago"},
        AuthorRow{"SignAlone", L"@", "1 hours ago"}, AuthorRow{"Empty", L"", "1 hours ago"},
        AuthorRow{"Blanks", L" ann b ", " ann b  \u2981 1 hours ago"},
        AuthorRow{"BeyondAscii", L"J\u00FCrgen@example.org", "J\u00FCrgen \u2981 1 hours ago"},
        AuthorRow{"Placeholder", L"%ls%Y", "%ls%Y \u2981 1 hours ago"}),
    support::rowName);

TEST_P(HistoryAuthor, IsNamedBeforeTheTimeUpToTheFirstSign)
{
    EXPECT_EQ(infoAt(kNow, item(kNow - kHour, GetParam().author)), GetParam().text);
}

TEST(HistoryItem, TellsTheTimeAnewOnEveryCall)
{
    TestClock clock(kNow);
    HistoryItem const made = item(kNow, L"ann@example.org");
    clock.set(kNow);
    EXPECT_EQ(made.getInfo().toStdString(), "ann \u2981 less than a minute ago");
    clock.set(kNow + 5 * kMinute);
    EXPECT_EQ(made.getInfo().toStdString(), "ann \u2981 5  minutes ago");
    clock.set(kNow + kDay);
    EXPECT_EQ(made.getInfo().toStdString(), "ann \u2981 Mar 5, 2024");
}

TEST(HistoryItem, FollowsTheRealClock)
{
    OdTimeStamp date;
    date.setPackedValue(std::time(nullptr) - 150 * 60); // Half an hour away from either neighbour.
    EXPECT_EQ(HistoryItem(date, L"ann", L"", L"", 0).getInfo().toStdString(), "ann \u2981 2 hours ago");
}

TEST(HistoryItem, KeepsWhatItIsMadeOf)
{
    OdTimeStamp const date = stamp(kNow);
    HistoryItem const made(date, L"author", L"name", L"detail", -7);
    EXPECT_EQ(made.date, date);
    EXPECT_EQ(made.author, OdString(L"author"));
    EXPECT_EQ(made.name, OdString(L"name"));
    EXPECT_EQ(made.detail, OdString(L"detail"));
    EXPECT_EQ(made.number, -7);
}

TEST(HistoryItem, IsAListItem)
{
    HistoryItem made(OdTimeStamp(), L"author", L"n\u00E4me", L"detail", 7);
    qut::IListItem& listed = made;
    EXPECT_EQ(listed.getName().toStdString(), "n\u00E4me");
    EXPECT_EQ(listed.getLeftIconSource().toStdString(), "avatar-placeholder.svg");
    EXPECT_TRUE(listed.getRightIconSource().isNull());
    EXPECT_TRUE(listed.getWarning().isNull());
    EXPECT_FALSE(listed.getShowNameEdit());
    EXPECT_FALSE(listed.isChecked());
    EXPECT_EQ(listed.getActions(), nullptr);
    EXPECT_EQ(listed.getInfo(), made.getInfo());
}

TEST(HistoryItem, ShowsOnePictureForEverybody)
{
    EXPECT_EQ(item(kNow, L"ann").getLeftIconSource(), item(0, L"bob").getLeftIconSource());
    EXPECT_EQ(HistoryItem(OdTimeStamp(), L"", L"", L"", 0).getLeftIconSource().toStdString(), "avatar-placeholder.svg");
}

TEST(HistoryItem, IsNotChangedThroughTheList)
{
    HistoryItem made(OdTimeStamp(), L"author", L"name", L"detail", 7);
    qut::IListItem& listed = made;
    listed.setName(QStringLiteral("other"));
    listed.setShowNameEdit(true);
    listed.setChecked(true);
    EXPECT_EQ(listed.getName().toStdString(), "name");
    EXPECT_FALSE(listed.getShowNameEdit());
    EXPECT_FALSE(listed.isChecked());
}

TEST(HistoryItem, TranslatesThePhrasesAlone)
{
    Translations const translations(
        {"less than a minute ago", "minutes ago", "hours ago", "%#M  ", "%#H ", "%b %#d, %Y", "Mar", " \u2981 ", "ann",
         "name", "avatar-placeholder.svg"});
    EXPECT_EQ(infoAt(kNow, item(kNow, L"ann")), "ann \u2981 {less than a minute ago}");
    EXPECT_EQ(infoAt(kNow, item(kNow - 2 * kMinute, L"ann")), "ann \u2981 2  {minutes ago}");
    EXPECT_EQ(infoAt(kNow, item(kNow - 2 * kHour, L"ann")), "ann \u2981 2 {hours ago}");
    EXPECT_EQ(infoAt(kNow, item(kNow - 2 * kDay, L"ann")), "ann \u2981 Mar 3, 2024");
    EXPECT_EQ(item(kNow).getName().toStdString(), "name");
    EXPECT_EQ(item(kNow).getLeftIconSource().toStdString(), "avatar-placeholder.svg");
}

TEST(LoadedHistory, StartsEmpty)
{
    LoadedHistory const none;
    EXPECT_EQ(none.text, OdString::kEmpty);
    EXPECT_TRUE(none.items.empty());
}

TEST(LoadedHistory, StartsWithATextAndNoEntries)
{
    LoadedHistory history(L"loaded");
    EXPECT_EQ(history.text, OdString(L"loaded"));
    EXPECT_TRUE(history.items.empty());
    history.items.push_back(item(kNow));
    EXPECT_EQ(LoadedHistory(history).items.front().getName().toStdString(), "name");
}

} // namespace
