/// Going to another commit or branch.
#pragma once

#include "host/checkout/working_tree.h"
#include "host/repository/journal.h"

#include <cstdint>

namespace tav {

/// The result of a checkout.
struct CheckedOut {
    std::size_t written = 0;
    std::size_t removed = 0;
    std::size_t kept = 0;                 ///< changed files that were left as they are, staged ones not counted
    std::vector<OdString> discarded = {}; ///< files that an undo has overwritten, and whose contents the log keeps
};

/// Checks out another commit. Changes and staged files at paths where both commits agree are kept. Anything staged at
/// other paths prevents the checkout, removals and renames included, whatever the files contain. With
/// `Discard::everything` all files of the commit get its contents, including those that are the same in both commits.
/// Throws `Failure`. If no file was written by then, nothing has changed. Otherwise repeating the checkout completes
/// it, and a checkout of any other commit, including the one that it started from, undoes it completely. The caller has
/// held the lock of the repository since `start`. `command` is its name in the log of operations.
CheckedOut checkOutCommit(
    common::RootPath const& root, LocalDatabase& database, Position const& destination, OdString const& command,
    Discard discard, std::uint64_t start);

/// What a checkout would do.
struct PlannedCheckout {
    TreeUpdate update;
    std::vector<OdString> discarded; ///< files whose contents are in no commit and would be overwritten
};

/// What `checkOutCommit` would do for the commit `target`. Throws `Failure` as that does. Changes nothing, and needs no
/// lock.
PlannedCheckout
planCheckout(common::RootPath const& root, LocalDatabase const& database, OdString const& target, Discard discard);

/// Takes a move back (`Phase::undoing`) or does it again (`Phase::redoing`), with all that was not committed then.
/// Likewise; what is discarded goes into the log. The operation has its details.
CheckedOut turnMove(
    common::RootPath const& root, LocalDatabase& database, Operation const& move, Phase phase, Discard discard,
    std::uint64_t start);

/// Completes a checkout whose files are written, unless that has been done.
void finishCheckout(common::RootPath const& root, LocalDatabase& database, PendingCheckout const& move);

} // namespace tav
