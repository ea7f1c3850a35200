/// Working files as copies of stored versions: a content that is damaged in the storage may still be intact in the
/// working folder.
#pragma once

#include "host/repository/local_database.h"
#include "host/storage/local_storage.h"

#include <map>
#include <vector>

namespace tav {

/// Makes sure that the content at `url`, which the working file `path` has, can be read from the storage; stores it
/// again from that file where it cannot. True when it was stored again. Reads the stored content as a whole. Throws
/// `Failure` when the file remains the only copy; it must not be overwritten or removed then. The caller holds the lock
/// of the repository.
bool requireStored(LocalStorage& storage, OdString const& path, OdString const& url);

/// The contents at `urls` cannot be read. Stores again those that a working file has, and returns the path of that file
/// by URL. Only files as long as one of the contents are read. Throws `Failure`. The caller holds the lock of the
/// repository.
std::map<OdString, OdString> repairFromFolder(
    common::RootPath const& root, LocalDatabase const& database, LocalStorage& storage,
    std::vector<OdString> const& urls);

} // namespace tav
