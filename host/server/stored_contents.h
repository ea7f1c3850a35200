/// Reading the contents of a server.
#pragma once

#include "host/server/stores.h"
#include "host/storage/chain.h"

namespace tav {

/// Finds the records of contents in one repository. Throws `StorageError` for one that it lacks. Keeps `stores` by
/// address.
FindBase contentsOf(Stores& stores, OdString const& repository);

/// Whether the content, with all that it builds on, can be read and has its digest. Throws `StorageError` when that
/// cannot be told.
bool isReadable(Stores& stores, OdString const& repository, Digest const& digest);

} // namespace tav
