/// The commit that the working folder is at.
#pragma once

#include "host/history/commit_tables.h"

#include "common/mu_common_repo_prop.h"

namespace tav {

/// The files of that commit. Throws `Failure` when the database cannot be used.
FileList lastCommitFiles(common::RootPath const& root);

} // namespace tav
