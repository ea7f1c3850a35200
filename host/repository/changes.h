/// How the working folder differs from the last commit.
#pragma once

#include "host/database/commit_tables.h"

#include "common/mu_common_diff.h"
#include "common/mu_common_state.h"

#include <cstdint>
#include <map>
#include <vector>

namespace tav {

/// The files that the repository keeps. Throws `Failure` when the ignore rules cannot be used.
std::vector<common::File> scan(common::RootPath const& root);

/// Modification times of files that were read and found to be as the last commit has them, by path.
using VerifiedTimes = std::map<OdString, std::uint64_t>;

/// Compares the files of the working folder with `committed`. A committed file whose modification time is the one in
/// the index is taken for unchanged without being read; those that were read are added to `verified`, if it is given.
/// The lists of working files are in scan order, that of removed ones in the order of paths.
common::RepoChanges
compare(common::RootPath const& root, Tree committed, common::State const& state, VerifiedTimes* verified = nullptr);

/// Enters the files that were read into the index, for a command that began at `start`.
void enterVerified(VerifiedTimes const& verified, std::uint64_t start, common::State& state);

/// Whether the working file `path` holds another content than the one stored at `url`. Reads the file.
bool hasOtherContent(OdString const& path, OdString const& url, common::RootPath const& root);

/// Files that the ignore rules keep out of the repository, hidden ones excepted, in scan order.
std::vector<OdString> ignoredFiles(common::RootPath const& root);

} // namespace tav
