#include "platform/sdk/OdTimeStamp.h"

#include <array>
#include <chrono>
#include <ctime>
#include <string>

namespace {

constexpr std::int64_t kUnixEpochDay = 2440588; // the Julian day number of 1970-01-01
constexpr std::int64_t kSecondsPerDay = 86400;
constexpr std::int32_t kMsecsPerDay = 86400000;

constexpr std::array<wchar_t const*, 7> kWeekdays{L"Mon", L"Tue", L"Wed", L"Thu", L"Fri", L"Sat", L"Sun"};
constexpr std::array<wchar_t const*, 12> kMonths{L"Jan", L"Feb", L"Mar", L"Apr", L"May", L"Jun",
                                                 L"Jul", L"Aug", L"Sep", L"Oct", L"Nov", L"Dec"};

struct Date {
    std::int64_t year;
    std::int64_t month; // 1 to 12
    std::int64_t day;   // 1 to 31
};

// Rounds down, so that moments before an epoch fall into the day they belong to.
std::int64_t floorDivide(std::int64_t value, std::int64_t by)
{
    return value / by - (value % by < 0 ? 1 : 0);
}

std::int64_t floorRemainder(std::int64_t value, std::int64_t by)
{
    std::int64_t const remainder = value % by;
    return remainder < 0 ? remainder + by : remainder;
}

// The Gregorian calendar repeats after 400 years, which have 146,097 days. Counting years from the first of March
// puts the leap day at their end, where it shifts no other day.
Date dateOf(std::int64_t julianDay)
{
    constexpr std::int64_t kFirstOfMarchOfYear0 = 1721120;
    constexpr std::int64_t kDaysPerCycle = 146097;
    std::int64_t const days = julianDay - kFirstOfMarchOfYear0;
    std::int64_t const dayOfCycle = floorRemainder(days, kDaysPerCycle);
    std::int64_t const yearOfCycle = (dayOfCycle - dayOfCycle / 1460 + dayOfCycle / 36524 - dayOfCycle / 146096) / 365;
    std::int64_t const dayOfYear = dayOfCycle - (365 * yearOfCycle + yearOfCycle / 4 - yearOfCycle / 100);
    std::int64_t const monthFromMarch = (5 * dayOfYear + 2) / 153;
    std::int64_t const month = monthFromMarch < 10 ? monthFromMarch + 3 : monthFromMarch - 9;
    std::int64_t const year = floorDivide(days, kDaysPerCycle) * 400 + yearOfCycle + (month <= 2 ? 1 : 0);
    return {year, month, dayOfYear - (153 * monthFromMarch + 2) / 5 + 1};
}

std::wstring padded(std::int64_t value, std::size_t width, wchar_t padding)
{
    std::wstring digits = std::to_wstring(value < 0 ? -value : value);
    if (digits.size() < width) {
        digits.insert(0, width - digits.size(), padding);
    }
    return value < 0 ? L"-" + digits : digits;
}

// The moment taken apart, and how each part is written.
class Parts {
public:
    Parts(std::int64_t julianDay, std::int32_t msecs)
        : date_(dateOf(julianDay))
        , weekday_(static_cast<std::size_t>(floorRemainder(julianDay, 7)))
        , second_(msecs / 1000)
    {
    }

    // Empty for an unknown letter.
    std::wstring text(wchar_t letter, bool keepZeros) const
    {
        std::size_t const two = keepZeros ? 2 : 0;
        switch (letter) {
        case L'Y': return padded(date_.year, two * 2, L'0');
        case L'm': return padded(date_.month, two, L'0');
        case L'b': return month();
        case L'd': return padded(date_.day, two, L'0');
        case L'a': return weekday();
        case L'H': return padded(second_ / 3600, two, L'0');
        case L'M': return padded(second_ / 60 % 60, two, L'0');
        case L'S': return padded(second_ % 60, two, L'0');
        case L'%': return L"%";
        default: return {};
        }
    }

    std::wstring weekday() const { return kWeekdays[weekday_]; }
    std::wstring month() const { return kMonths[static_cast<std::size_t>(date_.month - 1)]; }
    std::wstring day() const { return padded(date_.day, 2, L' '); }

private:
    Date date_;
    std::size_t weekday_;
    std::int64_t second_;
};

// Seconds by which the local clock is ahead of universal time at `moment`.
std::int64_t localOffset(std::int64_t moment)
{
    std::time_t const time = moment;
    std::tm local{};
    return localtime_r(&time, &local) == nullptr ? 0 : local.tm_gmtoff;
}

} // namespace

OdTimeStamp::OdTimeStamp(InitialValue value)
{
    if (value == kInitZero) {
        return;
    }
    auto const sinceEpoch = std::chrono::system_clock::now().time_since_epoch();
    std::int64_t const msecs = std::chrono::duration_cast<std::chrono::milliseconds>(sinceEpoch).count();
    std::int64_t const seconds = floorDivide(msecs, 1000);
    setPackedValue(value == kInitLocalTime ? seconds + localOffset(seconds) : seconds);
    msecs_ += static_cast<std::int32_t>(floorRemainder(msecs, 1000));
}

void OdTimeStamp::setPackedValue(std::int64_t seconds) noexcept
{
    day_ = floorDivide(seconds, kSecondsPerDay) + kUnixEpochDay;
    msecs_ = static_cast<std::int32_t>(floorRemainder(seconds, kSecondsPerDay) * 1000);
}

std::int64_t OdTimeStamp::packedValue() const noexcept
{
    // Without signs: the first day of the range begins before the range does.
    auto const days = static_cast<std::uint64_t>(day_ - kUnixEpochDay);
    return static_cast<std::int64_t>(days * kSecondsPerDay + static_cast<std::uint64_t>(msecs_ / 1000));
}

OdTimeStamp& OdTimeStamp::operator-=(OdTimeStamp const& other) noexcept
{
    day_ -= other.day_;
    msecs_ -= other.msecs_;
    if (msecs_ < 0) {
        msecs_ += kMsecsPerDay;
        --day_;
    }
    return *this;
}

void OdTimeStamp::strftime(OdString const& pattern, OdString& out) const
{
    Parts const parts(day_, msecs_);
    OdString result; // `out` may be the pattern.
    for (std::size_t i = 0; i < pattern.getLength();) {
        bool const hash = pattern.mid(i, 2) == OdString(L"%#");
        std::size_t const letter = i + (hash ? 2 : 1);
        std::wstring const text = pattern.getAt(i) == L'%' && letter < pattern.getLength()
                                      ? parts.text(pattern.getAt(letter), !hash)
                                      : std::wstring();
        if (text.empty()) {
            result += pattern.getAt(i++);
        } else {
            result += text.c_str();
            i = letter + 1;
        }
    }
    out = result;
}

void OdTimeStamp::ctime(OdString& out) const
{
    Parts const parts(day_, msecs_);
    OdString time;
    strftime(L"%H:%M:%S %Y", time);
    out.format(L"%ls %ls %ls %ls", parts.weekday().c_str(), parts.month().c_str(), parts.day().c_str(), time.c_str());
}
