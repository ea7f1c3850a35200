/// Advisory locks on files, held by one process at a time.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/os/os_handle.h"

#include <chrono>
#include <string>
#include <system_error>

namespace os {

/// A lock on a file that has no other purpose. The system releases it when the process ends, however it ends.
/// Releasing the lock does not remove the file: otherwise two processes could lock two files of the same name.
class MU_PLATFORM_EXPORT FileLock {
public:
    /// Makes the file `path` if necessary, waits up to `patience` for its lock, and writes `note` into it, one line
    /// that tells others who holds the lock. `std::errc::operation_would_block` when another process held it all the
    /// time, `too_many_links` when the file has other hard links, `not_supported` when it is not a regular file.
    [[nodiscard]] std::error_code
    acquire(std::string const& path, std::string const& note, std::chrono::milliseconds patience);

    /// Whether a process holds the lock on `path`. Does not make the file; a lock that cannot be examined counts as
    /// free.
    static bool isHeld(std::string const& path);

    /// The note of the process that holds the lock on `path`, or held it last; empty when there is none.
    static std::string holder(std::string const& path);

private:
    Handle file_;
};

} // namespace os
