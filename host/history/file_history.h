/// The history of single files and folders.
#pragma once

#include "host/history/commit_tables.h"

#include "common/mu_common_repo_files.h"

#include <cstdint>
#include <vector>

namespace tav {

/// What a commit did to a file.
struct FileEvent {
    OdString path;
    common::FileChange change;
    OdString previousPath; ///< of a renamed file, else empty
    OdString url;          ///< of the new content; empty for a removed file
};

struct FileHistoryEntry {
    std::int64_t commit = 0;       ///< number
    std::vector<FileEvent> events; ///< in the order of paths
};

/// The commits among `starts` and all before them that changed one of `paths`, newest first. A path is followed as a
/// file and as a folder. A file that a commit renamed is followed under its former name in the commits before it; the
/// former name alone ends with the event that says so. A merge is left out where it took a file
/// as one of its sides has it; all sides are followed then.
///
/// One read of the changes of these paths, and of the parents of all commits.
std::vector<FileHistoryEntry>
fileHistory(CommitTables const& commits, std::vector<std::int64_t> const& starts, std::vector<OdString> const& paths);

} // namespace tav
