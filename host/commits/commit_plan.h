/// What the next commit does to each path.
#pragma once

#include "host/changes/renames.h"

#include "common/mu_common_state.h"

#include <vector>

namespace tav {

struct PlannedFile {
    OdString path;
    common::FileChange change;
    OdString previousPath; ///< of a file that has been renamed, else empty
};

/// The staged files, the files that are missing from the working folder, and the renames that are not staged, in the
/// order of paths. Throws `Failure` for staged files that no longer exist.
std::vector<PlannedFile> planCommit(
    common::State const& state, common::RepoChanges const& changes, Renames const& found, Tree const& base,
    common::RootPath const& root);

/// Whether there are changed or new files, staged or not.
bool hasChanges(common::RepoChanges const& changes);

/// Throws a `Failure` that says why there is nothing to commit.
[[noreturn]] void failForNothing(common::RepoChanges const& changes, common::RootPath const& root);

} // namespace tav
