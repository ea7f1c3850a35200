/// Moving files and folders to new names, without ever replacing anything.
#pragma once

#include "platform/mu_platform_export.h"

#include <string>
#include <system_error>

namespace os {

/// Gives the file or folder `from` the name `to` and waits until both folders are safe on the disk. Both are paths
/// below the folder `top` and on one file system. Neither leads through a link, not even through one that replaces a
/// folder during the call; `top` itself may be one. `std::errc::file_exists`, with nothing changed, when `to` exists.
/// `hasMoved` says whether the entry has its new name, which it keeps when flushing fails.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code
moveEntry(std::string const& top, std::string const& from, std::string const& to, bool& hasMoved);

} // namespace os
