/// The files of one commit, compared with those of another.
#pragma once

#include "host/history/commit_tables.h"

#include <optional>
#include <string>
#include <vector>

namespace tav {

/// Why `files` cannot be all files of a commit, as the end of a sentence that names the path ("must not hold the path
/// 'a' twice"); none when they can. Takes as long as sorting them.
std::optional<std::string> whyNotTree(std::vector<FileRecord> const& files);

/// What turns the files of the first parent into `files`, which are all files of a commit.
std::vector<FileRecord> changesBetween(Tree parent, std::vector<FileRecord> const& files);

} // namespace tav
