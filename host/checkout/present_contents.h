/// Whether an update finds the files as it expects them.
#pragma once

#include "host/checkout/working_tree.h"

#include <set>

namespace tav {

/// The paths of `update` at which the working folder has neither what is expected there, nor what is wanted: a file
/// that is missing where one is expected counts too. Reads the files.
std::set<OdString> pathsInTheWay(common::RootPath const& root, TreeUpdate const& update);

} // namespace tav
