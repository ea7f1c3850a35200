/// From what the user types to commits.
///
///     commit = start step*
///     start  = branch or tag | number | at least 4 digits of a hash | "@" | "HEAD" | [branch] "@{" date "}"
///     step   = "~" [n] | "^" [n]
///
/// "@" and "HEAD" are the commit that the working folder is at, and so is a missing start. "~n" goes back n first
/// parents, and "^n" to the n-th parent; both count one without a number, and none with 0. A date goes to the last
/// commit not after it on the line of first parents. A branch or tag of the whole typed name comes before everything
/// else, and of what a start can be, the first in this order.
#pragma once

#include "host/repository/local_database.h"

#include <optional>
#include <string>

namespace tav {

/// The commit that `typed` means; none when it names no commit. Throws `Failure` when it could be several, and when it
/// goes back behind the first one.
std::optional<CommitRecord> findCommitIfAny(LocalDatabase const& database, std::string const& typed);

/// The same; throws `Failure` when there is none.
CommitRecord findCommit(LocalDatabase const& database, std::string const& typed);

} // namespace tav
