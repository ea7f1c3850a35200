#include "platform/os/os_move.h"

#include "platform/os/os_calls.h"
#include "platform/os/os_handle.h"

#include <cerrno>
#include <cstdio>
#include <fcntl.h>
#include <sys/stat.h>
#include <utility>

namespace os {
namespace {

using detail::Handle;
using detail::lastError;
using detail::openAt;
using detail::outcome;
using detail::retried;

/// An entry of a folder that is held open.
struct Entry {
    Handle folder;
    std::string name;
};

Entry entryAt(Handle const& top, std::string const& path)
{
    auto const openFolder = [](int folder, std::string const& name) {
        return openAt(folder, name, detail::kFolderFlags);
    };
    detail::Place place = detail::placeOf(path);
    return {detail::walk(top.get(), place.folder, openFolder), std::move(place.name)};
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

std::error_code flush(Handle const& folder)
{
    return outcome(retried([&] { return calls().fsync(folder.get()); }));
}

} // namespace

std::error_code moveEntry(std::string const& top, std::string const& from, std::string const& to)
{
    if ((top + from + to).find('\0') != std::string::npos) {
        return std::make_error_code(std::errc::invalid_argument);
    }
    Handle const folder = openAt(AT_FDCWD, top, O_RDONLY | O_DIRECTORY);
    if (!folder.isOpen()) {
        return lastError();
    }
    Entry const source = entryAt(folder, from);
    if (!source.folder.isOpen()) {
        return lastError();
    }
    Entry const target = entryAt(folder, to);
    if (!target.folder.isOpen()) {
        return lastError();
    }
    if (std::error_code const error = move(source, target)) {
        return error;
    }
    std::error_code const error = flush(target.folder);
    return error ? error : flush(source.folder);
}

} // namespace os
