#include "platform/os/os_move.h"

#include "platform/os/os_calls.h"
#include "platform/os/os_files.h"
#include "platform/os/os_handle.h"

#include <cerrno>
#include <cstdio>
#include <fcntl.h>
#include <sys/stat.h>

namespace os {
namespace {

using detail::lastError;

std::string folderOf(std::string const& path)
{
    std::size_t const slash = path.rfind('/');
    return slash == std::string::npos ? "." : path.substr(0, slash + 1);
}

/// For file systems that cannot check and move in one step.
std::error_code moveAfterLook(std::string const& from, std::string const& to)
{
    struct stat status;
    if (lstat(to.c_str(), &status) == 0) {
        return std::make_error_code(std::errc::file_exists);
    }
    if (calls().renameat(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str()) == -1) {
        return lastError();
    }
    return {};
}

std::error_code move(std::string const& from, std::string const& to)
{
    if (calls().renameat2(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str(), RENAME_NOREPLACE) == 0) {
        return {};
    }
    return errno == EINVAL || errno == ENOSYS ? moveAfterLook(from, to) : lastError();
}

} // namespace

std::error_code moveEntry(std::string const& from, std::string const& to)
{
    if (from.find('\0') != std::string::npos || to.find('\0') != std::string::npos) {
        return std::make_error_code(std::errc::invalid_argument);
    }
    if (std::error_code const error = move(from, to)) {
        return error;
    }
    if (std::error_code const error = flushFolder(folderOf(to))) {
        return error;
    }
    return flushFolder(folderOf(from));
}

} // namespace os
