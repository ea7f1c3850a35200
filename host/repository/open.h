/// Finding the repository that a command works on.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <string>

namespace tav {

/// The repository whose working folder is `folder`; with an empty `folder`, the one that the current folder lies in,
/// looked for upwards. `folder` is in bytes, as the command line gave it.
/// Throws `Failure` when there is none.
common::RootPath openRepository(std::string const& folder);

} // namespace tav
