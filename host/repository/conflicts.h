/// Drawings in conflict: their other versions wait in the conflict folder.
#pragma once

#include "common/mu_common_file_utils.h"

#include <vector>

namespace tav {

/// The drawings in conflict, in the order of paths. Throws `Failure` when the conflict folder cannot be read: what is
/// in it must not go unnoticed.
std::vector<common::ConflictInfo> openConflicts(common::RootPath const& root);

/// Throws `Failure`, which lists them, while drawings are in conflict: nobody has decided yet what they are to be.
void requireNoConflicts(common::RootPath const& root);

} // namespace tav
