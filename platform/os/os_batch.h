/// Many changes below one folder that are made safe together: one flush per file costs seconds per thousand.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/os/os_handle.h"

#include <cstdint>
#include <map>
#include <string>
#include <system_error>

namespace os {

/// What stood under a name at some moment, as far as that tells one state of a file from another.
struct FileMark {
    bool isThere = false;  ///< a folder is no file, and nor is anything behind a link
    bool isShared = false; ///< has other names: these come and go without a change of the content
    std::uint64_t device = 0;
    std::uint64_t number = 0; ///< on the device
    std::uint64_t length = 0;
    std::int64_t modified = 0; ///< nanoseconds since 1970-01-01T00:00:00Z
    std::int64_t changed = 0;  ///< the same, of the last change of content, name or permissions
};

/// Whether nothing has happened to a file between two marks, unless it was written within one tick of the clock.
MU_PLATFORM_EXPORT bool isSame(FileMark const& a, FileMark const& b);

/// Puts files into place below a folder, and takes files away. No path ever leads through a link, not even through one
/// that takes the place of a folder meanwhile. Paths are relative, in bytes, and have no component "..". One thread.
class MU_PLATFORM_EXPORT Batch {
public:
    /// Opens `folder`, which must exist; else every operation fails.
    explicit Batch(std::string const& folder);

    /// Marks what stands under `path`. Nothing there, or a folder, is no error.
    [[nodiscard]] std::error_code mark(std::string const& path, FileMark& mark);
    /// Gives the file `from`, a path of any kind, the name `path`, making missing folders. What stands there is
    /// replaced: a file leaves its permissions to the new one, a link is replaced itself, and a folder goes when there
    /// are only folders in it. To another file system the file is copied first, beside its place under a hidden name
    /// that ends in ".tmp". After an error the old file is there and `from` is too.
    [[nodiscard]] std::error_code place(std::string const& from, std::string const& path);
    /// Removes the file `path`, of a link the link itself. Success when it is not there.
    [[nodiscard]] std::error_code remove(std::string const& path);
    /// Removes the folder that `path` lies in as far as it is empty, and those above it that are empty then.
    void removeEmptyFoldersOf(std::string const& path);

    /// Waits until everything written to the file system, by whomever, is safe on the disk; to every one that was
    /// written to.
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
