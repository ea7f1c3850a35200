/// Open files that are read and written at any place, and the steps of operations that flush many files at once.
/// Paths are bytes as the system takes them. Every operation continues after a signal interrupts it, and can be called
/// from any thread, one at a time for each file.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/os/os_handle.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <sys/types.h>
#include <system_error>

namespace os {

/// A file or folder that is open. Closes itself. Opening another one closes it; if opening fails, it stays open.
class MU_PLATFORM_EXPORT OpenFile {
public:
    /// The regular file `path`, links followed. Anything else is refused without blocking.
    [[nodiscard]] std::error_code openForReading(std::string const& path);
    /// The regular file `path`, to be read and written. A link is refused (`too_many_symbolic_link_levels`), and so is
    /// a file that has other hard links (`too_many_links`), because they would change too.
    [[nodiscard]] std::error_code openForChanging(std::string const& path);
    /// The folder `path`, for `flushFileSystem`.
    [[nodiscard]] std::error_code openFolder(std::string const& path);
    /// Makes the file `path` with `permissions` less the process's umask. `std::errc::file_exists` when the name
    /// exists, even as a link.
    [[nodiscard]] std::error_code create(std::string const& path, mode_t permissions);
    /// Makes a file that nobody else can open and that disappears when it is closed, however the process ends. It is on
    /// the file system of `folder`.
    [[nodiscard]] std::error_code createUnnamed(std::string const& folder);

    /// Whether something is open.
    bool isOpen() const { return file_.isOpen(); }
    /// Length in bytes.
    [[nodiscard]] std::error_code length(std::uint64_t& length) const;
    /// Reads until `count` bytes are in `buffer` or the file ends. `done` is the number of bytes read, after an error
    /// too.
    [[nodiscard]] std::error_code
    readAt(std::uint64_t offset, void* buffer, std::size_t count, std::size_t& done) const;
    /// Writes all of `bytes`; after an error some of them may be there.
    [[nodiscard]] std::error_code writeAt(std::uint64_t offset, std::string_view bytes) const;
    /// Truncates the file, or extends it with zeros.
    [[nodiscard]] std::error_code truncate(std::uint64_t length) const;
    /// Waits until the content is safe on the disk.
    [[nodiscard]] std::error_code flush() const;
    /// Waits until everything written to the file system is safe on the disk: cheaper than single flushes when many
    /// files have been written. Open this before writing, or an error of another process's flush may hide one of ours.
    /// `std::errc::function_not_supported` when the file system does not support it.
    [[nodiscard]] std::error_code flushFileSystem() const;

private:
    std::error_code openAs(std::string const& path, int flags, mode_t permissions);

    Handle file_;
};

/// Renames the file `from` to `to`, replacing a file of that name, without waiting for the disk.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code renameUnflushed(std::string const& from, std::string const& to);

/// Removes the file `path`; of a link, the link itself. Does not wait for the disk.
[[nodiscard]] MU_PLATFORM_EXPORT std::error_code removeUnflushed(std::string const& path);

} // namespace os
