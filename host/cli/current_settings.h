/// The settings that apply in the current folder.
#pragma once

#include "host/user/settings.h"

namespace tav {

/// Those of the user, and of the repository that the current folder lies in, if any. Throws `Failure` when a file of
/// settings cannot be used.
Settings currentSettings();

/// Sets `key` for the user or for the repository. Throws `Failure`, also for a value that it cannot have.
void saveSetting(std::string const& key, std::string const& value, Origin origin);

} // namespace tav
