/// Which repository a folder belongs to, noted apart from its database: one of another repository, put in the place of
/// the right one, would hide the history, and 'tav gc' would remove the versions that it does not know.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <vector>

namespace tav {

/// The identifiers in ".tav/identity", the last one noted at the end; none for a folder of an earlier version of tav.
/// There are several when the repository got another identifier on a new server. Throws `Failure`.
std::vector<OdString> identities(common::RootPath const& root);

/// Notes the identifier `id`, unless it is noted. Call it before the database gets the identifier: after a crash in
/// between, the database has one that is noted. Throws `Failure`. The caller holds the lock of the repository.
void addIdentity(common::RootPath const& root, OdString const& id);

/// Throws `Failure` when identifiers are noted, and `id`, that of the database, is none of them. An empty one is that
/// of a repository without a server.
void requireIdentity(common::RootPath const& root, OdString const& id);

} // namespace tav
