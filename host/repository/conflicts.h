/// Drawings in conflict: those that have other versions in the conflict folder. Nothing here detects a conflict.
#pragma once

#include "common/mu_common_file_utils.h"

#include <vector>

namespace tav {

/// The drawings in conflict, in the order of paths. Throws `Failure` when the conflict folder cannot be read: its
/// contents must not go unnoticed.
std::vector<common::ConflictInfo> openConflicts(common::RootPath const& root);

/// Throws `Failure`, which lists them, while drawings are in conflict, that is, until the user has resolved them.
void requireNoConflicts(common::RootPath const& root);

} // namespace tav
