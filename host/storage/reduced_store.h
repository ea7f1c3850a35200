/// Rewriting a revision store without the revisions that nobody needs.
#pragma once

#include "host/storage/freed.h"
#include "host/text/digest.h"

#include <set>
#include <string>

namespace tav {

/// Leaves of the revision store `path`, called `name` in errors, the revisions `digests` and those that they build on.
/// Without any of them the store is removed. Returns what went.
///
/// The new form is written beside the old one, flushed, read back, and takes its place; a store that holds nothing else
/// is not touched. Throws `StorageError`, with the store as it was, when one of `digests` cannot be read. Large
/// contents on the way are in files without names in `scratch`.
Freed reduceStore(
    std::string const& path, std::string const& name, std::set<Digest> const& digests, std::string const& scratch);

} // namespace tav
