/// Renames that nobody told of.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_diff.h"

#include <map>

namespace tav {

/// Previous path by new path.
using Renames = std::map<OdString, OdString>;

/// Pairs new files with removed ones of the same content, each at most once, in the order of paths. Only new files as
/// long as a removed one are read.
Renames findRenames(common::RepoChanges const& changes, LocalDatabase const& database, common::RootPath const& root);

} // namespace tav
