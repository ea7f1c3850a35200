#include "host/text/dates.h"

#include "tests/support/rows.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <ctime>
#include <string>

namespace {

/// 2024-03-31T12:30:00Z, half a day after clocks in Vienna have changed.
constexpr std::int64_t kNow = 1'711'888'200;

std::string inUtc(std::int64_t seconds)
{
    auto const time = static_cast<std::time_t>(seconds);
    char text[32];
    std::strftime(text, sizeof text, "%Y-%m-%dT%H:%M:%SZ", std::gmtime(&time));
    return text;
}

struct Row {
    char const* name;
    char const* typed;
    char const* first; ///< null: it is no date
    char const* last;
};

class Dates : public testing::TestWithParam<Row> {
protected:
    Dates()
    {
        setenv("TZ", "CET-1CEST,M3.5.0,M10.5.0/3", 1);
        tzset();
    }
};

TEST_P(Dates, AreReadInLocalTimeUnlessTheyAreInUtc)
{
    auto const span = tav::parseDate(GetParam().typed, kNow);
    ASSERT_EQ(span.has_value(), GetParam().first != nullptr);
    if (span) {
        EXPECT_EQ(inUtc(span->first), GetParam().first);
        EXPECT_EQ(inUtc(span->last), GetParam().last);
    }
}

INSTANTIATE_TEST_SUITE_P(
    Typed, Dates,
    testing::Values(
        Row{"Day", "2024-03-05", "2024-03-04T23:00:00Z", "2024-03-05T22:59:59Z"},
        Row{"Minute", "2024-03-05 14:07", "2024-03-05T13:07:00Z", "2024-03-05T13:07:59Z"},
        Row{"Second", "2024-03-05T14:07:09", "2024-03-05T13:07:09Z", "2024-03-05T13:07:09Z"},
        Row{"Utc", "2024-03-05T14:07:09Z", "2024-03-05T14:07:09Z", "2024-03-05T14:07:09Z"},
        Row{"TodayIsAnHourShorter", "today", "2024-03-30T23:00:00Z", "2024-03-31T21:59:59Z"},
        Row{"Yesterday", "yesterday", "2024-03-29T23:00:00Z", "2024-03-30T22:59:59Z"},
        Row{"AMinuteAgo", "1 minute ago", "2024-03-31T12:29:00Z", "2024-03-31T12:29:00Z"},
        Row{"HoursAgo", "3 hours ago", "2024-03-31T09:30:00Z", "2024-03-31T09:30:00Z"},
        Row{"DaysAgoAtTheSameLocalTime", "3 days ago", "2024-03-28T13:30:00Z", "2024-03-28T13:30:00Z"},
        Row{"WeeksAgo", "2.weeks.ago", "2024-03-17T13:30:00Z", "2024-03-17T13:30:00Z"},
        Row{"MonthsAgo", "3 months ago", "2023-12-31T13:30:00Z", "2023-12-31T13:30:00Z"},
        Row{"YearsAgo", "1 year ago", "2023-03-31T12:30:00Z", "2023-03-31T12:30:00Z"},
        Row{"NoSuchMonth", "2024-13-05", nullptr, nullptr}, Row{"NoSuchDay", "2023-02-29", nullptr, nullptr},
        Row{"NoSuchHour", "2024-03-05 24:00", nullptr, nullptr},
        Row{"NoSuchUnit", "3 fortnights ago", nullptr, nullptr}, Row{"OtherWords", "tomorrow", nullptr, nullptr},
        Row{"Nothing", "", nullptr, nullptr}),
    support::rowName);

} // namespace
