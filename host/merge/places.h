/// Where files go when several want one place.
#pragma once

#include "host/merge/three_way.h"

#include <functional>
#include <vector>

namespace tav {

/// `files` have the path that each wants, or none. Where that of one cannot be had beside the others, this one goes
/// back to where mine has it, or nowhere, with the conflict; files that are where mine has them never give way.
void givePlaces(std::vector<MergedFile>& files, std::function<bool(OdString const& path)> const& isInBase);

} // namespace tav
