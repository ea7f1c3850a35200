/// Lists of what is in the storage.
#pragma once

#include "host/storage/storage_layout.h"
#include "host/text/digest.h"

#include "platform/sdk/OdString.h"

#include <map>
#include <set>
#include <string>

namespace tav {

/// The revision stores: the name of each, and its path. Throws `StorageError`.
std::map<std::string, std::string> storesIn(StorageLayout const& layout);

/// The digests of all objects. Throws `StorageError`.
std::set<Digest> objectsIn(StorageLayout const& layout);

/// The URLs of all contents. Throws `StorageError`.
std::set<OdString> contentsIn(StorageLayout const& layout);

} // namespace tav
