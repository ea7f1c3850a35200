/// Rebuilding the database of a repository when it is lost, but the contents and the server are intact.
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

/// What a rebuilt database has.
struct Rebuilt {
    std::int64_t commits = 0;
    std::int64_t base = 0;   ///< number of the commit that the working folder is assumed to be at; 0 for none
    std::size_t unknown = 0; ///< versions that are kept here and that no commit has
};

/// Builds the database from the history that the server keeps of this repository. The repository is the one that the
/// list of projects names for `folder`, the absolute path of the working folder; if the list does not have the folder,
/// it is the one that knows all versions kept here. A listed one that does not know all of them is used only if the
/// user has named its server. The working folder is assumed to be at the end of its branch, and none of its files are
/// known. Throws `Failure`; there is still no database then. The caller holds the lock of the repository.
Rebuilt rebuildDatabase(common::RootPath const& root, OdString const& folder, RebuildSource const& source);

} // namespace tav
