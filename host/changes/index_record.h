/// When records of files can be relied on: those of the state's index, which editors read, and those of verified files.
#pragma once

#include "host/repository/verified_files.h"

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

/// Whether files that are written at `later` cannot get the time `time` any more.
bool isOver(std::uint64_t time, std::uint64_t later);

/// A time for files that a command writes: their records can be relied on, since whoever writes them later gives them
/// another time.
std::uint64_t timeForWrittenFiles(std::uint64_t start);

/// Those of `files` that can be relied on when they were examined after `time`: whoever changes them from then on gives
/// them another stamp.
VerifiedFileList settledFiles(VerifiedFileList files, std::uint64_t time);

} // namespace tav
