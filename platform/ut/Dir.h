/// Folders: making one, and listing its entries.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/sdk/OdString.h"

#include <cstddef>
#include <string>
#include <vector>

namespace ut {

/// An open folder. It is read once, when it is opened; every enumeration uses that result, sorted by name in byte
/// order, so that lists are the same on every machine. One thread at a time.
///
/// Listed are regular files (links to files count as files) and folders (links to folders are left out, so that no walk
/// is endless). Dangling links and all other kinds of entries are left out, and so are "." and "..".
/// Names that begin with a dot are hidden.
class MU_PLATFORM_EXPORT Dir {
public:
    // What an enumeration lists; add them up.
    static constexpr int kFiles = 1;  ///< files
    static constexpr int kDirs = 2;   ///< folders
    static constexpr int kHidden = 4; ///< hidden entries too

    /// Whether `path` names a folder, links followed. False for a file.
    static bool exists(OdString const& path);
    /// Makes the folder `path`, whose parent must exist. False when it could not be made, for example because the name
    /// exists.
    static bool create(OdString const& path);

    /// Reads the folder. False when it cannot be opened or read; nothing is enumerated then.
    bool open(OdString const& path);
    /// The path that was opened, as it was given.
    OdString getName() const { return path_; }

    /// Starts an enumeration of what `flags` selects and gives its first name, without the folder. `filter` must be
    /// empty: all names are listed. False, with `name` unchanged, when there is none.
    bool getFirst(OdString& name, OdString const& filter, int flags);
    /// The next name of the enumeration; false, with `name` unchanged, at its end.
    bool getNext(OdString& name);

private:
    struct Entry {
        std::string name;
        bool isDir;
    };

    OdString path_;
    std::vector<Entry> entries_;
    std::size_t position_ = 0;
    int flags_ = 0;
};

} // namespace ut
