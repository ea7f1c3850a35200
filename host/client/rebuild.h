/// Making the database of a repository again when it is lost, and the contents and the server are whole.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <cstdint>

namespace tav {

/// What a database that was made again holds.
struct Rebuilt {
    std::int64_t commits = 0;
    std::int64_t base = 0; ///< number of the commit that the working folder is taken to stand on; 0 when there is none
};

/// Makes the database from the history that the server in `server` keeps of this repository: the one that most of the
/// contents here belong to, of several the one that the list of projects names for `folder`, the absolute path of the
/// working folder. The working folder is taken to stand at the end of its branch, and no file of it to be
/// known. Throws `Failure`; there is no database then, as before. The caller holds the lock of the repository.
Rebuilt rebuildDatabase(common::RootPath const& root, OdString const& folder, OdString const& server);

} // namespace tav
