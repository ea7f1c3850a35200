/// Examining files of the working folder without reading them.
#pragma once

#include "host/repository/file_stamp.h"

#include "common/mu_common_repo_prop.h"
#include "platform/os/os_handle.h"

#include <optional>
#include <string>

namespace tav {

enum class Presence {
    isGone,       ///< nothing is there, or a folder
    isThere,      ///< a file, or something in its place
    isUnknown,    ///< it cannot be examined, and does not count as removed
    isBehindLink, ///< one of its folders is now a link, and a scan does not follow links to folders
};

/// What was found at the path of a file.
struct Sight {
    Presence presence = Presence::isGone;
    std::optional<FileStamp> stamp; ///< of a regular file; through a link to one, of that file
};

/// Fast when consecutive paths are in the same folder. One thread at a time.
class FolderView {
public:
    explicit FolderView(common::RootPath const& root);

    /// Examines `path`, in bytes and relative to the working folder.
    Sight look(std::string const& path);
    Sight look(OdString const& path) { return look(path.ansi_str()); }

private:
    Presence enter(std::string const& folder);

    os::Handle top_;
    os::Handle current_;
    std::optional<std::string> currentPath_;
    Presence way_ = Presence::isThere; ///< whether files of the current folder can be examined
};

} // namespace tav
