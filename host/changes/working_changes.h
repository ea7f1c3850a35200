/// What differs in the working folder, as commands show it.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_repo_files.h"

#include <vector>

namespace tav {

struct WorkingChange {
    OdString path;
    common::FileChange change;
    OdString previousPath; ///< of a renamed file, else empty
    OdString oldUrl;       ///< of the committed content; empty for a new file
};

/// Changes relative to the commit of that hash, in the order of paths. A renamed file, including one staged by 'tav
/// mv', is one change.
std::vector<WorkingChange>
workingChanges(common::RootPath const& root, LocalDatabase const& database, OdString const& commit);

} // namespace tav
