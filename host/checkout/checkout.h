/// Going to another commit or branch.
#pragma once

#include "host/checkout/working_tree.h"
#include "host/repository/journal.h"

#include <cstdint>

namespace tav {

struct Destination {
    OdString commit; ///< hash
    OdString branch; ///< where HEAD points to afterwards
};

/// The result of a checkout.
struct CheckedOut {
    std::size_t written = 0;
    std::size_t removed = 0;
    std::size_t kept = 0; ///< changed files that were left as they are, staged ones not counted
};

/// Checks out another commit. Changes and staged files at paths where both commits agree are kept. Anything staged at
/// other paths prevents the checkout, removals and renames included, whatever the files contain. With
/// `Discard::everything` all files of the commit get its contents, including those that are the same in both commits.
/// Throws `Failure`. If no file was written by then, nothing has changed. Otherwise repeating the checkout completes
/// it, and a checkout of any other commit, including the one that it started from, undoes it completely. The caller has
/// held the lock of the repository since `start`.
CheckedOut checkOutCommit(
    common::RootPath const& root, LocalDatabase& database, Destination const& destination, Discard discard,
    std::uint64_t start);

/// Completes a checkout whose files are written, unless that has been done.
void finishCheckout(common::RootPath const& root, LocalDatabase& database, PendingCheckout const& move);

} // namespace tav
