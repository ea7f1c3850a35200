/// What differs in the working folder, as commands show it.
#pragma once

#include "host/changes/changes.h"

#include "common/mu_common_repo_files.h"

#include <vector>

namespace tav {

struct WorkingChange {
    OdString path;
    common::FileChange change;
    OdString previousPath; ///< of a renamed file, else empty
    OdString oldUrl;       ///< of the committed content; empty for a new file
};

struct WorkingChanges {
    std::vector<WorkingChange> files; ///< in the order of paths
    Folders unreadable;               ///< whose changes are not known
};

/// Changes relative to the commit of that hash. A renamed file, including one staged by 'tav mv', is one change.
WorkingChanges workingChanges(common::RootPath const& root, LocalDatabase const& database, OdString const& commit);

} // namespace tav
