/// What may become of branches and tags.
#pragma once

#include "host/protocol/commit_document.h"
#include "host/server/history_store.h"

namespace tav {

/// Whether a rule that protects what others have is in force.
enum class Force { no, yes };

/// Makes, moves or removes a reference. Throws `Failure` when that would take a commit away from somebody, or when
/// another one has changed the reference meanwhile.
void setReference(HistoryTransaction& history, ReferenceChange const& change, Force force);

/// Whether the branch went past the commit since an earlier request that added it and moved the branch there.
bool hasPassed(HistorySnapshot const& history, common::Reference const& branch, OdString const& hash);

/// Throws `Failure` when the parents of a new commit are not there, or when it has none and does not replace all that
/// the repository has.
void requireParents(HistorySnapshot const& history, NewCommit const& added);

} // namespace tav
