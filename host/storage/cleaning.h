/// Removing what nobody needs from the storage.
#pragma once

#include "host/storage/freed.h"
#include "host/storage/storage_layout.h"
#include "host/storage/storage_url.h"
#include "host/text/digest.h"

#include <map>
#include <set>
#include <string>

namespace tav {

/// What a cleaning leaves.
struct Needed {
    /// Adds the content at `url`.
    void add(StorageUrl const& url);
    std::set<Digest> revisionsIn(std::string const& store) const;

    std::set<Digest> objects;
    std::map<std::string, std::set<Digest>> revisions; ///< by store
    std::set<std::string> storesLeftAlone;             ///< with all they hold
};

/// Removes everything but what is `needed` and the revisions that it builds on, and what interrupted operations have
/// left. Throws `StorageError`: at once when a folder cannot be read or a file not removed; in the end, of the first
/// such store, when stores stay as they are because something needed in them cannot be read.
Freed removeUnneeded(StorageLayout const& layout, Needed const& needed);

/// Removes only what interrupted operations have left. Throws `StorageError`.
Freed removeLeftovers(StorageLayout const& layout);

} // namespace tav
