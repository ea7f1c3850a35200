/// Finding the repository that a command works on.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <string>

namespace tav {

/// The repository whose working folder is `folder`; with an empty `folder`, the one that the current folder lies in,
/// looked for upwards. `folder` is in bytes, as the command line gave it.
/// Throws `Failure` when there is none, and as `requireOwnFolders` does.
common::RootPath openRepository(std::string const& folder);

/// Throws `Failure` when ".tav" or a folder in it is a link: commands remove there what is not needed, and what a link
/// leads to may be another repository's, or not even a repository. Also when the ignore file is there and is no file:
/// files would be offered for a commit that were meant to stay out.
void requireOwnFolders(common::RootPath const& root);

} // namespace tav
