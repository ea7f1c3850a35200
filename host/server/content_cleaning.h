/// Removing what no commit needs.
#pragma once

#include "host/server/stores.h"
#include "host/storage/freed.h"

namespace tav {

/// Removes the contents of a repository that no commit names and nobody is about to name, uploads that are given up,
/// and what interrupted requests have left. Others may use the server meanwhile.
Freed cleanContents(Stores& stores, OdString const& repository);

} // namespace tav
