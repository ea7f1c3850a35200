/// Finding the repository that a command works on.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <optional>
#include <string>

namespace tav {

/// The repository whose working folder is `folder`; with an empty `folder`, the one that the current folder lies in,
/// looked for upwards. `folder` is in bytes, as the command line gave it.
/// Throws `Failure` when there is none, and as `requireOwnFiles` does.
common::RootPath openRepository(std::string const& folder);

/// The one that the current folder lies in; none where there is no repository.
std::optional<common::RootPath> repositoryHere();

/// Throws `Failure` when ".tav", a folder in it, its state, its settings or its database is a link: commands write and
/// remove there, and what a link leads to may be another repository's, or not even a repository. Also when the database
/// has another name: it is changed in place, by readers too when they find a change that was interrupted.
void requireOwnFiles(common::RootPath const& root);

} // namespace tav
