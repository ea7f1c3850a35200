/// Dates as people type them.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace tav {

/// Seconds since 1970-01-01T00:00:00Z, both included. A date without a time is a whole day.
struct TimeSpan {
    std::int64_t first = 0;
    std::int64_t last = 0;
};

/// "2024-03-05", "2024-03-05 14:07", "2024-03-05T14:07:09", with a "Z" at the end in UTC and else in local time;
/// "today", "yesterday", "3 days ago", with minutes, hours, days, weeks, months or years before `now`.
std::optional<TimeSpan> parseDate(std::string const& typed, std::int64_t now);

/// "2024-03-05 14:07", in local time.
std::string localDate(std::int64_t date);

enum class DateForm { both, relative, absolute };

/// "3 days ago (2024-03-05 14:07)", in local time, or one of the two; a date behind `now` is absolute.
std::string shownDate(std::int64_t date, std::int64_t now, DateForm form = DateForm::both);

} // namespace tav
