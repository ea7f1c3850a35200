/// Checking the parts of a path for links before anything is written to it.
#pragma once

#include "platform/mu_platform_export.h"

#include <cstddef>
#include <string>
#include <system_error>

namespace os {

/// The first part of a path that would prevent a write from going where the path says.
struct Obstacle {
    enum class Kind {
        none,
        link,      ///< may lead elsewhere
        notFolder, ///< parts follow, but it is not a folder
        unknown,   ///< it could not be examined; `error` says why
    };

    Kind kind = Kind::none;
    std::size_t length = 0; ///< of the path up to and including that part, in bytes; 0 for the folder it starts in
    std::error_code error;
};

/// Examines the parts of `path` below the folder `top`, including the last one, and follows no link; `top` itself may
/// be one. Parts that do not exist yet are not obstacles. A part that becomes a link after this check is detected only
/// by callers that open the parts one by one, as `Batch` and `moveEntry` do.
MU_PLATFORM_EXPORT Obstacle findObstacle(std::string const& top, std::string const& path);

} // namespace os
