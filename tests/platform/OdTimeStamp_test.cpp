#include "platform/sdk/OdTimeStamp.h"
#include "tests/support/rows.h"

#include <array>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <gmock/gmock.h>
#include <string>

namespace {

OdTimeStamp at(std::int64_t seconds)
{
    OdTimeStamp stamp;
    stamp.setPackedValue(seconds);
    return stamp;
}

std::string formatted(OdTimeStamp const& stamp, OdString const& pattern)
{
    OdString text;
    stamp.strftime(pattern, text);
    return text.ansi_str();
}

std::string rendered(OdTimeStamp const& stamp)
{
    OdString text;
    stamp.ctime(text);
    return text.ansi_str();
}

constexpr std::int64_t kAfternoon = 1709647629; // 2024-03-05T14:07:09Z, a Tuesday

TEST(OdTimeStamp, IsZeroWhenMade)
{
    EXPECT_EQ(OdTimeStamp(), OdTimeStamp(OdTimeStamp::kInitZero));
    EXPECT_EQ(OdTimeStamp().julianDay(), 0);
    EXPECT_EQ(OdTimeStamp().msecsPastMidnight(), 0);
}

TEST(OdTimeStamp, NumbersOfTheInitialValuesAreFixed)
{
    EXPECT_EQ(static_cast<int>(OdTimeStamp::kInitZero), 1);
    EXPECT_EQ(static_cast<int>(OdTimeStamp::kInitLocalTime), 2);
    EXPECT_EQ(static_cast<int>(OdTimeStamp::kInitUniversalTime), 3);
}

TEST(OdTimeStamp, KnowsTheUniversalTime)
{
    std::int64_t const before = std::time(nullptr);
    OdTimeStamp const now(OdTimeStamp::kInitUniversalTime);
    std::int64_t const after = std::time(nullptr) + 1; // time() lags behind the exact clock by up to a tick.
    EXPECT_GE(now.packedValue(), before);
    EXPECT_LE(now.packedValue(), after);
}

TEST(OdTimeStamp, KnowsMilliseconds)
{
    bool seen = false;
    for (int i = 0; i < 1'000'000 && !seen; ++i) {
        seen = OdTimeStamp(OdTimeStamp::kInitUniversalTime).msecsPastMidnight() % 1000 != 0;
    }
    EXPECT_TRUE(seen);
}

// Sets the time zone of the process for a test.
class TimeZone {
public:
    explicit TimeZone(char const* zone)
    {
        char const* const before = std::getenv("TZ");
        wasSet_ = before != nullptr;
        before_ = wasSet_ ? before : "";
        setenv("TZ", zone, 1);
        tzset();
    }
    TimeZone(TimeZone const&) = delete;
    TimeZone& operator=(TimeZone const&) = delete;
    ~TimeZone()
    {
        wasSet_ ? setenv("TZ", before_.c_str(), 1) : unsetenv("TZ");
        tzset();
    }

private:
    bool wasSet_ = false;
    std::string before_;
};

class OdTimeStampInZone : public testing::TestWithParam<std::pair<char const*, int>> {};

TEST_P(OdTimeStampInZone, ShowsTheLocalClock)
{
    TimeZone const zone(GetParam().first);
    OdTimeStamp const universal(OdTimeStamp::kInitUniversalTime);
    OdTimeStamp const local(OdTimeStamp::kInitLocalTime);
    EXPECT_NEAR(
        static_cast<double>(local.packedValue() - universal.packedValue()), static_cast<double>(GetParam().second), 2);
}

INSTANTIATE_TEST_SUITE_P(
    Zones, OdTimeStampInZone,
    testing::Values(
        std::pair{"UTC0", 0}, std::pair{"IST-5:30", 19800}, std::pair{"NST3:30", -12600}, std::pair{"FAR-14", 50400}));

TEST(OdTimeStamp, HasTheJulianDayOfTheEpoch)
{
    EXPECT_EQ(at(0).julianDay(), 2440588);
    EXPECT_EQ(at(0).msecsPastMidnight(), 0);
    EXPECT_EQ(at(-1).julianDay(), 2440587);
    EXPECT_EQ(at(-1).msecsPastMidnight(), 86'399'000);
    EXPECT_EQ(at(86'399).julianDay(), 2440588);
    EXPECT_EQ(at(86'400).julianDay(), 2440589);
}

TEST(OdTimeStamp, GivesBackEveryPackedValue)
{
    for (std::int64_t const seconds :
         {INT64_MIN, INT64_MIN + 1, INT64_MIN + 86'400, std::int64_t{-86'401}, std::int64_t{-86'400}, std::int64_t{-1},
          std::int64_t{0}, std::int64_t{86'399}, std::int64_t{86'400}, kAfternoon, INT64_MAX - 1, INT64_MAX}) {
        EXPECT_EQ(at(seconds).packedValue(), seconds);
        EXPECT_GE(at(seconds).msecsPastMidnight(), 0);
        EXPECT_LT(at(seconds).msecsPastMidnight(), 86'400'000);
    }
}

TEST(OdTimeStamp, DropsMillisecondsTowardsThePast)
{
    OdTimeStamp const now(OdTimeStamp::kInitUniversalTime);
    OdTimeStamp const whole = at(now.packedValue());
    EXPECT_EQ(whole.julianDay(), now.julianDay());
    EXPECT_EQ(whole.msecsPastMidnight(), now.msecsPastMidnight() / 1000 * 1000);
}

TEST(OdTimeStamp, AreEqualWithTheSameDayAndTime)
{
    EXPECT_TRUE(at(5) == at(5));
    EXPECT_FALSE(at(5) != at(5));
    EXPECT_TRUE(at(5) != at(6));
    EXPECT_TRUE(at(5) != at(5 + 86'400));
}

struct Span {
    char const* name;
    std::int64_t later;
    std::int64_t earlier;
    std::int64_t days;
    std::int32_t msecs;
};

void PrintTo(Span const& row, std::ostream* out)
{
    *out << row.name;
}

class OdTimeStampSpan : public testing::TestWithParam<Span> {};

TEST_P(OdTimeStampSpan, HasWholeDaysAndTheRest)
{
    OdTimeStamp span = at(GetParam().later);
    OdTimeStamp const& result = span -= at(GetParam().earlier);
    EXPECT_EQ(&result, &span);
    EXPECT_EQ(span.julianDay(), GetParam().days);
    EXPECT_EQ(span.msecsPastMidnight(), GetParam().msecs);
}

INSTANTIATE_TEST_SUITE_P(
    Spans, OdTimeStampSpan,
    testing::Values(
        Span{"Nothing", 5, 5, 0, 0}, Span{"OneSecond", 6, 5, 0, 1000}, Span{"OverMidnight", 86'401, 86'399, 0, 2000},
        Span{"JustUnderADay", 86'400 + 4, 5, 0, 86'399'000}, Span{"OneDay", 86'400 + 5, 5, 1, 0},
        Span{"LaterByOneSecond", 5, 6, -1, 86'399'000}, Span{"LaterByOneDay", 5, 86'405, -1, 0},
        Span{"WholeRange", INT64_MAX, INT64_MIN, 213'503'982'334'601, 25'215'000}),
    support::rowName);

TEST(OdTimeStamp, CanBeSubtractedFromItself)
{
    OdTimeStamp stamp = at(kAfternoon);
    OdTimeStamp const& itself = stamp;
    stamp -= itself;
    EXPECT_EQ(stamp, OdTimeStamp());
}

struct Format {
    char const* name;
    std::int64_t seconds;
    wchar_t const* pattern;
    char const* text;
};

void PrintTo(Format const& row, std::ostream* out)
{
    *out << row.name;
}

class OdTimeStampFormat : public testing::TestWithParam<Format> {};

TEST_P(OdTimeStampFormat, GivesThisText)
{
    EXPECT_EQ(formatted(at(GetParam().seconds), GetParam().pattern), GetParam().text);
}

constexpr std::int64_t kEarly = 1704164645; // 2024-01-02T03:04:05Z

INSTANTIATE_TEST_SUITE_P(
    Patterns, OdTimeStampFormat,
    testing::Values(
        Format{"DateOfACommit", kAfternoon, L"%Y-%m-%dT%H:%M:%SZ", "2024-03-05T14:07:09Z"},
        Format{"DateInTheHistory", kAfternoon, L"%b %#d, %Y", "Mar 5, 2024"},
        Format{"Weekday", kAfternoon, L"%a", "Tue"},
        Format{"LeadingZeros", kEarly, L"%m|%d|%H|%M|%S", "01|02|03|04|05"},
        Format{"NoLeadingZeros", kEarly, L"%#m|%#d|%#H|%#M|%#S", "1|2|3|4|5"},
        Format{"NoLeadingZerosOfNothing", 0, L"%#H:%#M:%#S", "0:0:0"},
        Format{"NothingToDrop", kAfternoon, L"%#a %#b %#Y %#%", "Tue Mar 2024 %"},
        Format{"PercentSign", kAfternoon, L"100%%", "100%"},
        Format{"PercentSignBeforeALetter", kAfternoon, L"%%d", "%d"}, Format{"Empty", kAfternoon, L"", ""},
        Format{"PlainText", kAfternoon, L"plan \u20AC", "plan \xE2\x82\xAC"},
        Format{"UnknownLetter", kAfternoon, L"%q%d", "%q05"},
        Format{"UnknownLetterAfterTheHash", kAfternoon, L"%#q%d", "%#q05"},
        Format{"PercentSignAtTheEnd", kAfternoon, L"%d%", "05%"}, Format{"HashAtTheEnd", kAfternoon, L"%d%#", "05%#"},
        Format{"TwoHashes", kAfternoon, L"%##d", "%##d"}, Format{"YearBefore1000", -62135596800, L"%Y|%#Y", "0001|1"},
        Format{"YearZero", -62167219200, L"%Y|%#Y", "0000|0"},
        Format{"YearBeforeZero", -62167219201, L"%Y-%m-%d|%#Y", "-0001-12-31|-1"},
        Format{"FiveDigitYear", 253402300800, L"%Y-%m-%d %a", "10000-01-01 Sat"},
        Format{"LastMoment", INT64_MAX, L"%Y-%m-%dT%H:%M:%S", "292277026596-12-04T15:30:07"},
        Format{"FirstMoment", INT64_MIN, L"%Y-%m-%dT%H:%M:%S", "-292277022657-01-27T08:29:52"}),
    support::rowName);

TEST(OdTimeStamp, FormatsIntoItsOwnPattern)
{
    OdString text = L"%d %b";
    at(kAfternoon).strftime(text, text);
    EXPECT_EQ(text, OdString(L"05 Mar"));
}

TEST(OdTimeStamp, FormatKeepsNulsOfThePattern)
{
    EXPECT_EQ(
        formatted(at(kAfternoon), OdString(L"%d\0%d", 5)), std::string(
                                                               "05\0"
                                                               "05",
                                                               5));
}

TEST(OdTimeStamp, RendersLikeTheSystem)
{
    EXPECT_EQ(rendered(at(kAfternoon)), "Tue Mar  5 14:07:09 2024");
    EXPECT_EQ(rendered(at(0)), "Thu Jan  1 00:00:00 1970");
    EXPECT_EQ(rendered(at(-1)), "Wed Dec 31 23:59:59 1969");
}

// Every 61st day of 8,000 years, each at another time of the day, against the C library.
TEST(OdTimeStamp, AgreesWithTheCalendarOfTheSystem)
{
    for (std::int64_t day = -719'000; day < 2'900'000; day += 61) {
        std::time_t const seconds = day * 86'400 + (day * 7'919 % 86'400 + 86'400) % 86'400;
        std::tm parts{};
        ASSERT_NE(gmtime_r(&seconds, &parts), nullptr);
        std::array<char, 64> expected{};
        ASSERT_NE(std::strftime(expected.data(), expected.size(), "%m-%d %a %b %H:%M:%S", &parts), 0U);
        std::array<char, 32> year{};
        std::snprintf(year.data(), year.size(), "%04d-", parts.tm_year + 1900);
        ASSERT_EQ(formatted(at(seconds), L"%Y-%m-%d %a %b %H:%M:%S"), std::string(year.data()) + expected.data());
    }
}

} // namespace
