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

/// The staged files, the files that are gone from the working folder, and the renames that nobody staged, in the order
/// of paths. Throws `Failure` for staged files that are not there any more.
std::vector<PlannedFile> planCommit(
    common::State const& state, common::RepoChanges const& changes, Renames const& found, Tree const& base,
    common::RootPath const& root);

/// Says why there is nothing to commit.
[[noreturn]] void failForNothing(common::RepoChanges const& changes, common::RootPath const& root);

} // namespace tav
