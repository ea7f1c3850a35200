/// What a killed 'tav rm' leaves in ".tav": files "removed-N" that waited there until the new state was safe.
#pragma once

#include "host/repository/local_database.h"
#include "host/storage/local_storage.h"

#include <string>
#include <vector>

namespace tav {

struct RemovedFiles {
    Freed freed;                   ///< those that are gone
    std::vector<std::string> kept; ///< full paths of those whose content is in no commit, or cannot be read there
};

/// Removes the files of killed commands whose content can be read from the storage. Throws `Failure`. The caller holds
/// the lock of the repository.
RemovedFiles cleanRemovedFiles(common::RootPath const& root, LocalDatabase const& database, LocalStorage& storage);

} // namespace tav
