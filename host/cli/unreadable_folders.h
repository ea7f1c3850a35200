/// Folders that cannot be read, as notes beside what a command shows.
#pragma once

#include "host/changes/changes.h"

#include <string>

namespace tav {

constexpr char const* kChangesNotKnown =
    "These folders cannot be read, so changes in them are not known. Check your permissions for them:";

/// Prints `consequence`, a sentence that ends with a colon, and the folders below it. Nothing when there is none.
void noteUnreadable(std::string const& consequence, Folders const& folders);

} // namespace tav
