#include "platform/os/os_lock.h"

#include "platform/os/os_calls.h"
#include "platform/os/os_detail.h"
#include "platform/os/os_files.h"

#include <cerrno>
#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <thread>
#include <utility>

namespace os {
namespace {

constexpr std::chrono::milliseconds kPause(20);

using detail::lastError;

bool lockWithin(int file, std::chrono::milliseconds patience)
{
    auto const end = std::chrono::steady_clock::now() + patience;
    while (calls().flock(file, LOCK_EX | LOCK_NB) == -1) {
        if (errno != EINTR && (errno != EWOULDBLOCK || std::chrono::steady_clock::now() >= end)) {
            return false;
        }
        std::this_thread::sleep_for(kPause);
    }
    return true;
}

/// What serves for something else is no lock: the note would go into it.
std::error_code requireOwn(int file)
{
    struct stat status;
    if (fstat(file, &status) == -1) {
        return lastError();
    }
    if (!S_ISREG(status.st_mode)) {
        return std::make_error_code(std::errc::not_supported);
    }
    return status.st_nlink > 1 ? std::make_error_code(std::errc::too_many_links) : std::error_code();
}

} // namespace

std::error_code FileLock::acquire(std::string const& path, std::string const& note, std::chrono::milliseconds patience)
{
    FileLock lock;
    lock.file_ = detail::openAt(AT_FDCWD, path, O_RDWR | O_CREAT | O_NOFOLLOW | O_NONBLOCK, 0666);
    if (!lock.file_.isOpen() || !lockWithin(lock.file_.get(), patience)) {
        return lastError();
    }
    if (std::error_code const error = requireOwn(lock.file_.get())) {
        return error;
    }
    // Only the first line counts, so a longer note of before need not be cut off. A disk too full for the note is no
    // reason to refuse the lock.
    std::string const line = note + "\n";
    [[maybe_unused]] auto const written = calls().write(lock.file_.get(), line.data(), line.size());
    *this = std::move(lock);
    return {};
}

bool FileLock::isHeld(std::string const& path)
{
    Handle const probe = detail::openAt(AT_FDCWD, path, O_RDONLY | O_NOFOLLOW | O_NONBLOCK);
    return probe.isOpen() && calls().flock(probe.get(), LOCK_SH | LOCK_NB) == -1 && errno == EWOULDBLOCK;
}

std::string FileLock::holder(std::string const& path)
{
    std::string content;
    if (readFile(path, content)) {
        return {};
    }
    return content.substr(0, content.find('\n'));
}

} // namespace os
