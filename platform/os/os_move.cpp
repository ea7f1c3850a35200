#include "platform/os/os_move.h"

#include "platform/os/os_calls.h"
#include "platform/os/os_detail.h"

#include <cerrno>
#include <cstdio>
#include <fcntl.h>
#include <sys/stat.h>
#include <utility>

namespace os {
namespace {

using detail::Entry;
using detail::flushEntries;
using detail::lastError;
using detail::openAt;
using detail::outcome;

std::error_code findEntry(std::string const& top, std::string const& path, Entry& entry)
{
    auto const pass = [](int folder, std::string const& name) { return openAt(folder, name, detail::kPassingFlags); };
    detail::SplitPath parts = detail::split(path);
    Handle const start = openAt(AT_FDCWD, top, O_PATH | O_DIRECTORY);
    Handle const folder = start.isOpen() ? detail::walk(start.get(), parts.folder, pass) : Handle();
    if (!folder.isOpen()) {
        return lastError();
    }
    entry = {openAt(folder.get(), ".", detail::kFolderFlags), std::move(parts.name)};
    return entry.folder.isOpen() ? std::error_code() : lastError();
}

/// For file systems that cannot check and move in one step.
std::error_code moveAfterLook(Entry const& from, Entry const& to)
{
    struct stat status;
    if (fstatat(to.folder.get(), to.name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == 0) {
        return std::make_error_code(std::errc::file_exists);
    }
    return outcome(calls().renameat(from.folder.get(), from.name.c_str(), to.folder.get(), to.name.c_str()));
}

std::error_code move(Entry const& from, Entry const& to)
{
    int const result =
        calls().renameat2(from.folder.get(), from.name.c_str(), to.folder.get(), to.name.c_str(), RENAME_NOREPLACE);
    bool const isUnknown = result == -1 && (errno == EINVAL || errno == ENOSYS);
    return isUnknown ? moveAfterLook(from, to) : outcome(result);
}

} // namespace

std::error_code moveEntry(std::string const& top, std::string const& from, std::string const& to, bool& hasMoved)
{
    hasMoved = false;
    if (!detail::isPath(top + from + to)) {
        return std::make_error_code(std::errc::invalid_argument);
    }
    Entry source;
    if (std::error_code const error = findEntry(top, from, source)) {
        return error;
    }
    Entry target;
    if (std::error_code const error = findEntry(top, to, target)) {
        return error;
    }
    bool const isOneFolder = detail::split(from).folder == detail::split(to).folder;
    if (std::error_code const error = move(source, target)) {
        return error;
    }
    hasMoved = true;
    std::error_code const error = flushEntries(target.folder);
    return error || isOneFolder ? error : flushEntries(source.folder);
}

} // namespace os
