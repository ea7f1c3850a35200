/// From what the user types to commits.
#pragma once

#include "host/repository/local_database.h"

#include <string>

namespace tav {

/// The commit that `typed` means: the one that a branch or tag of that name points to; else the one of that number;
/// else the one whose hash begins so. An empty text means the commit that the working folder stands on. Throws
/// `Failure` when there is none, and when several hashes begin so.
CommitRecord findCommit(LocalDatabase const& database, std::string const& typed);

} // namespace tav
