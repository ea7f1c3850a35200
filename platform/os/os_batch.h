/// Many changes below one folder that are made safe together: one flush per file costs seconds per thousand.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/os/os_handle.h"

#include <cstdint>
#include <string>
#include <system_error>

namespace os {

/// Puts files into place below a folder, and takes files away. No path ever leads through a link, not even through one
/// that takes the place of a folder meanwhile. Paths are relative, in bytes, and have no component "..". One thread.
class MU_PLATFORM_EXPORT Batch {
public:
    /// Opens `folder`, which must exist; else every operation fails.
    explicit Batch(std::string const& folder);

    /// Gives the file `from`, a path of any kind on the same file system, the name `path`, making missing folders. What
    /// stands there is replaced unless it is a folder: a file leaves its permissions to the new one, a link is replaced
    /// itself.
    [[nodiscard]] std::error_code place(std::string const& from, std::string const& path);
    /// Removes the file `path`, of a link the link itself. Success when it is not there.
    [[nodiscard]] std::error_code remove(std::string const& path);
    /// Removes the folder that `path` lies in as far as it is empty, and those above it that are empty then.
    void removeEmptyFoldersOf(std::string const& path);

    /// Waits until everything written to the file system, by whomever, is safe on the disk.
    [[nodiscard]] std::error_code flush();

private:
    enum class Missing { fails, isMade };
    std::error_code enter(std::string const& folder, Missing missing);

    detail::Handle top_;
    detail::Handle current_;
    std::string currentPath_; ///< of `current_`; empty for the top
};

/// Sets the modification time of the file `path` (links followed) to nanoseconds since 1970-01-01T00:00:00Z.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code setModificationTime(std::string const& path, std::uint64_t time);

} // namespace os
