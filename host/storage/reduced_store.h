/// Rewriting a revision store without the revisions that are not needed.
#pragma once

#include "host/storage/freed.h"
#include "host/text/digest.h"

#include <set>
#include <string>

namespace tav {

/// Reduces the revision store `path`, called `name` in errors, to the revisions `digests` and those that they build on.
/// If nothing remains, the store is removed. Returns what was removed.
///
/// The new store is written beside the old one, flushed, read back, and renamed over it; a store with nothing to remove
/// is not changed. Throws `StorageError`, and leaves the store unchanged, when one of `digests` cannot be read. Large
/// intermediate contents are in unnamed files in `scratch`.
Freed reduceStore(
    std::string const& path, std::string const& name, std::set<Digest> const& digests, std::string const& scratch);

} // namespace tav
