/// Files and folders, written so that they survive a crash. Paths are bytes as the system takes them, and no path with
/// an embedded NUL names anything. Every operation goes on when a signal interrupts it, and can be called from any
/// thread.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/os/os_handle.h"

#include <cstddef>
#include <dirent.h>
#include <memory>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <system_error>

namespace os {

/// Replaces the content of the file `path`, or makes the file, and waits until it is safe on the disk. After a crash or
/// a failure at any point the file holds the old content or the new, whole.
///
/// Links are followed and stay; a dangling one gets its target. Permissions, owner and group of the old file are kept
/// as far as this process may set them; a new file is readable and writable less the process's umask. A path that names
/// something else than a regular file, or a file that this process may not write, is refused with the disk untouched.
/// The folder must be readable and writable too.
///
/// The new content is written beside the old under a hidden name ending in ".tmp". A process that is killed may leave
/// such a file behind; the next replacement of the same file removes it. Processes may replace one file at the same
/// time: one of the contents stays, whole. An error after the new content has taken its place (the folder could not be
/// flushed) is reported too.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code replaceFile(std::string const& path, std::string_view content);

/// Puts the file `source` in the place of the file `path`, or moves it there, and waits until that is safe on the disk.
/// Both lie on one file system. What `replaceFile` says of links, permissions, refusals and crashes holds here too; a
/// file that is new under `path` keeps the permissions of `source`. After an error `source` is still there, unless it
/// was the flush of the folder that failed.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code replaceFileBy(std::string const& path, std::string const& source);

/// Makes the folder `path`, whose parent must exist, with `permissions` less the process's umask.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code makeFolder(std::string const& path, mode_t permissions);

/// Makes the folder `path` and its missing parents; these can be entered and written by their owner whatever
/// `permissions` say. Success when the folder is there already.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code makeFolders(std::string const& path, mode_t permissions);

/// Removes the file `path`, of a link the link itself, and waits until its folder is safe on the disk.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code removeFile(std::string const& path);

/// Waits until the entries of the folder `path` are safe on the disk.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code flushFolder(std::string const& path);

/// What the system knows of the entry `path`, links followed.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code examine(std::string const& path, struct statx& status);

/// Whether this process may make entries in the folder `path`, by its effective user and group.
MU_PLATFORM_EXPORT bool mayWriteIn(std::string const& path);

/// An open folder, for `readdir`. Closes itself.
using FolderReader = std::unique_ptr<DIR, int (*)(DIR*)>;

/// Opens the folder `path`; null, with `errno` set, when it cannot be opened.
MU_PLATFORM_EXPORT FolderReader openFolder(std::string const& path);

/// Opens the regular file `path` (links followed) for reading. Anything else than a regular file is refused without
/// waiting for it. `file` changes only on success.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code openForReading(std::string const& path, Handle& file);

/// Reads until `count` bytes are in `buffer` or the file ends. `done` is the number of bytes read, after an error too.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code
readBytes(Handle const& file, void* buffer, std::size_t count, std::size_t& done);

/// The whole content of the regular file `path`.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code readFile(std::string const& path, std::string& content);

} // namespace os
