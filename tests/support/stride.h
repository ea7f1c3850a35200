/// How many of the moments at which something can fail are tried.
#pragma once

#include "tests/support/sanitized.h"

#include <cstdlib>

namespace support {

/// From one moment that is tried to the next one: every moment with MU_EVERY_STEP in the environment, which takes half
/// an hour on two cores; else what leaves time for everything else.
inline int stride(int usual, int sanitized)
{
    if (std::getenv("MU_EVERY_STEP") != nullptr) {
        return 1;
    }
    return kIsSanitized ? sanitized : usual;
}

} // namespace support
