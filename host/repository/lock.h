/// The lock that lets one command at a time change the repository.
#pragma once

#include "common/mu_common_repo_prop.h"
#include "platform/os/os_lock.h"

#include <string>

namespace tav {

/// Takes the lock of the repository for the command `name`, waiting briefly for another command to end. Held as long as
/// the result lives. Throws `Failure`, which says who holds the lock.
os::FileLock lockRepository(common::RootPath const& root, std::string const& name);

/// Who holds the lock of the repository, as the subject of a sentence; empty when nobody does.
std::string lockHolder(common::RootPath const& root);

} // namespace tav
