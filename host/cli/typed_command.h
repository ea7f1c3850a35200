/// Commands as the log of operations calls them.
#pragma once

#include "platform/sdk/OdString.h"

#include <string>
#include <vector>

namespace tav {

/// "rm plan.dwg", "add --all"; of many names the first ones.
OdString typedCommand(std::string const& command, std::vector<std::string> const& names, bool all = false);

} // namespace tav
