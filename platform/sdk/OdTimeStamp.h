/// A moment in time, or a span between two, as a day number and the milliseconds of that day.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/sdk/OdString.h"

#include <cstdint>

/// A plain value. Nothing here follows the process's locale: names of days and months are the English abbreviations.
class MU_PLATFORM_EXPORT OdTimeStamp {
public:
    /// What a stamp is made with.
    enum InitialValue {
        kInitZero = 1,          ///< day 0, midnight
        kInitLocalTime = 2,     ///< now, as the local clock shows it
        kInitUniversalTime = 3, ///< now, in universal time
    };

    /// The same as `kInitZero`.
    OdTimeStamp() noexcept = default;
    /// Reads the clock unless `value` is `kInitZero`.
    explicit OdTimeStamp(InitialValue value);

    /// The Julian day number: 2440588 is 1970-01-01. For the difference of two stamps, the number of whole days.
    std::int64_t julianDay() const noexcept { return day_; }
    /// Milliseconds since midnight, 0 to 86,399,999.
    std::int32_t msecsPastMidnight() const noexcept { return msecs_; }

    /// Sets the moment from whole seconds since 1970-01-01T00:00:00Z, negative before it. Every value is accepted.
    void setPackedValue(std::int64_t seconds) noexcept;
    /// Whole seconds since 1970-01-01T00:00:00Z; the milliseconds are dropped towards the past.
    std::int64_t packedValue() const noexcept;

    /// Subtracts a moment, leaving the span: whole days (rounded down, so -1 when `other` is a little later) and the
    /// milliseconds beyond them.
    OdTimeStamp& operator-=(OdTimeStamp const& other) noexcept;

    /// Writes the moment into `out` by `pattern`. Supported after the percent sign: `Y` year, `m` month, `b` month's
    /// abbreviation, `d` day of the month, `a` day's abbreviation, `H` hour, `M` minute, `S` second, each with its
    /// leading zeros, and the percent sign itself. `#` in between drops leading zeros (`%#d`). Anything else is copied
    /// unchanged.
    void strftime(OdString const& pattern, OdString& out) const;
    /// Writes the moment into `out` in the form "Tue Mar  5 14:07:09 2024".
    void ctime(OdString& out) const;

    /// Whether both are the same millisecond.
    friend bool operator==(OdTimeStamp const& a, OdTimeStamp const& b) noexcept
    {
        return a.day_ == b.day_ && a.msecs_ == b.msecs_;
    }
    /// Whether they are different milliseconds.
    friend bool operator!=(OdTimeStamp const& a, OdTimeStamp const& b) noexcept { return !(a == b); }

private:
    std::int64_t day_ = 0;
    std::int32_t msecs_ = 0;
};
