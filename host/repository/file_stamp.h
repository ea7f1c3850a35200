/// What the disk reports about a file without reading its content.
#pragma once

#include <cstdint>

namespace tav {

/// Changing the content of a file, or replacing the file, changes its stamp as well, unless that happens within one
/// tick of the clock of the file system: a program can set the modification time, but not the time of the last change.
struct FileStamp {
    std::uint64_t size = 0;
    std::uint64_t inode = 0;
    std::int64_t changed = 0; ///< nanoseconds since 1970-01-01T00:00:00Z, of the last change of content, name or rights
    std::int64_t modified = 0; ///< the same, of the content alone
};

inline bool operator==(FileStamp const& a, FileStamp const& b)
{
    return a.size == b.size && a.inode == b.inode && a.changed == b.changed && a.modified == b.modified;
}

inline bool operator!=(FileStamp const& a, FileStamp const& b)
{
    return !(a == b);
}

} // namespace tav
