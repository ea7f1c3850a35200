/// Texts as the library takes them.
#pragma once

#include "platform/sdk/OdString.h"

#include <string_view>

namespace support {

/// The text that UTF-8 stands for; bytes that are not valid UTF-8 survive in it.
inline OdString fromUtf8(std::string_view bytes)
{
    return {bytes.data(), bytes.size(), CP_UTF_8};
}

} // namespace support
