/// Sending a server again what it has lost.
#pragma once

#include "host/client/history.h"

#include <cstddef>
#include <vector>

namespace tav {

struct Sent {
    std::size_t commits = 0;
    /// Branches and tags whose names mean other commits on the server, as they were here.
    std::vector<common::Reference> givenUp;
};

/// Sends the commits that are known here and not there, in the order of their numbers, and the branches and tags that
/// are missing or behind there. Then the history here follows the numbers of the server, and its branches and tags.
/// Can be repeated after a failure, which is thrown as `Failure`. The caller holds the lock of the repository.
Sent sendAgain(common::RootPath const& root, LocalDatabase& database, Connection& connection);

} // namespace tav
