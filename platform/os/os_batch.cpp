#include "platform/os/os_batch.h"

#include "platform/os/os_detail.h"
#include "platform/os/os_files.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <dirent.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace os {
namespace {

using detail::kFolderFlags;
using detail::lastError;
using detail::openAt;
using detail::outcome;
using detail::retried;
using detail::split;
using detail::SplitPath;

constexpr mode_t kFolderPermissions = 0777; // less the process's umask
constexpr std::uint64_t kNanosecondsPerSecond = 1'000'000'000;
constexpr char const* kCopy = ".placing.tmp";

Handle openFolderIn(int folder, std::string const& name)
{
    return openAt(folder, name, detail::kPassingFlags);
}

Handle openOrMake(int folder, std::string const& name)
{
    Handle opened = openFolderIn(folder, name);
    if (opened.isOpen() || errno != ENOENT) {
        return opened;
    }
    if (calls().mkdirat(folder, name.c_str(), kFolderPermissions) == -1 && errno != EEXIST) {
        return opened;
    }
    return openFolderIn(folder, name);
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

std::int64_t nanoseconds(timespec const& time)
{
    return static_cast<std::int64_t>(time.tv_sec) * static_cast<std::int64_t>(kNanosecondsPerSecond) + time.tv_nsec;
}

/// Removes a folder that holds nothing but folders. Links are entries like any others.
std::error_code removeEmptyTree(int folder, std::string const& name)
{
    Handle opened = openAt(folder, name, kFolderFlags | O_NOFOLLOW);
    FolderReader const reader(opened.isOpen() ? fdopendir(opened.get()) : nullptr, closedir);
    if (!reader) {
        return lastError();
    }
    int const inside = opened.release();
    while (dirent const* const entry = readdir(reader.get())) {
        std::string const inner = entry->d_name;
        if (inner == "." || inner == "..") {
            continue;
        }
        if (std::error_code const error = removeEmptyTree(inside, inner)) {
            bool const isNoFolder =
                error == std::errc::not_a_directory || error == std::errc::too_many_symbolic_link_levels;
            return isNoFolder ? std::make_error_code(std::errc::directory_not_empty) : error;
        }
    }
    return outcome(calls().unlinkat(folder, name.c_str(), AT_REMOVEDIR));
}

std::error_code copyBytes(Handle const& from, Handle const& to)
{
    std::array<char, 65536> buffer;
    for (std::size_t count = buffer.size(); count == buffer.size();) {
        if (std::error_code const error = readBytes(from, buffer.data(), buffer.size(), count)) {
            return error;
        }
        if (std::error_code const error = detail::writeAll(to, {buffer.data(), count})) {
            return error;
        }
    }
    return {};
}

/// Makes `to` what `from` is, its permissions and modification time included, and safe on the disk.
std::error_code copyFile(Handle const& from, Handle const& to)
{
    if (std::error_code const error = copyBytes(from, to)) {
        return error;
    }
    struct stat status;
    if (fstat(from.get(), &status) == -1 ||
        retried([&] { return calls().fchmod(to.get(), status.st_mode & 07777); }) == -1) {
        return lastError();
    }
    std::array<timespec, 2> const times = {timespec{0, UTIME_OMIT}, status.st_mtim};
    if (calls().futimens(to.get(), times.data()) == -1) {
        return lastError();
    }
    return detail::flush(to);
}

} // namespace

bool isSame(FileMark const& a, FileMark const& b)
{
    bool const isSameChange = a.isShared || b.isShared || a.changed == b.changed;
    return a.isThere == b.isThere && a.device == b.device && a.number == b.number && a.length == b.length &&
           a.modified == b.modified && isSameChange;
}

Batch::Batch(std::string const& folder) : top_(openAt(AT_FDCWD, folder, kFolderFlags)) {}

std::error_code Batch::mark(std::string const& path, FileMark& mark)
{
    mark = {};
    auto const [folder, name] = split(path);
    std::error_code error = enter(folder, Missing::fails);
    struct stat status;
    if (!error) {
        error = outcome(fstatat(current_.get(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW));
    }
    if (error) {
        bool const isMissing = error == std::errc::no_such_file_or_directory || error == std::errc::not_a_directory;
        return isMissing ? std::error_code() : error;
    }
    if (!S_ISDIR(status.st_mode)) {
        mark = {
            true,
            status.st_nlink > 1,
            status.st_dev,
            status.st_ino,
            static_cast<std::uint64_t>(status.st_size),
            nanoseconds(status.st_mtim),
            nanoseconds(status.st_ctim)};
    }
    return {};
}

std::error_code Batch::place(std::string const& from, std::string const& path)
{
    auto const [folder, name] = split(path);
    if (std::error_code const error = enter(folder, Missing::isMade)) {
        return error;
    }
    if (std::error_code const error = takePermissions(current_.get(), name, from)) {
        return error;
    }
    std::error_code const error = rename(from, name);
    if (error != std::errc::is_a_directory) {
        return error;
    }
    std::error_code const hindrance = removeEmptyTree(current_.get(), name);
    return hindrance ? hindrance : rename(from, name);
}

std::error_code Batch::rename(std::string const& from, std::string const& name)
{
    std::error_code const error = outcome(calls().renameat(AT_FDCWD, from.c_str(), current_.get(), name.c_str()));
    return error == std::errc::cross_device_link ? copy(from, name) : error;
}

/// A copy that a process left when it was killed is of no use to anybody.
std::error_code Batch::copy(std::string const& from, std::string const& name)
{
    Handle const source = openAt(AT_FDCWD, from, O_RDONLY | O_NOFOLLOW);
    if (!source.isOpen() || (calls().unlinkat(current_.get(), kCopy, 0) == -1 && errno != ENOENT)) {
        return lastError();
    }
    Handle const target = openAt(current_.get(), kCopy, O_WRONLY | O_CREAT | O_EXCL, 0600);
    if (!target.isOpen()) {
        return lastError();
    }
    std::error_code error = copyFile(source, target);
    if (!error) {
        error = outcome(calls().renameat(current_.get(), kCopy, current_.get(), name.c_str()));
    }
    if (error) {
        calls().unlinkat(current_.get(), kCopy, 0);
        return error;
    }
    calls().unlinkat(AT_FDCWD, from.c_str(), 0); // Two of them do no harm.
    return {};
}

std::error_code Batch::remove(std::string const& path)
{
    auto const [folder, name] = split(path);
    std::error_code error = enter(folder, Missing::fails);
    if (!error) {
        error = outcome(calls().unlinkat(current_.get(), name.c_str(), 0));
    }
    return error == std::errc::no_such_file_or_directory ? std::error_code() : error;
}

void Batch::removeEmptyFoldersOf(std::string const& path)
{
    for (SplitPath parts = split(split(path).folder); !parts.name.empty(); parts = split(parts.folder)) {
        if (enter(parts.folder, Missing::fails) ||
            calls().unlinkat(current_.get(), parts.name.c_str(), AT_REMOVEDIR) == -1) {
            return;
        }
    }
}

std::error_code Batch::flush()
{
    if (std::error_code const error = outcome(retried([&] { return calls().syncfs(top_.get()); }))) {
        return error;
    }
    for (auto const& fileSystem : fileSystems_) {
        if (retried([&] { return calls().syncfs(fileSystem.second.get()); }) == -1) {
            return lastError();
        }
    }
    return {};
}

/// Folders of the working folder may be mounts.
std::error_code Batch::noteFileSystem(Handle const& folder)
{
    struct stat status;
    struct stat top;
    if (fstat(folder.get(), &status) == -1 || fstat(top_.get(), &top) == -1) {
        return lastError();
    }
    if (status.st_dev != top.st_dev && fileSystems_.count(status.st_dev) == 0) {
        fileSystems_.emplace(status.st_dev, openAt(folder.get(), ".", kFolderFlags));
    }
    return {};
}

std::error_code Batch::enter(std::string const& folder, Missing missing)
{
    if (current_.isOpen() && currentPath_ == folder) {
        return {};
    }
    Handle opened = detail::walk(top_.get(), folder, missing == Missing::isMade ? openOrMake : openFolderIn);
    if (!opened.isOpen()) {
        return lastError();
    }
    if (std::error_code const error = noteFileSystem(opened)) {
        return error;
    }
    current_ = std::move(opened);
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
