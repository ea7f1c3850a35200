/// Digests of working files.
#pragma once

#include "platform/sdk/OdString.h"

#include <optional>

namespace tav {

/// The SHA-256 digest of the file `path` in lower-case hexadecimal digits; none when it cannot be read as a whole.
std::optional<OdString> fileDigest(OdString const& path);

} // namespace tav
