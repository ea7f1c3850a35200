/// Files that a new one may be a copy of.
#pragma once

#include "host/history/commit_tables.h"

#include <vector>

namespace tav {

/// URLs of at most four of `files` that the new file `path` may resemble: with the same extension, letter case aside,
/// and next to it in the order of paths, where the sheets of one set are. The file before `path` is the first. The time
/// does not depend on how many files there are.
std::vector<OdString> similarFiles(Tree const& files, OdString const& path);

} // namespace tav
