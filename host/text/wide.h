/// From the bytes of the command line and the system to the texts of the library.
#pragma once

#include "platform/sdk/OdString.h"

#include <cstddef>
#include <string>
#include <string_view>

namespace tav {

/// `bytes` as a text; those that are no valid UTF-8 survive.
inline OdString wide(std::string_view bytes)
{
    return OdString(bytes.data(), bytes.size(), CP_UTF_8);
}

/// "1 file", "2 files".
inline std::string counted(std::size_t count, std::string const& noun)
{
    return std::to_string(count) + " " + noun + (count == 1 ? "" : "s");
}

} // namespace tav
