/// Paths, their parts, and what the disk says of them.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/sdk/OdString.h"
#include "platform/ut/DateTime.h"

#include <cstddef>
#include <cstdint>

namespace ut {

/// A path, and questions to the disk about it. A plain value: it keeps the text and looks at the disk anew for every
/// question. Relative paths are relative to the process's current folder. No operation throws for what it finds on
/// the disk; a path that the system cannot take (too long, an embedded NUL) names nothing.
class MU_PLATFORM_EXPORT FileName {
public:
    /// Accepts entries of any kind in `exists`.
    static constexpr std::uint32_t kAnyKind = 0x1FFF;
    /// Makes missing parents too in `mkdir`.
    static constexpr int kFullPath = 1;

    /// Keeps the path as it is.
    explicit FileName(OdString const& path);
    /// `folder`, a separator, `name`, a dot and `extension`; without the dot when `extension` is empty.
    FileName(OdString const& folder, OdString const& name, OdString const& extension);

    /// The path as it was composed: nothing is resolved or made absolute.
    OdString getFullPath() const { return path_; }
    /// The last component without its extension: "sub/plan.dwg" gives "plan", ".bak" gives ".bak".
    OdString getName() const;
    /// What follows the last dot of the last component. A leading dot starts no extension, and an empty one does not
    /// count: ".bak", "plan" and "plan." have none.
    OdString getExt() const;
    /// Whether `getExt` gives one.
    bool hasExt() const;

    /// The number of components of the path, the last included: "/a/b" has 2, "/" and "" have 0.
    std::size_t getDirCount() const;
    /// Drops the last component with the separators before it; the root folder stays: "/a" becomes "/".
    void removeLastDir();

    /// Whether the path names an entry of the kinds in `kinds`, which is `kAnyKind`. Links are followed, so a dangling
    /// link does not exist.
    bool exists(std::uint32_t kinds) const;
    /// Whether this process may make entries in the folder that the path names, by its effective user and group.
    bool isDirWritable() const;
    /// Reads the entry's times into those arguments that are not null; a time that the file system does not keep stays
    /// unset. False, with nothing changed, when the entry cannot be examined.
    bool getTimes(DateTime* access, DateTime* modification, DateTime* creation) const;

    /// Whether `path` names a regular file, links followed.
    static bool fileExists(OdString const& path);
    /// Makes the folder `path` with `permissions` less the process's umask; with `kFullPath` in `flags` its missing
    /// parents too. True when the folder is there in the end, also when it was before.
    static bool mkdir(OdString const& path, int permissions, int flags);

    /// The text between two components, "/".
    static OdString getPathSeparator();
    /// Only the slash separates: a backslash is an ordinary character of file names here.
    static bool isPathSeparator(wchar_t character);

private:
    OdString path_;
};

} // namespace ut
