/// Removing what no commit needs from the storage.
#pragma once

#include "host/storage/freed.h"
#include "host/storage/storage_layout.h"
#include "host/storage/storage_url.h"
#include "host/text/digest.h"

#include <map>
#include <set>
#include <string>

namespace tav {

/// What a cleaning must keep.
struct Needed {
    /// Adds the content at `url`.
    void add(StorageUrl const& url);
    std::set<Digest> revisionsIn(std::string const& store) const;

    std::set<Digest> objects;
    std::map<std::string, std::set<Digest>> revisions; ///< by store
    std::set<std::string> storesLeftAlone;             ///< with everything in them
};

/// Removes everything but what is `needed` and what that builds on, and what interrupted operations have left. Throws
/// `StorageError`: immediately when a file cannot be removed; at the end, when stores were left unchanged because
/// something needed in them cannot be read, or all objects because it is not known what a needed one builds on.
Freed removeUnneeded(StorageLayout const& layout, Needed const& needed);

/// Removes only what interrupted operations have left. Throws `StorageError`.
Freed removeLeftovers(StorageLayout const& layout);

} // namespace tav
