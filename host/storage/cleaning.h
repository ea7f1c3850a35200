/// Removing what nobody needs from the files of the storage.
#pragma once

#include "host/storage/local_storage.h"
#include "host/storage/record.h"

#include <set>
#include <string>
#include <vector>

namespace tav {

/// Names of the entries of `folder` in ascending order; none when it is missing. Throws `StorageError`.
std::vector<std::string> entriesOf(std::string const& folder);

/// Removes the file `path` and counts it in `freed`, as `contents` contents. Throws `StorageError`.
void removeCounted(std::string const& path, std::size_t contents, Freed& freed);

/// Leaves of the revision store `path`, NAME `name`, the revisions `digests` and those they build on, nothing else;
/// counts what went in `freed`. The new store is made as `path` with ".new" behind. Throws `StorageError`, with the
/// store as it was, when one of them cannot be read.
void reduceStore(
    std::string const& path, std::string const& name, std::set<DigestBytes> const& digests, std::string const& scratch,
    Freed& freed);

} // namespace tav
