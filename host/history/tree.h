/// Which files can be the files of one commit.
#pragma once

#include "host/history/commit_tables.h"

#include <optional>
#include <string>
#include <vector>

namespace tav {

/// Why `files` cannot be all files of a commit, as the end of a sentence that names the path ("must not hold the path
/// 'a' twice"); none when they can. Takes as long as sorting them.
std::optional<std::string> whyNotTree(std::vector<FileRecord> const& files);

} // namespace tav
