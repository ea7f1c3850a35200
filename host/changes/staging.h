/// What the commands change in the working state.
#pragma once

#include "host/repository/operation.h"

#include "common/mu_common_state.h"

#include <cstddef>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace tav {

/// Why no commit can keep a file of this name, in a sentence; none for a name that a commit can keep.
std::optional<std::string> whyNotKept(OdString const& path);

/// Stages `files` after what is staged already. A path that is staged already keeps its position and gets the new
/// change. Returns how many were not staged before. Throws `Failure`, with a list of them, for names that no commit can
/// keep; nothing is staged then.
std::size_t stage(std::vector<common::StagedFile> const& files, common::State& state);

/// The paths of all staged files.
std::set<OdString> stagedPaths(common::State const& state);

/// The former paths of staged renames.
std::set<OdString> formerPaths(common::State const& state);

/// Both: all paths for which something is staged.
std::set<OdString> claimedPaths(common::State const& state);

/// Unstages `files` and forgets their recorded renames. Returns how many were staged.
std::size_t unstage(std::vector<common::StagedFile> const& files, common::State& state);

/// Adds the index records of files, or removes them.
void enterRecords(IndexUpdates const& files, common::State& state);

/// Enters the index records of files that match the current commit, and unstages them. For the files `left`, which have
/// been changed since, only the renames are dropped: what is staged there was not committed.
void applyIndexUpdates(
    IndexUpdates const& files, common::State& state, std::set<OdString> const& left = std::set<OdString>());

/// A file of the repository that has a new path.
struct Move {
    OdString from;
    OdString to;
};

/// Records that files have moved, and stages them at their new paths. A file that had moved before keeps its first path
/// as the earlier one; a file that is back at its first path is no longer a rename.
void stageMoves(std::vector<Move> const& moves, common::State& state);

} // namespace tav
