/// Where the files of a user lie.
#pragma once

#include <string>

namespace tav {

/// The folder that the environment variable `variable` names, if it is an absolute path, else `fallback` in the user's
/// home. Throws `Failure` when there is no home either.
std::string userFolder(char const* variable, char const* fallback);

/// The user's name and machine, "ann@studio".
std::string userName();

} // namespace tav
