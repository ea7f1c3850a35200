/// Sending a server the commits that it has lost.
#pragma once

#include "host/client/history.h"

#include <cstddef>
#include <vector>

namespace tav {

struct Sent {
    std::size_t commits = 0;
    /// Branches and tags whose names mean different commits on the server, as they were here.
    std::vector<common::Reference> givenUp;
};

/// Sends the commits that are known here and missing on the server, in the order of their numbers, and the branches and
/// tags that are missing or out of date there. Then the known history takes over the numbers, branches and tags of the
/// server.
/// Can be repeated after a failure, which is thrown as `Failure`. The caller holds the lock of the repository.
Sent sendAgain(common::RootPath const& root, LocalDatabase& database, Connection& connection);

} // namespace tav
