/// What is staged, as people see it.
#pragma once

#include "host/changes/status.h"

#include <string>

namespace tav {

/// "renamed:  a.dwg -> b.dwg"
std::string lineOf(StagedEntry const& entry);

} // namespace tav
