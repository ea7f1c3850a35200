/// Names that some file systems take for one.
#pragma once

#include "platform/sdk/OdString.h"

namespace tav {

/// The same for all forms of `path` that differ only in letter case or in the Unicode form of a character. Follows
/// Unicode's canonical caseless matching with simple case folding, as Qt has it.
OdString foldedName(OdString const& path);

} // namespace tav
