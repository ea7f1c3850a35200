#include "host/protocol/timestamp.h"

#include "platform/sdk/OdTimeStamp.h"

#include <algorithm>
#include <cstddef>
#include <ctime>
#include <string_view>
#include <tuple>

namespace tav {

namespace {

int numberAt(OdString const& text, std::size_t first, std::size_t count)
{
    int number = 0;
    for (std::size_t i = first; i < first + count; ++i) {
        number = number * 10 + (text.getAt(i) - L'0');
    }
    return number;
}

bool hasFormOfTime(OdString const& text)
{
    constexpr std::wstring_view kForm = L"0000-00-00T00:00:00Z";
    wchar_t const* const begin = text.c_str();
    return text.getLength() == kForm.size() &&
           std::equal(kForm.begin(), kForm.end(), begin, [](wchar_t form, wchar_t c) {
               return form == L'0' ? c >= L'0' && c <= L'9' : form == c;
           });
}

auto fields(std::tm const& time)
{
    return std::make_tuple(time.tm_year, time.tm_mon, time.tm_mday, time.tm_hour, time.tm_min, time.tm_sec);
}

} // namespace

OdString timeText(std::int64_t seconds)
{
    OdTimeStamp time;
    time.setPackedValue(seconds);
    OdString text;
    time.strftime(L"%Y-%m-%dT%H:%M:%SZ", text);
    return text;
}

// A time that does not exist, such as 30 February, comes back from the calendar as another one.
std::optional<std::int64_t> secondsOf(OdString const& time)
{
    if (!hasFormOfTime(time)) {
        return std::nullopt;
    }
    std::tm written{};
    written.tm_year = numberAt(time, 0, 4) - 1900;
    written.tm_mon = numberAt(time, 5, 2) - 1;
    written.tm_mday = numberAt(time, 8, 2);
    written.tm_hour = numberAt(time, 11, 2);
    written.tm_min = numberAt(time, 14, 2);
    written.tm_sec = numberAt(time, 17, 2);
    std::tm normalised = written;
    std::time_t const seconds = timegm(&normalised);
    return fields(normalised) == fields(written) ? std::optional<std::int64_t>(seconds) : std::nullopt;
}

} // namespace tav
