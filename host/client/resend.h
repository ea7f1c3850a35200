/// Sending a server again what it has lost.
#pragma once

#include "host/client/history.h"

#include <cstddef>

namespace tav {

/// Sends the commits that are known here and not there, in the order of their numbers, and the branches and tags that
/// are missing or behind there. Then the history here follows the numbers of the server. Returns how many commits were
/// sent. Can be repeated after a failure, which is thrown as `Failure`. The caller holds the lock of the repository.
std::size_t sendAgain(common::RootPath const& root, LocalDatabase& database, Connection& connection);

} // namespace tav
