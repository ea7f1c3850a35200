/// From the bytes of the command line and the system to the texts of the library.
#pragma once

#include "platform/sdk/OdString.h"

#include <string_view>

namespace tav {

/// `bytes` as a text. Bytes that are not valid UTF-8 are kept, and come back the same from `ansi_str`.
inline OdString fromUtf8(std::string_view bytes)
{
    return OdString(bytes.data(), bytes.size(), CP_UTF_8);
}

} // namespace tav
