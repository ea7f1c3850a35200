/// What a commit changed, as commands show it.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_repo_files.h"

#include <cstdint>
#include <optional>
#include <vector>

namespace tav {

struct CommittedChange {
    OdString path;
    common::FileChange change;
    OdString previousPath; ///< of a renamed file, else empty
    OdString url;          ///< of the new content; empty for a removed file
    OdString oldUrl;       ///< of the content before; empty for a new file
};

/// In the order of paths. A renamed file is one change.
std::vector<CommittedChange> committedChanges(CommitTables const& commits, CommitRecord const& commit);

/// How the commit `to` differs from the commit `from`, in the order of paths. Where `from` is on the line of first
/// parents of `to`, renames in between are followed.
std::vector<CommittedChange>
changesBetween(CommitTables const& commits, CommitRecord const& from, CommitRecord const& to);

} // namespace tav
