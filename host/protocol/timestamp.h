/// Times as documents write them: "2024-03-05T14:07:09Z", in UTC, to the second.
#pragma once

#include "platform/sdk/OdString.h"

#include <cstdint>
#include <optional>

namespace tav {

/// `seconds` are counted from 1970-01-01T00:00:00Z.
OdString timeText(std::int64_t seconds);

/// The way back; none for any other text, and for a day or time that does not exist.
std::optional<std::int64_t> secondsOf(OdString const& time);

} // namespace tav
