/// Branches and tags.
#pragma once

#include "host/repository/local_database.h"

#include <functional>

namespace tav {

/// Makes a branch or tag at a commit, on the server and in the local database. Throws `Failure` when the name exists or
/// is refused. The caller holds the lock of the repository.
void makeReference(LocalDatabase& database, common::Reference const& reference);

/// Throws `Failure` for a name that no branch or tag can have.
void requireReferenceName(OdString const& name);

/// Throws `Failure` when there is none of that type.
common::Reference findReference(LocalDatabase const& database, OdString const& name, common::EType type);

/// Throws `Failure` when no other branch or tag leads to the commit of `reference`.
void failIfOnlyWayToCommits(LocalDatabase const& database, common::Reference const& reference);

/// Removes a branch or tag, on the server and here. Throws `Failure` when it names another commit there. The caller
/// holds the lock of the repository.
void removeReference(LocalDatabase& database, common::Reference const& reference);

/// Gives a branch another name, on the server and here, in one request. `whenSent` is called when the server has done
/// so: a working folder on that branch continues on the new one, which every later command learns from the server.
void renameBranch(
    LocalDatabase& database, common::Reference const& branch, OdString const& name,
    std::function<void()> const& whenSent);

} // namespace tav
