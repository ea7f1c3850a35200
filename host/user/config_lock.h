/// One process at a time changes the configuration of a user, so none loses what another has added.
#pragma once

#include "platform/os/os_lock.h"

#include <string>

namespace tav {

/// "tav" in the user's folder for configuration.
std::string userConfigFolder();

/// Makes that folder when it is missing, and locks it as long as the result lives. Throws `Failure`.
os::FileLock lockUserConfig();

} // namespace tav
