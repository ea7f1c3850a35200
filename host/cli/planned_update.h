/// What a command would do, for --dry-run.
#pragma once

#include "host/checkout/working_tree.h"

#include <vector>

namespace tav {

/// Prints a line for each file that `update` would write or remove. Those in `discarded` have contents that are in no
/// commit.
void printPlan(TreeUpdate const& update, std::vector<OdString> const& discarded);

/// Prints a note about an operation that an interrupted command has left: the command itself would complete it first.
void notePending(common::RootPath const& root, LocalDatabase const& database);

} // namespace tav
