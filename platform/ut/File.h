/// Reading the bytes of a file.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/sdk/OdString.h"

#include <cstddef>
#include <cstdint>
#include <memory>

namespace ut {

/// An open file. Owns the handle and closes it on destruction. One thread at a time.
/// Only regular files are opened (links followed): a folder, a pipe or a device is refused without waiting for it.
class MU_PLATFORM_EXPORT File {
public:
    /// What the file is opened for.
    enum OpenMode {
        kRead = 0,
    };

    File() noexcept;
    File(File const&) = delete;
    File& operator=(File const&) = delete;
    ~File();

    /// Opens the file at its beginning. False when it cannot be opened or is not a regular file.
    bool open(OdString const& path, OpenMode mode);
    /// Length in bytes; 0 when no file is open.
    std::uint64_t length() const;
    /// Reads up to `count` bytes from where the last reading ended into `buffer`. Returns how many were read: fewer
    /// than `count` only at the end of the file or when reading fails, 0 when no file is open.
    std::size_t read(void* buffer, std::size_t count);
    /// Closes the file, if one is open.
    void close();

private:
    struct Open;
    std::unique_ptr<Open> open_;
};

} // namespace ut
