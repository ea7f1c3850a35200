/// Branches and tags.
#pragma once

#include "host/repository/local_database.h"

namespace tav {

/// Makes a branch or tag at a commit, on the server and here. Throws `Failure` when the name is taken or refused. The
/// caller holds the lock of the repository.
void makeReference(LocalDatabase& database, common::Reference const& reference);

} // namespace tav
