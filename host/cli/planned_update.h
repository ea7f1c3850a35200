/// What a command would do to the working folder.
#pragma once

#include "host/checkout/working_tree.h"

#include <vector>

namespace tav {

/// Prints a line for each file that `update` would write or remove. Those in `discarded` have contents that are in no
/// commit.
void printPlan(TreeUpdate const& update, std::vector<OdString> const& discarded);

} // namespace tav
