/// Files of the last commit that are missing from the working folder without 'tav rm'.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <string>
#include <vector>

namespace tav {

/// Whether the files `missing` may be missing by mistake: when a drive is not connected, a whole folder or many files
/// disappear.
bool mayBeMistake(std::vector<OdString> const& missing, common::RootPath const& root);

/// The files in a few lines: a folder from which all files are missing takes one line.
std::vector<std::string> missingLines(std::vector<OdString> const& missing, common::RootPath const& root);

} // namespace tav
