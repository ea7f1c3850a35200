/// Records of the index: which files were as the last commit has them, and when that was seen.
#pragma once

#include "common/mu_common_state.h"

#include <cstdint>

namespace tav {

/// When the command began that holds the lock of the repository, by the clock of the file system that the working
/// folder lies on.
std::uint64_t commandStart(common::RootPath const& root);

/// The record of a file that had the modification time `time` when its content was read, by a command that began at
/// `start`. One that is not older may be written once more within the same tick of the clock: its record says that the
/// file has to be read next time.
common::IndexData indexRecord(std::uint64_t time, std::uint64_t start);

/// A time for files that a command writes: their records can be relied on, since whoever writes them later gives them
/// another time.
std::uint64_t timeForWrittenFiles(std::uint64_t start);

/// Whether `record` says that a file with the modification time `time` is as the last commit has it.
bool isUntouched(common::IndexData const& record, std::uint64_t time);

} // namespace tav
