/// How the working folder differs from the last commit.
#pragma once

#include "common/mu_common_diff.h"
#include "common/mu_common_state.h"

#include <vector>

namespace tav {

/// The files that the repository keeps. Throws `Failure` when the ignore rules cannot be used.
std::vector<common::File> scan(common::RootPath const& root);

/// Compares the files of the working folder with `committed`. A committed file whose modification time is the one in
/// the index is taken for unchanged without being read. Every list of the result is in the order of its source.
common::RepoChanges
compare(common::RootPath const& root, std::vector<common::VersionedFile> const& committed, common::State const& state);

/// Files that the ignore rules keep out of the repository, hidden ones excepted, in scan order.
std::vector<OdString> ignoredFiles(common::RootPath const& root);

} // namespace tav
