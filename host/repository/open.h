/// Finding the repository that a command works on.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <optional>
#include <string>

namespace tav {

/// The repository whose working folder is `folder`; with an empty `folder`, the one that contains the current folder,
/// searching parent folders. `folder` is in bytes, as given on the command line.
/// Throws `Failure` when there is none, and as `requireOwnFiles` does.
common::RootPath openRepository(std::string const& folder);

/// The repository that contains the current folder, if any.
std::optional<common::RootPath> repositoryHere();

/// Throws `Failure` when ".tav", a folder in it, its state, its settings or its database is a link: commands write and
/// remove there, and a link may lead to another repository or to no repository at all. Also throws when the database
/// has another hard link: it is changed in place, even by readers when they find an interrupted change.
void requireOwnFiles(common::RootPath const& root);

} // namespace tav
