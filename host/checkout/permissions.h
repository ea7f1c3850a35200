/// Permissions of working files. No commit has them, so what removes files notes them in the log of operations.
#pragma once

#include <cstdint>
#include <string>

namespace tav {

/// The permissions of the file `path`; 0 when there is none, and when it has those that every new file gets.
std::uint32_t ownPermissions(std::string const& path);

/// Gives the file `path` permissions that `ownPermissions` has returned. Not every file system can: what the file holds
/// matters more.
void setPermissions(std::string const& path, std::uint32_t permissions);

} // namespace tav
