/// Files of the last commit that are gone though nobody has said so.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <string>
#include <vector>

namespace tav {

/// Whether the files `missing` may be gone by mistake: a drive that is not connected takes a whole folder with it, or
/// many files.
bool mayBeMistake(std::vector<OdString> const& missing, common::RootPath const& root);

/// The files in a few lines: a folder that has nothing left is one of them.
std::vector<std::string> missingLines(std::vector<OdString> const& missing, common::RootPath const& root);

} // namespace tav
