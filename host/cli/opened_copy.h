/// Read-only copies, which the programs of the desktop open.
#pragma once

#include "host/text/digest.h"

#include <functional>
#include <string>

namespace tav {

/// Makes a read-only copy of the file `name` in the user's cache, in bytes, called like "roof (commit 12).dwg" with the
/// note "commit 12". `write` makes the file of this digest at the path that it is given. Returns the path of the copy,
/// which may have been there. A copy that somebody has changed is left as it is. Copies older than 30 days are removed.
/// Throws `Failure`.
std::string makeReadOnlyCopy(
    std::string const& name, std::string const& note, Digest const& digest,
    std::function<void(std::string const& path)> const& write);

/// Opens `file` with the program that the user has set, or with that of the desktop, and waits until it ends. Files
/// that would be run are refused: their contents may come from anybody. Throws `Failure`.
void openWithProgram(std::string const& file);

} // namespace tav
