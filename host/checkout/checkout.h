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

/// What a move has done.
struct CheckedOut {
    std::size_t written = 0;
    std::size_t removed = 0;
    std::size_t kept = 0; ///< changed files that are as they were, without the staged ones
};

/// Makes the working folder stand on another commit. Changes and staged files at paths where both commits agree stay;
/// what is staged at other paths is in the way, also a removal or renaming, and whatever the files hold. With
/// `Discard::everything` all files of the commit get its contents, also those that both commits have alike. Throws
/// `Failure`; before the first file is written nothing has changed then, later the same move completes it, and one to
/// any other commit, also back to where it began, leaves nothing of it behind. The caller holds the lock of the
/// repository since `start`.
CheckedOut checkOutCommit(
    common::RootPath const& root, LocalDatabase& database, Destination const& destination, Discard discard,
    std::uint64_t start);

/// Ends a move whose files are written, unless that has been done.
void finishCheckout(common::RootPath const& root, LocalDatabase& database, PendingCheckout const& move);

} // namespace tav
