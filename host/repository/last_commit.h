/// The commit that the working folder stands on.
#pragma once

#include "common/mu_common_repo_files.h"
#include "common/mu_common_repo_prop.h"

#include <vector>

namespace tav {

/// The files of that commit. Their storage paths carry the digests of their contents.
std::vector<common::VersionedFile> lastCommitFiles(common::RootPath const& root);

} // namespace tav
