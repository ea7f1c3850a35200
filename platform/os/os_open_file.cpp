#include "platform/os/os_open_file.h"

#include "platform/os/os_calls.h"
#include "platform/os/os_handle.h"

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

using detail::lastError;
using detail::outcome;
using detail::retried;

std::error_code systemError(int number)
{
    return {number, std::generic_category()};
}

bool isPath(std::string const& path)
{
    return path.find('\0') == std::string::npos;
}

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

OpenFile::OpenFile(OpenFile&& other) noexcept : file_(std::exchange(other.file_, -1)) {}

OpenFile& OpenFile::operator=(OpenFile&& other) noexcept
{
    std::swap(file_, other.file_);
    return *this;
}

// Interrupted or not, the system closes the file: a second call could hit another one.
OpenFile::~OpenFile()
{
    if (file_ != -1) {
        calls().close(file_);
    }
}

std::error_code OpenFile::openAs(std::string const& path, int flags, mode_t permissions)
{
    if (!isPath(path)) {
        return systemError(EILSEQ);
    }
    OpenFile opened;
    opened.file_ =
        retried([&] { return calls().openat(AT_FDCWD, path.c_str(), flags | O_CLOEXEC | O_NOCTTY, permissions); });
    if (!opened.isOpen()) {
        return lastError();
    }
    std::swap(file_, opened.file_);
    return {};
}

std::error_code OpenFile::openRegular(std::string const& path, int flags)
{
    OpenFile opened;
    if (auto const error = opened.openAs(path, flags | O_NONBLOCK, 0)) {
        return error;
    }
    struct stat status;
    if (fstat(opened.file_, &status) == -1) {
        return lastError();
    }
    if (!S_ISREG(status.st_mode)) {
        return systemError(S_ISDIR(status.st_mode) ? EISDIR : EINVAL);
    }
    std::swap(file_, opened.file_);
    return {};
}

std::error_code OpenFile::openForReading(std::string const& path)
{
    return openRegular(path, O_RDONLY);
}

std::error_code OpenFile::openForChanging(std::string const& path)
{
    OpenFile opened;
    if (auto const error = opened.openRegular(path, O_RDWR | O_NOFOLLOW)) {
        return error;
    }
    struct stat status;
    if (fstat(opened.file_, &status) == -1) {
        return lastError();
    }
    if (status.st_nlink > 1) {
        return systemError(EMLINK);
    }
    std::swap(file_, opened.file_);
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
    std::swap(file_, named.file_);
    return {};
}

std::error_code OpenFile::length(std::uint64_t& length) const
{
    struct stat status;
    if (fstat(file_, &status) == -1) {
        return lastError();
    }
    length = static_cast<std::uint64_t>(status.st_size);
    return {};
}

std::error_code OpenFile::readAt(std::uint64_t offset, void* buffer, std::size_t count, std::size_t& done) const
{
    for (done = 0; done < count && isOffset(offset + done);) {
        void* const rest = static_cast<char*>(buffer) + done;
        auto const place = static_cast<off_t>(offset + done);
        ssize_t const result = retried([&] { return calls().pread(file_, rest, count - done, place); });
        if (result == -1) {
            return lastError();
        }
        if (result == 0) {
            break;
        }
        done += static_cast<std::size_t>(result);
    }
    return {};
}

std::error_code OpenFile::writeAt(std::uint64_t offset, std::string_view bytes) const
{
    while (!bytes.empty()) {
        if (!isOffset(offset)) {
            return systemError(EFBIG);
        }
        auto const place = static_cast<off_t>(offset);
        ssize_t const written = retried([&] { return calls().pwrite(file_, bytes.data(), bytes.size(), place); });
        if (written == -1) {
            return lastError();
        }
        bytes.remove_prefix(static_cast<std::size_t>(written));
        offset += static_cast<std::size_t>(written);
    }
    return {};
}

std::error_code OpenFile::truncate(std::uint64_t length) const
{
    if (!isOffset(length)) {
        return systemError(EFBIG);
    }
    return outcome(retried([&] { return calls().ftruncate(file_, static_cast<off_t>(length)); }));
}

std::error_code OpenFile::flush() const
{
    return outcome(retried([&] { return calls().fsync(file_); }));
}

std::error_code OpenFile::flushFileSystem() const
{
    std::error_code const error = outcome(retried([&] { return calls().syncfs(file_); }));
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
