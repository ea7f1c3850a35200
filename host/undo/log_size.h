/// How much room the log of operations takes.
#pragma once

#include "host/repository/local_database.h"
#include "host/storage/local_storage.h"

#include <cstddef>
#include <cstdint>

namespace tav {

/// Forgets the oldest operations, so that the contents which only the log needs are `most` bytes long together, and
/// returns how many went. The newest one stays, and so does one that is under way. Takes the contents themselves from
/// nowhere: cleaning the storage does. Throws `Failure`.
std::size_t limitLog(LocalDatabase& database, LocalStorage const& storage, std::uint64_t most);

} // namespace tav
