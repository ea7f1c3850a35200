/// The names of commits.
#pragma once

#include "host/history/commit_tables.h"

#include <vector>

namespace tav {

/// The hash that names a commit follows from what is in it, its time and number excepted: its author, message, parents
/// and `files`, which are all of its files in any order. The same order gives the same commit, and nobody can give one
/// the name of another. Every version of tav makes it in this way.
OdString commitHash(CommitRecord const& commit, std::vector<FileRecord> const& files);

} // namespace tav
