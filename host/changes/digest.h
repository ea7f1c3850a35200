/// Digests of working files.
#pragma once

#include "host/text/digest.h"

#include "platform/sdk/OdString.h"

#include <optional>

namespace tav {

/// The SHA-256 digest of the file `path`; none when it cannot be read as a whole.
std::optional<Digest> fileDigest(OdString const& path);

} // namespace tav
