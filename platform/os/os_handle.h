/// What the sources of this floor share: open files that close themselves, and calls that go on after a signal.
#pragma once

#include "platform/os/os_calls.h"

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <fcntl.h>
#include <string>
#include <system_error>
#include <utility>

namespace os::detail {

constexpr int kFolderFlags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW;
constexpr int kPassingFlags = O_PATH | O_DIRECTORY | O_NOFOLLOW; // Needs no right to list the folder.

inline std::error_code lastError()
{
    return {errno, std::generic_category()};
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

inline std::error_code outcome(int result)
{
    return result == -1 ? lastError() : std::error_code();
}

/// A path, cut in two.
struct Place {
    std::string folder; ///< empty when the path has one part only
    std::string name;
};

inline Place placeOf(std::string const& path)
{
    std::size_t const slash = path.rfind('/');
    return slash == std::string::npos ? Place{"", path} : Place{path.substr(0, slash), path.substr(slash + 1)};
}

/// An open file or folder; closes itself.
class Handle {
public:
    Handle() = default;
    explicit Handle(int file) : file_(file) {}
    Handle(Handle&& other) noexcept : file_(std::exchange(other.file_, -1)) {}
    Handle& operator=(Handle&& other) noexcept
    {
        std::swap(file_, other.file_);
        return *this;
    }
    // Interrupted or not, the system closes the file: a second call could hit another one.
    ~Handle()
    {
        if (file_ != -1) {
            calls().close(file_);
        }
    }

    bool isOpen() const { return file_ != -1; }
    int get() const { return file_; }
    int release() { return std::exchange(file_, -1); }

private:
    int file_ = -1;
};

inline Handle openAt(int folder, std::string const& path, int flags, mode_t mode = 0)
{
    return Handle(retried([&] { return calls().openat(folder, path.c_str(), flags | O_CLOEXEC, mode); }));
}

/// Waits until the entries of a folder are safe on the disk. Some file systems keep their folders safe themselves and
/// know no flushing of them.
inline std::error_code flushEntries(Handle const& folder)
{
    std::error_code const error = outcome(retried([&] { return calls().fsync(folder.get()); }));
    return error == std::errc::invalid_argument ? std::error_code() : error;
}

/// Opens the folder `path` below the open folder `top` part by part, each with `open(folder, name)`; an empty `path` is
/// `top` itself. A part that is a link, or becomes one meanwhile, is no folder.
template <class Open>
Handle walk(int top, std::string const& path, Open const& open)
{
    Handle place = openAt(top, ".", kPassingFlags);
    for (std::size_t begin = 0; place.isOpen() && begin < path.size();) {
        std::size_t const end = std::min(path.find('/', begin), path.size());
        place = open(place.get(), path.substr(begin, end - begin));
        begin = end + 1;
    }
    return place;
}

} // namespace os::detail
