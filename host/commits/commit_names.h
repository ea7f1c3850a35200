/// Finding the commit that a typed name means.
///
///     commit = start step*
///     start  = branch or tag | number | at least 4 digits of a hash | "@" | "HEAD" | [branch] "@{" date "}"
///     step   = "~" [n] | "^" [n]
///
/// "@", "HEAD" and a missing start mean the commit that the working folder is at. "~n" goes back n times to the first
/// parent, and "^n" goes to the n-th parent; n is 1 if it is missing, and 0 goes nowhere. A date means the last commit
/// up to that date along the first parents. A branch or tag with the whole typed name has priority over everything
/// else. The forms of a start are tried in the order above.
#pragma once

#include "host/repository/local_database.h"

#include <optional>
#include <string>

namespace tav {

/// The commit that `typed` means; none when it names no commit. Throws `Failure` when it is ambiguous, and when it goes
/// back beyond the first commit.
std::optional<CommitRecord> findCommitIfAny(LocalDatabase const& database, std::string const& typed);

/// The same; throws `Failure` when there is none.
CommitRecord findCommit(LocalDatabase const& database, std::string const& typed);

} // namespace tav
