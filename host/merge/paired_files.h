/// Which paths of the three sides are one file.
#pragma once

#include "host/merge/three_way.h"

#include <vector>

namespace tav {

/// One entry for each file of base that is among the paths, and for each that a side has added; what two sides added
/// at one path is one file. Only paths and values are set. A path that a side has renamed something to is that file
/// there, and a path that it has renamed away is a new file if the side has one there.
std::vector<MergedFile> pairedFiles(MergeInput const& input);

} // namespace tav
