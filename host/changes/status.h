/// The state of a repository, as commands show it.
#pragma once

#include "host/changes/renames.h"

#include "common/mu_common_diff.h"
#include "common/mu_common_state.h"

#include <cstdint>
#include <string>
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
    std::int64_t commit = 0;    ///< number of the commit that the working folder is at; 0 before the first
    bool isAtEnd = true;        ///< whether that is where the branch ends
    std::string unfinishedWork; ///< what an interrupted command has left, in a sentence
    std::vector<common::ConflictInfo> conflicts;
    std::vector<StagedEntry> staged;
    std::vector<OdString> modified;    ///< not staged
    std::vector<OdString> untracked;   ///< not staged
    Renames renamed;                   ///< not staged; the next commit takes that without staging
    bool isRenameDoubtful = false;     ///< like `isRemovalDoubtful`: some may be copies of missing files
    std::vector<OdString> removed;     ///< gone from the working folder; the next commit takes that without staging
    bool isRemovalDoubtful = false;    ///< the next commit takes `removed` only when an option says so
    std::vector<OdString> unreachable; ///< committed files in folders that links have replaced
    std::vector<OdString> unreadable;  ///< folders that cannot be read; commits keep their files
    std::vector<OdString> ignored;     ///< filled in on request

    bool isClean() const
    {
        return conflicts.empty() && staged.empty() && modified.empty() && untracked.empty() && renamed.empty() &&
               removed.empty() && unreachable.empty() && unreadable.empty();
    }
};

Status statusOf(common::RootPath const& root, bool withIgnored);

} // namespace tav
