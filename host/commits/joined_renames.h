/// The renames of a commit that takes the place of another one.
#pragma once

#include "host/history/commit_tables.h"

#include <map>

namespace tav {

/// Former path by path. `since` has been renamed after the commit `replaced`, and `files` are those of the new commit.
/// The result is against the first parent of `replaced`: a file that it renamed and that has been renamed again has
/// its first path, and a file that it added has none.
std::map<OdString, OdString> joinedRenames(
    std::map<OdString, OdString> const& since, Tree const& files, CommitTables const& commits,
    CommitRecord const& replaced);

} // namespace tav
