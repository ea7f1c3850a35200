#include "platform/os/os_way.h"

#include "platform/os/os_detail.h"

#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>

namespace os {
namespace {

using detail::lastError;
using detail::openAt;
using Kind = Obstacle::Kind;

/// Looks at the entry `name` of `folder`, and goes into it unless it is the last one. The folder is closed where there
/// is nothing yet.
Obstacle step(Handle& folder, std::string const& name, std::size_t length, bool isLast)
{
    struct stat entry;
    if (fstatat(folder.get(), name.c_str(), &entry, AT_SYMLINK_NOFOLLOW) == -1) {
        std::error_code const error = lastError();
        folder = Handle();
        return error == std::errc::no_such_file_or_directory ? Obstacle() : Obstacle{Kind::unknown, length, error};
    }
    if (S_ISLNK(entry.st_mode)) {
        return {Kind::link, length, {}};
    }
    if (isLast) {
        return {};
    }
    if (!S_ISDIR(entry.st_mode)) {
        return {Kind::notFolder, length, {}};
    }
    folder = openAt(folder.get(), name, detail::kPassingFlags);
    return folder.isOpen() ? Obstacle() : Obstacle{Kind::unknown, length, lastError()};
}

} // namespace

Obstacle findObstacle(std::string const& top, std::string const& path)
{
    Handle folder = openAt(AT_FDCWD, top, O_PATH | O_DIRECTORY);
    if (!folder.isOpen()) {
        return {Kind::unknown, 0, lastError()};
    }
    for (std::size_t begin = 0; begin < path.size() && folder.isOpen();) {
        std::size_t const end = std::min(path.find('/', begin), path.size());
        Obstacle const obstacle = step(folder, path.substr(begin, end - begin), end, end == path.size());
        if (obstacle.kind != Kind::none) {
            return obstacle;
        }
        begin = end + 1;
    }
    return {};
}

} // namespace os
