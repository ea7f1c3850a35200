/// Taking operations back, and doing them again.
#pragma once

#include "host/checkout/working_tree.h"
#include "host/repository/local_database.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

namespace tav {

/// What comes next: to be taken back (`Side::before`), or to be done again (`Side::after`). A move that was interrupted
/// goes before all others. With its details.
std::optional<Operation> nextToTurn(LocalDatabase const& database, Side to);

struct Turned {
    std::size_t written = 0;
    std::size_t removed = 0;
    std::vector<OdString>
        kept; ///< paths of files whose unexpected contents were discarded, and are kept for the reverse
};

/// Makes what `operation` has changed what it was on the side `to`: each file, what is staged, and where the folder
/// stands has to be as it was on either side. Throws `Failure`, with a list of what is not; nothing has changed then.
/// Killed or failed later, the same completes it. `Discard::everything` overwrites files that are otherwise by now, and
/// keeps their contents in the log. The caller holds the lock of the repository since `start`.
Turned turn(
    common::RootPath const& root, LocalDatabase& database, Operation const& operation, Side to, Discard discard,
    std::uint64_t start);

} // namespace tav
