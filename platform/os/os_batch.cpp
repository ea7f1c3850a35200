#include "platform/os/os_batch.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace os {
namespace {

using detail::Handle;
using detail::lastError;
using detail::openAt;
using detail::outcome;
using detail::retried;

constexpr int kFolderFlags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW;
constexpr mode_t kFolderPermissions = 0777; // less the process's umask
constexpr std::uint64_t kNanosecondsPerSecond = 1'000'000'000;

struct Place {
    std::string folder;
    std::string name;
};

Place placeOf(std::string const& path)
{
    std::size_t const slash = path.rfind('/');
    return slash == std::string::npos ? Place{"", path} : Place{path.substr(0, slash), path.substr(slash + 1)};
}

Handle openOrMake(int folder, std::string const& name)
{
    Handle opened = openAt(folder, name, kFolderFlags);
    if (opened.isOpen() || errno != ENOENT) {
        return opened;
    }
    if (calls().mkdirat(folder, name.c_str(), kFolderPermissions) == -1 && errno != EEXIST) {
        return opened;
    }
    return openAt(folder, name, kFolderFlags);
}

/// Gives the file `from` the permissions of the file that it replaces.
std::error_code takePermissions(int folder, std::string const& name, std::string const& from)
{
    struct stat old;
    if (fstatat(folder, name.c_str(), &old, AT_SYMLINK_NOFOLLOW) == -1 || !S_ISREG(old.st_mode)) {
        return {};
    }
    Handle const file = openAt(AT_FDCWD, from, O_RDONLY);
    if (!file.isOpen()) {
        return lastError();
    }
    return outcome(retried([&] { return calls().fchmod(file.get(), old.st_mode & 07777); }));
}

} // namespace

Batch::Batch(std::string const& folder) : top_(openAt(AT_FDCWD, folder, O_RDONLY | O_DIRECTORY)) {}

std::error_code Batch::place(std::string const& from, std::string const& path)
{
    auto const [folder, name] = placeOf(path);
    if (std::error_code const error = enter(folder, Missing::isMade)) {
        return error;
    }
    if (std::error_code const error = takePermissions(current_.get(), name, from)) {
        return error;
    }
    return outcome(calls().renameat(AT_FDCWD, from.c_str(), current_.get(), name.c_str()));
}

std::error_code Batch::remove(std::string const& path)
{
    auto const [folder, name] = placeOf(path);
    std::error_code error = enter(folder, Missing::fails);
    if (!error) {
        error = outcome(calls().unlinkat(current_.get(), name.c_str(), 0));
    }
    return error == std::errc::no_such_file_or_directory ? std::error_code() : error;
}

void Batch::removeEmptyFoldersOf(std::string const& path)
{
    for (Place place = placeOf(placeOf(path).folder); !place.name.empty(); place = placeOf(place.folder)) {
        if (enter(place.folder, Missing::fails) ||
            calls().unlinkat(current_.get(), place.name.c_str(), AT_REMOVEDIR) == -1) {
            return;
        }
    }
}

std::error_code Batch::flush()
{
    return outcome(retried([&] { return calls().syncfs(top_.get()); }));
}

std::error_code Batch::enter(std::string const& folder, Missing missing)
{
    if (current_.isOpen() && currentPath_ == folder) {
        return {};
    }
    Handle place = openAt(top_.get(), ".", kFolderFlags);
    for (std::size_t begin = 0; place.isOpen() && begin < folder.size();) {
        std::size_t const end = std::min(folder.find('/', begin), folder.size());
        std::string const name = folder.substr(begin, end - begin);
        place = missing == Missing::isMade ? openOrMake(place.get(), name) : openAt(place.get(), name, kFolderFlags);
        begin = end + 1;
    }
    if (!place.isOpen()) {
        return lastError();
    }
    current_ = std::move(place);
    currentPath_ = folder;
    return {};
}

std::error_code setModificationTime(std::string const& path, std::uint64_t time)
{
    Handle const file = openAt(AT_FDCWD, path, O_RDONLY);
    if (!file.isOpen()) {
        return lastError();
    }
    timespec stamp{};
    stamp.tv_sec = static_cast<time_t>(time / kNanosecondsPerSecond);
    stamp.tv_nsec = static_cast<long>(time % kNanosecondsPerSecond);
    std::array<timespec, 2> const times = {timespec{0, UTIME_OMIT}, stamp};
    return outcome(calls().futimens(file.get(), times.data()));
}

} // namespace os
