/// The state of a repository, as commands show it.
#pragma once

#include "common/mu_common_diff.h"
#include "common/mu_common_state.h"

#include <vector>

namespace tav {

struct StagedEntry {
    OdString path;
    common::FileChange change;
    OdString previousPath;  ///< of a renamed file, else empty
    bool isMissing = false; ///< staged as added or modified, but gone from the working folder since
};

/// Every list is in ascending order of paths.
struct Status {
    OdString branch;
    std::vector<common::ConflictInfo> conflicts;
    std::vector<StagedEntry> staged;
    std::vector<OdString> modified;  ///< not staged
    std::vector<OdString> untracked; ///< not staged
    std::vector<OdString> removed;   ///< gone from the working folder; the next commit takes that without staging
    std::vector<OdString> ignored;   ///< filled in when it is asked for

    bool isClean() const
    {
        return conflicts.empty() && staged.empty() && modified.empty() && untracked.empty() && removed.empty();
    }
};

Status statusOf(common::RootPath const& root, bool withIgnored);

} // namespace tav
