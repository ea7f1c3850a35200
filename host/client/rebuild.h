/// Making the database of a repository again when it is lost, and the contents and the server are whole.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <cstddef>
#include <cstdint>

namespace tav {

/// The server that the history is taken from.
struct RebuildSource {
    OdString server; ///< its folder
    bool isNamed;    ///< by the user, for this
};

/// What a database that was made again holds.
struct Rebuilt {
    std::int64_t commits = 0;
    std::int64_t base = 0;   ///< number of the commit that the working folder is assumed to be at; 0 for none
    std::size_t unknown = 0; ///< versions that are kept here and that no commit has
};

/// Makes the database from the history that the server keeps of this repository. That is the one which the list of
/// projects names for `folder`, the absolute path of the working folder; where the list does not know the folder, the
/// one that knows all versions which are kept here. A listed one that does not know them all is taken when the user has
/// named its server. The working folder is assumed to be at the end of its branch, and no file of it to be known.
/// Throws `Failure`; there is no database then, as before. The caller holds the lock of the repository.
Rebuilt rebuildDatabase(common::RootPath const& root, OdString const& folder, RebuildSource const& source);

} // namespace tav
