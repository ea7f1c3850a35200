/// The files of a commit, as 'tav files' lists them. Does not access the working folder.
#pragma once

#include "host/repository/local_database.h"

namespace tav {

/// Prints the files that `commit` has, with their digests if `hash` is set.
void printCommittedFiles(LocalDatabase const& database, CommitRecord const& commit, bool hash, bool json);

/// Prints them with the commit that changed each of them last.
void printLastChanges(LocalDatabase& database, CommitRecord const& commit, bool json);

} // namespace tav
