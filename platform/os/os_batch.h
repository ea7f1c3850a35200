/// Many changes below one folder that are flushed together: one flush per file takes seconds for a thousand files.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/os/os_handle.h"

#include <cstdint>
#include <map>
#include <string>
#include <system_error>

namespace os {

/// What was at a path at one time, as far as needed to distinguish one state of a file from another.
struct FileMark {
    bool isThere = false;  ///< neither a folder nor anything behind a link counts as a file
    bool isShared = false; ///< has other hard links, which come and go without a change to the content
    std::uint64_t device = 0;
    std::uint64_t number = 0; ///< on the device
    std::uint64_t length = 0;
    std::int64_t modified = 0; ///< nanoseconds since 1970-01-01T00:00:00Z
    std::int64_t changed = 0;  ///< the same, of the last change of content, name or permissions
};

/// Whether a file is unchanged between two marks. A change within one tick of the clock is not detected.
MU_PLATFORM_EXPORT bool isSame(FileMark const& a, FileMark const& b);

/// Puts files in their places below a folder, and removes files. No path ever leads through a link, not even through
/// one that replaces a folder during the call. Paths are relative, in bytes, and have no component "..". One thread.
class MU_PLATFORM_EXPORT Batch {
public:
    /// Opens `folder`, which must exist; otherwise every operation fails.
    explicit Batch(std::string const& folder);

    /// Marks what is at `path`. A missing file or a folder is not an error.
    [[nodiscard]] std::error_code mark(std::string const& path, FileMark& mark);
    /// Renames the file `from`, which may be any path, to `path`, and makes missing folders. An existing entry is
    /// replaced: the new file takes the permissions of an old file, a link is replaced itself, and a folder is removed
    /// if it contains nothing but folders. If the file is on a different file system, it is first copied to the target
    /// folder under a hidden name that ends in ".tmp". After an error, both the old file and `from` still exist.
    [[nodiscard]] std::error_code place(std::string const& from, std::string const& path);
    /// Removes the file `path`; of a link, the link itself. Success when it does not exist.
    [[nodiscard]] std::error_code remove(std::string const& path);
    /// Removes the folder of `path` if it is empty, and then those above it that have become empty.
    void removeEmptyFoldersOf(std::string const& path);

    /// Waits until everything written to the file system, by any process, is safe on the disk; does so for every file
    /// system that this batch has written to.
    [[nodiscard]] std::error_code flush();

private:
    enum class Missing { fails, isMade };
    std::error_code enter(std::string const& folder, Missing missing);
    std::error_code noteFileSystem(Handle const& folder);
    std::error_code rename(std::string const& from, std::string const& name);
    std::error_code copy(std::string const& from, std::string const& name);

    Handle top_;
    Handle current_;
    std::string currentPath_;                     ///< of `current_`; empty for the top
    std::map<std::uint64_t, Handle> fileSystems_; ///< a folder of each that was entered, by device
};

/// Sets the modification time of the file `path` (links followed) to nanoseconds since 1970-01-01T00:00:00Z.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code setModificationTime(std::string const& path, std::uint64_t time);

} // namespace os
