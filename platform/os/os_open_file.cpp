#include "platform/os/os_open_file.h"

#include "platform/os/os_calls.h"
#include "platform/os/os_detail.h"
#include "platform/os/os_files.h"

#include <atomic>
#include <cerrno>
#include <cstdio>
#include <fcntl.h>
#include <limits>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace os {
namespace {

using detail::isPath;
using detail::lastError;
using detail::outcome;
using detail::retried;
using detail::systemError;

bool isOffset(std::uint64_t offset)
{
    return offset <= static_cast<std::uint64_t>(std::numeric_limits<off_t>::max());
}

std::string newUnnamedName(std::string const& folder)
{
    static std::atomic<unsigned long> counter{0};
    return folder + "/.unnamed." + std::to_string(getpid()) + "-" + std::to_string(counter++) + ".tmp";
}

} // namespace

std::error_code OpenFile::openAs(std::string const& path, int flags, mode_t permissions)
{
    if (!isPath(path)) {
        return systemError(EILSEQ);
    }
    Handle opened = detail::openAt(AT_FDCWD, path, flags | O_NOCTTY, permissions);
    if (!opened.isOpen()) {
        return lastError();
    }
    file_ = std::move(opened);
    return {};
}

std::error_code OpenFile::openForReading(std::string const& path)
{
    return os::openForReading(path, file_);
}

std::error_code OpenFile::openForChanging(std::string const& path)
{
    Handle opened;
    if (auto const error = detail::openRegular(path, O_RDWR | O_NOFOLLOW, opened)) {
        return error;
    }
    struct stat status;
    if (fstat(opened.get(), &status) == -1) {
        return lastError();
    }
    if (status.st_nlink > 1) {
        return systemError(EMLINK);
    }
    file_ = std::move(opened);
    return {};
}

std::error_code OpenFile::openFolder(std::string const& path)
{
    return openAs(path, O_RDONLY | O_DIRECTORY, 0);
}

std::error_code OpenFile::create(std::string const& path, mode_t permissions)
{
    return openAs(path, O_RDWR | O_CREAT | O_EXCL, permissions);
}

std::error_code OpenFile::createUnnamed(std::string const& folder)
{
    if (!openAs(folder, O_TMPFILE | O_RDWR | O_EXCL, 0600)) {
        return {};
    }
    std::string const name = newUnnamedName(folder); // Not every file system has files without a name.
    OpenFile named;
    if (auto const error = named.create(name, 0600)) {
        return error;
    }
    if (auto const error = removeUnflushed(name)) {
        return error;
    }
    file_ = std::move(named.file_);
    return {};
}

std::error_code OpenFile::length(std::uint64_t& length) const
{
    struct stat status;
    if (fstat(file_.get(), &status) == -1) {
        return lastError();
    }
    length = static_cast<std::uint64_t>(status.st_size);
    return {};
}

std::error_code OpenFile::readAt(std::uint64_t offset, void* buffer, std::size_t count, std::size_t& done) const
{
    return detail::readAll(buffer, count, done, [&](void* rest, std::size_t wanted, std::size_t before) -> ssize_t {
        bool const isThere = isOffset(offset + before);
        return isThere ? calls().pread(file_.get(), rest, wanted, static_cast<off_t>(offset + before)) : 0;
    });
}

std::error_code OpenFile::writeAt(std::uint64_t offset, std::string_view bytes) const
{
    return detail::writeAll(bytes, [&](std::string_view rest, std::size_t before) -> ssize_t {
        if (!isOffset(offset + before)) {
            errno = EFBIG;
            return -1;
        }
        return calls().pwrite(file_.get(), rest.data(), rest.size(), static_cast<off_t>(offset + before));
    });
}

std::error_code OpenFile::truncate(std::uint64_t length) const
{
    if (!isOffset(length)) {
        return systemError(EFBIG);
    }
    return outcome(retried([&] { return calls().ftruncate(file_.get(), static_cast<off_t>(length)); }));
}

std::error_code OpenFile::flush() const
{
    return detail::flush(file_);
}

std::error_code OpenFile::flushFileSystem() const
{
    std::error_code const error = outcome(retried([&] { return calls().syncfs(file_.get()); }));
    bool const isUnknown = error == systemError(EINVAL) || error == systemError(EOPNOTSUPP);
    return isUnknown ? systemError(ENOSYS) : error;
}

std::error_code renameUnflushed(std::string const& from, std::string const& to)
{
    if (!isPath(from) || !isPath(to)) {
        return systemError(EILSEQ);
    }
    return outcome(retried([&] { return calls().renameat(AT_FDCWD, from.c_str(), AT_FDCWD, to.c_str()); }));
}

std::error_code removeUnflushed(std::string const& path)
{
    if (!isPath(path)) {
        return systemError(EILSEQ);
    }
    return outcome(retried([&] { return calls().unlinkat(AT_FDCWD, path.c_str(), 0); }));
}

} // namespace os
