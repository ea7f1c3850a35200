/// Renames detected by content.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_diff.h"
#include "common/mu_common_state.h"

#include <map>
#include <set>

namespace tav {

/// Previous path by new path.
using Renames = std::map<OdString, OdString>;

/// Pairs new files with removed ones of the same content, each at most once: staged ones first, then in the order of
/// paths. Files whose removal or renaming is staged are left out, and so are empty files, which are all alike. Only new
/// files as long as a removed one are read.
Renames findRenames(
    common::RepoChanges const& changes, common::State const& state, LocalDatabase const& database,
    common::RootPath const& root);

/// The former paths of those of `renames` that are known to be moves: a file keeps its inode when it moves, and a copy
/// has a different one. A copy does not show that the original was removed on purpose.
std::set<OdString>
formerPathsOfMoves(Renames const& renames, LocalDatabase const& database, common::RootPath const& root);

} // namespace tav
