/// What the commands change in the working state.
#pragma once

#include "host/repository/journal.h"

#include "common/mu_common_state.h"

#include <cstddef>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace tav {

/// What keeps a file of this name out of every commit, in a sentence; none for a name that a commit can keep.
std::optional<std::string> whyNotKept(OdString const& path);

/// Stages `files` behind what is staged already; what is staged under the same path gets the new change in its place.
/// Returns how many were not staged before. Throws `Failure`, with a list of them, for names that no commit can keep;
/// nothing is staged then.
std::size_t stage(std::vector<common::StagedFile> const& files, common::State& state);

/// The paths of all staged files.
std::set<OdString> stagedPaths(common::State const& state);

/// The paths that staged renames leave.
std::set<OdString> formerPaths(common::State const& state);

/// Both: all paths for which something is staged.
std::set<OdString> claimedPaths(common::State const& state);

/// Takes `files` out of the staged ones, with what was noted of their renames. Returns how many were staged.
std::size_t unstage(std::vector<common::StagedFile> const& files, common::State& state);

/// Enters the index records of files that are as the current commit has them, and takes them out of the staged ones. Of
/// `left`, files that somebody has changed since, only the renames go: what is staged there was not committed.
void applyIndexUpdates(
    IndexUpdates const& files, common::State& state, std::set<OdString> const& left = std::set<OdString>());

/// A file of the repository that has a new path.
struct Move {
    OdString from;
    OdString to;
};

/// Notes that files have moved, and stages them where they are now. One that moved before keeps the path that it had
/// first; one that is back at that path is no rename any more.
void stageMoves(std::vector<Move> const& moves, common::State& state);

} // namespace tav
