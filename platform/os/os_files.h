/// Files and folders, written so that they survive a crash. Paths are bytes as the system takes them, and a path with
/// an embedded NUL is refused. Every operation continues after a signal interrupts it, and can be called from any
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
/// a failure at any point, the file has either the old content or the new one, complete.
///
/// Links are followed and kept; the target of a dangling link is created. Permissions, owner and group of the old file
/// are kept as far as this process may set them; a new file is readable and writable less the process's umask. A path
/// to anything other than a regular file, or to a file that this process may not write, is refused, and the disk is
/// unchanged. The folder must be readable and writable too.
///
/// The new content is first written to the same folder under a hidden name ending in ".tmp". A process that is killed
/// may leave such a file behind; the next replacement of the same file removes it. Several processes may replace one
/// file at the same time: one of the contents remains, complete. An error after the new content has taken its place
/// (the folder could not be flushed) is reported too.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code replaceFile(std::string const& path, std::string_view content);

/// Renames the file `source` to `path`, replacing a file there, and waits until that is safe on the disk. Both must be
/// on one file system. What `replaceFile` says of links, permissions, refusals and crashes applies here too; if there
/// was no file at `path`, the permissions of `source` are kept. After an error `source` still exists, unless only
/// flushing the folder failed.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code replaceFileBy(std::string const& path, std::string const& source);

/// Makes the folder `path`, whose parent must exist, with `permissions` less the process's umask.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code makeFolder(std::string const& path, mode_t permissions);

/// Makes the folder `path` and its missing parents; the owner can enter and write these parents, whatever `permissions`
/// says. Success when the folder exists already.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code makeFolders(std::string const& path, mode_t permissions);

/// Removes the file `path`; of a link, the link itself. Waits until its folder is safe on the disk.
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

/// Opens the regular file `path` (links followed) for reading. Anything other than a regular file is refused without
/// blocking. `file` changes only on success.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code openForReading(std::string const& path, Handle& file);

/// Reads until `count` bytes are in `buffer` or the file ends. `done` is the number of bytes read, after an error too.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code
readBytes(Handle const& file, void* buffer, std::size_t count, std::size_t& done);

/// The whole content of the regular file `path`.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code readFile(std::string const& path, std::string& content);

} // namespace os
