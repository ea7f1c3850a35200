/// Helpers shared by the sources of this folder: results of calls, calls that continue after a signal, and entries of
/// folders.
#pragma once

#include "platform/os/os_calls.h"
#include "platform/os/os_handle.h"

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <fcntl.h>
#include <string>
#include <string_view>
#include <sys/stat.h>
#include <sys/types.h>
#include <system_error>
#include <utility>

namespace os::detail {

/// For listing and flushing a folder.
constexpr int kFolderFlags = O_RDONLY | O_DIRECTORY;
/// For passing through a folder that is not a link. Needs no permission to list the folder.
constexpr int kPassingFlags = O_PATH | O_DIRECTORY | O_NOFOLLOW;

inline std::error_code systemError(int number)
{
    return {number, std::generic_category()};
}

inline std::error_code lastError()
{
    return systemError(errno);
}

inline std::error_code outcome(int result)
{
    return result == -1 ? lastError() : std::error_code();
}

template <class Call>
auto retried(Call const& call)
{
    for (;;) {
        auto const result = call();
        if (result != -1 || errno != EINTR) {
            return result;
        }
    }
}

/// Writes all of `bytes`, each time with `write(rest, done)`, which returns how much of the rest was written; `done` is
/// the number of bytes before it.
template <class Write>
std::error_code writeAll(std::string_view bytes, Write const& write)
{
    for (std::size_t done = 0; done < bytes.size();) {
        ssize_t const written = retried([&] { return write(bytes.substr(done), done); });
        if (written == -1) {
            return lastError();
        }
        done += static_cast<std::size_t>(written);
    }
    return {};
}

inline std::error_code writeAll(Handle const& file, std::string_view bytes)
{
    return writeAll(
        bytes, [&](std::string_view rest, std::size_t) { return calls().write(file.get(), rest.data(), rest.size()); });
}

/// Reads until `count` bytes are in `buffer` or the file ends, each time with `read(rest, wanted, done)`. `done` is the
/// number of bytes read, after an error too.
template <class Read>
std::error_code readAll(void* buffer, std::size_t count, std::size_t& done, Read const& read)
{
    for (done = 0; done < count;) {
        void* const rest = static_cast<char*>(buffer) + done;
        ssize_t const result = retried([&] { return read(rest, count - done, done); });
        if (result <= 0) {
            return result == -1 ? lastError() : std::error_code();
        }
        done += static_cast<std::size_t>(result);
    }
    return {};
}

/// Whether the system would see the whole of `path`.
inline bool isPath(std::string_view path)
{
    return path.find('\0') == std::string_view::npos;
}

/// A path, cut in two at its last slash.
struct SplitPath {
    std::string folder; ///< empty when the path has one part only
    std::string name;
};

inline SplitPath split(std::string const& path)
{
    std::size_t const slash = path.rfind('/');
    return slash == std::string::npos ? SplitPath{"", path} : SplitPath{path.substr(0, slash), path.substr(slash + 1)};
}

/// A name in an open folder.
struct Entry {
    Handle folder;
    std::string name;
};

inline Handle openAt(int folder, std::string const& path, int flags, mode_t mode = 0)
{
    return Handle(retried([&] { return calls().openat(folder, path.c_str(), flags | O_CLOEXEC, mode); }));
}

/// Opens the regular file `path`. Anything else is refused without blocking. `file` changes only on success.
inline std::error_code openRegular(std::string const& path, int flags, Handle& file)
{
    if (!isPath(path)) {
        return systemError(EILSEQ);
    }
    Handle opened = openAt(AT_FDCWD, path, flags | O_NONBLOCK | O_NOCTTY);
    struct stat status;
    if (!opened.isOpen() || fstat(opened.get(), &status) == -1) {
        return lastError();
    }
    if (!S_ISREG(status.st_mode)) {
        return systemError(S_ISDIR(status.st_mode) ? EISDIR : EINVAL);
    }
    file = std::move(opened);
    return {};
}

inline std::error_code flush(Handle const& file)
{
    return outcome(retried([&] { return calls().fsync(file.get()); }));
}

/// Waits until the entries of a folder are safe on the disk. Some file systems keep their folders safe themselves and
/// do not support flushing them.
inline std::error_code flushEntries(Handle const& folder)
{
    std::error_code const error = flush(folder);
    return error == std::errc::invalid_argument ? std::error_code() : error;
}

/// Opens the folder `path` below the open folder `top` part by part, each with `open(folder, name)`; an empty `path` is
/// `top` itself. A part that is a link, or becomes one during the call, does not count as a folder.
template <class Open>
Handle walk(int top, std::string const& path, Open const& open)
{
    Handle folder = openAt(top, ".", kPassingFlags);
    for (std::size_t begin = 0; folder.isOpen() && begin < path.size();) {
        std::size_t const end = std::min(path.find('/', begin), path.size());
        folder = open(folder.get(), path.substr(begin, end - begin));
        begin = end + 1;
    }
    return folder;
}

} // namespace os::detail
