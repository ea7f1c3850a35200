/// Branches and tags.
#pragma once

#include "host/repository/local_database.h"

namespace tav {

/// Makes a branch or tag at a commit, on the server and in the local database. Throws `Failure` when the name exists or
/// is refused. The caller holds the lock of the repository.
void makeReference(LocalDatabase& database, common::Reference const& reference);

} // namespace tav
