#include "host/text/dates.h"

#include "host/text/plural.h"

#include <array>
#include <cstddef>
#include <cstdlib>
#include <ctime>
#include <regex>

namespace tav {

namespace {

std::tm localTime(std::int64_t seconds)
{
    auto const time = static_cast<std::time_t>(seconds);
    std::tm parts{};
    localtime_r(&time, &parts);
    return parts;
}

std::int64_t secondsOf(std::tm parts)
{
    parts.tm_isdst = -1;
    return std::mktime(&parts);
}

TimeSpan dayOf(std::tm parts)
{
    parts.tm_hour = parts.tm_min = parts.tm_sec = 0;
    std::int64_t const first = secondsOf(parts);
    ++parts.tm_mday; // Not 24 hours: the days on which clocks change are shorter and longer.
    return {first, secondsOf(parts) - 1};
}

int numberOf(std::ssub_match const& digits)
{
    return digits.matched ? std::atoi(digits.str().c_str()) : 0;
}

/// Whether the parts are those of a day and a time that exist.
bool isReal(std::tm const& parts)
{
    std::tm normal = parts;
    normal.tm_isdst = -1;
    timegm(&normal);
    return normal.tm_mday == parts.tm_mday && normal.tm_mon == parts.tm_mon && parts.tm_hour < 24 &&
           parts.tm_min < 60 && parts.tm_sec < 60;
}

std::optional<TimeSpan> calendarDate(std::string const& typed)
{
    static std::regex const form("(\\d{4})-(\\d\\d)-(\\d\\d)(?:[ T](\\d\\d):(\\d\\d)(?::(\\d\\d))?(Z?))?");
    std::smatch match;
    if (!std::regex_match(typed, match, form)) {
        return std::nullopt;
    }
    std::tm parts{};
    parts.tm_year = numberOf(match[1]) - 1900;
    parts.tm_mon = numberOf(match[2]) - 1;
    parts.tm_mday = numberOf(match[3]);
    parts.tm_hour = numberOf(match[4]);
    parts.tm_min = numberOf(match[5]);
    parts.tm_sec = numberOf(match[6]);
    if (!isReal(parts)) {
        return std::nullopt;
    }
    if (!match[4].matched) {
        return dayOf(parts);
    }
    std::int64_t const first = match[7].length() > 0 ? timegm(&parts) : secondsOf(parts);
    return TimeSpan{first, match[6].matched ? first : first + 59};
}

struct Unit {
    char const* name;
    int std::tm::*part;
    int count;
};

constexpr std::array kUnits = {Unit{"minute", &std::tm::tm_min, 1}, Unit{"hour", &std::tm::tm_hour, 1},
                               Unit{"day", &std::tm::tm_mday, 1},   Unit{"week", &std::tm::tm_mday, 7},
                               Unit{"month", &std::tm::tm_mon, 1},  Unit{"year", &std::tm::tm_year, 1}};

std::optional<TimeSpan> timeAgo(std::string const& typed, std::int64_t now)
{
    static std::regex const form("(\\d{1,4})[ .]([a-z]+?)s?[ .]ago");
    std::smatch match;
    if (!std::regex_match(typed, match, form)) {
        return std::nullopt;
    }
    for (Unit const& unit : kUnits) {
        if (match[2] == unit.name) {
            std::tm parts = localTime(now);
            parts.*unit.part -= unit.count * numberOf(match[1]);
            std::int64_t const then = secondsOf(parts);
            return TimeSpan{then, then};
        }
    }
    return std::nullopt;
}

std::string age(std::int64_t seconds)
{
    constexpr std::int64_t kMinute = 60;
    constexpr std::int64_t kHour = 60 * kMinute;
    constexpr std::int64_t kDay = 24 * kHour;
    auto const ago = [&](std::int64_t unit, char const* name) {
        return counted(static_cast<std::size_t>(seconds / unit), name) + " ago";
    };
    if (seconds < kMinute) {
        return "less than a minute ago";
    }
    if (seconds < kHour) {
        return ago(kMinute, "minute");
    }
    if (seconds < kDay) {
        return ago(kHour, "hour");
    }
    if (seconds < 14 * kDay) {
        return ago(kDay, "day");
    }
    if (seconds < 60 * kDay) {
        return ago(7 * kDay, "week");
    }
    return seconds < 730 * kDay ? ago(30 * kDay, "month") : ago(365 * kDay, "year");
}

} // namespace

std::string localDate(std::int64_t date)
{
    std::tm const parts = localTime(date);
    std::array<char, 64> text{};
    std::strftime(text.data(), text.size(), "%Y-%m-%d %H:%M", &parts);
    return text.data();
}

std::string shownDate(std::int64_t date, std::int64_t now, DateForm form)
{
    if (date > now || form == DateForm::absolute) {
        return localDate(date);
    }
    return form == DateForm::relative ? age(now - date) : age(now - date) + " (" + localDate(date) + ")";
}

std::optional<TimeSpan> parseDate(std::string const& typed, std::int64_t now)
{
    if (typed == "today" || typed == "yesterday") {
        std::tm parts = localTime(now);
        parts.tm_mday -= typed == "today" ? 0 : 1;
        return dayOf(parts);
    }
    auto const date = calendarDate(typed);
    return date ? date : timeAgo(typed, now);
}

} // namespace tav
