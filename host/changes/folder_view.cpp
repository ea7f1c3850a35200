#include "host/changes/folder_view.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>

namespace tav {

namespace {

constexpr int kFolderFlags = O_PATH | O_DIRECTORY | O_CLOEXEC; // Needs no right to list the folder.

std::int64_t nanoseconds(timespec const& time)
{
    constexpr std::int64_t kSecond = 1'000'000'000;
    return static_cast<std::int64_t>(time.tv_sec) * kSecond + time.tv_nsec;
}

Presence presenceAfterError()
{
    return errno == ENOENT || errno == ENOTDIR ? Presence::isGone : Presence::isUnknown;
}

/// Whether files can be there where `name`, an entry of `folder`, could not be entered.
Presence presenceBehind(os::Handle const& folder, std::string const& name)
{
    Presence const presence = presenceAfterError();
    struct stat entry;
    bool const isLink = fstatat(folder.get(), name.c_str(), &entry, AT_SYMLINK_NOFOLLOW) == 0 && S_ISLNK(entry.st_mode);
    return isLink ? Presence::isBehindLink : presence;
}

Sight sightOf(struct stat const& entry)
{
    if (S_ISDIR(entry.st_mode)) {
        return {};
    }
    if (!S_ISREG(entry.st_mode)) {
        return {Presence::isThere, std::nullopt};
    }
    FileStamp const stamp{
        static_cast<std::uint64_t>(entry.st_size), entry.st_ino, nanoseconds(entry.st_ctim),
        nanoseconds(entry.st_mtim)};
    return {Presence::isThere, stamp};
}

/// A link is there wherever it leads.
Sight sightThroughLink(os::Handle const& folder, std::string const& name)
{
    struct stat target;
    bool const isFile = fstatat(folder.get(), name.c_str(), &target, 0) == 0 && S_ISREG(target.st_mode);
    return isFile ? sightOf(target) : Sight{Presence::isThere, std::nullopt};
}

} // namespace

FolderView::FolderView(common::RootPath const& root) : top_(open(root.path().ansi_str().c_str(), kFolderFlags)) {}

Sight FolderView::look(std::string const& path)
{
    if (path.find('\0') != std::string::npos) {
        return {};
    }
    std::size_t const slash = path.rfind('/');
    Presence const way = enter(slash == std::string::npos ? std::string() : path.substr(0, slash));
    if (!current_.isOpen()) {
        return {way, std::nullopt};
    }
    std::string const name = path.substr(slash + 1); // Without a slash, from 0.
    struct stat entry;
    if (fstatat(current_.get(), name.c_str(), &entry, AT_SYMLINK_NOFOLLOW) != 0) {
        return {presenceAfterError(), std::nullopt};
    }
    return S_ISLNK(entry.st_mode) ? sightThroughLink(current_, name) : sightOf(entry);
}

Presence FolderView::enter(std::string const& folder)
{
    if (currentPath_ == folder) {
        return way_;
    }
    currentPath_ = folder;
    way_ = Presence::isThere;
    current_ = os::Handle(openat(top_.get(), ".", kFolderFlags));
    for (std::size_t begin = 0; current_.isOpen() && begin < folder.size();) {
        std::size_t const end = std::min(folder.find('/', begin), folder.size());
        std::string const part = folder.substr(begin, end - begin);
        int const next = openat(current_.get(), part.c_str(), kFolderFlags | O_NOFOLLOW);
        way_ = next < 0 ? presenceBehind(current_, part) : Presence::isThere;
        current_ = os::Handle(next);
        begin = end + 1;
    }
    return way_;
}

} // namespace tav
