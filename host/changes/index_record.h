/// When records of files can be relied on: those of the state's index, which editors read, and those of verified files.
#pragma once

#include "host/repository/verified_files.h"

#include "common/mu_common_state.h"

#include <cstdint>

namespace tav {

/// When the command that holds the lock of the repository began, by the clock of the file system that contains the
/// working folder.
std::uint64_t commandStart(common::RootPath const& root);

/// The record of a file that had the modification time `time` when its content was read, by a command that began at
/// `start`. A file that is not older than `start` may be written again within the same tick of the clock, so its record
/// says that it must be read next time.
common::IndexData indexRecord(std::uint64_t time, std::uint64_t start);

/// Whether files that are written at `later` can no longer get the time `time`.
bool isOver(std::uint64_t time, std::uint64_t later);

/// A time for files that a command writes: their records can be relied on, because any later write gives them a
/// different time.
std::uint64_t timeForWrittenFiles(std::uint64_t start);

/// Those of `files` whose records can be relied on if they were examined after `time`: any later change gives them a
/// different stamp.
VerifiedFileList settledFiles(VerifiedFileList files, std::uint64_t time);

} // namespace tav
