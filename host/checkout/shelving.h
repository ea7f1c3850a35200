/// Putting unfinished work aside, and bringing it back.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_repo_prop.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <set>
#include <vector>

namespace tav {

/// A file that is not as the current commit has it.
struct UnfinishedFile {
    OdString path;
    OdString base; ///< URL of what the commit has; empty for a new file
    bool isThere;
};

/// All of them in the order of paths, staged or not. Throws `Failure`.
std::vector<UnfinishedFile> unfinishedFiles(common::RootPath const& root, LocalDatabase& database);

/// What becomes of the command in the log, and what the shelf is called.
struct ShelvingOrder {
    OdString command;
    OdString message;
    std::uint64_t start; ///< since when the caller has held the lock of the repository
};

/// Puts `files` aside, with what is staged at their paths and `staged`, and makes the working folder there what the
/// current commit has. Returns the shelf. Shelf and log are written before the first file changes: killed at any point,
/// the work is in the folder or on the shelf, and undoing brings it back.
Shelf putAside(
    common::RootPath const& root, LocalDatabase& database, std::vector<UnfinishedFile> const& files,
    std::set<OdString> const& staged, ShelvingOrder const& order);

enum class Shelved { stays, goes };

struct BroughtBack {
    std::size_t written = 0;
    std::size_t removed = 0;
};

/// Makes files and staging what they were when they were put aside. Throws `Failure`, with a list of them, for files
/// that are neither as the commit had them then, nor as they were put aside; nothing has changed then. Killed later,
/// the shelf is still there, and the same completes it.
BroughtBack bringBack(
    common::RootPath const& root, LocalDatabase& database, Shelf const& shelf, Shelved after,
    ShelvingOrder const& order);

/// Takes the shelf away. Undoing brings it back.
void drop(common::RootPath const& root, LocalDatabase& database, Shelf const& shelf, OdString const& command);

} // namespace tav
