#include "platform/os/os_files.h"

#include "platform/os/os_calls.h"
#include "platform/os/os_detail.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cerrno>
#include <cstdio>
#include <dirent.h>
#include <fcntl.h>
#include <linux/limits.h>
#include <memory>
#include <new>
#include <optional>
#include <stdexcept>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>
#include <utility>
#include <vector>

namespace os {
namespace {

using detail::Entry;
using detail::flush;
using detail::flushEntries;
using detail::isPath;
using detail::kFolderFlags;
using detail::lastError;
using detail::openAt;
using detail::outcome;
using detail::retried;
using detail::systemError;
using detail::writeAll;

constexpr int kMostLinks = 40;   // as many as the system follows in one path
constexpr int kMostAttempts = 5; // at a temporary file that others take away
constexpr char const* kAcl = "system.posix_acl_access";

std::string folderOf(std::string const& path)
{
    std::size_t const slash = path.rfind('/');
    return slash == std::string::npos ? "." : path.substr(0, slash + 1);
}

std::string nameOf(std::string const& path)
{
    return path.substr(path.rfind('/') + 1);
}

// Paths may end in slashes.
std::string parentOf(std::string const& path)
{
    std::size_t const end = path.find_last_not_of('/');
    return end == std::string::npos ? "/" : folderOf(path.substr(0, end + 1));
}

std::error_code findEntry(int from, std::string const& path, Entry& entry)
{
    if (path.empty() || !isPath(path)) {
        return systemError(path.empty() ? ENOENT : EILSEQ);
    }
    Handle folder = openAt(from, folderOf(path), O_PATH | O_DIRECTORY);
    if (!folder.isOpen()) {
        return lastError();
    }
    entry = {std::move(folder), nameOf(path)};
    return systemError(entry.name.empty() ? EISDIR : 0);
}

// Follows the links at the end of the path by hand: renaming over a link would reentry the link.
std::error_code findTarget(std::string const& path, Entry& entry)
{
    std::error_code error = findEntry(AT_FDCWD, path, entry);
    std::array<char, PATH_MAX> link;
    for (int links = 0; !error; ++links) {
        ssize_t const length = readlinkat(entry.folder.get(), entry.name.c_str(), link.data(), link.size());
        if (length == -1) {
            return errno == EINVAL || errno == ENOENT ? std::error_code() : lastError();
        }
        if (links == kMostLinks) {
            return systemError(ELOOP);
        }
        error = findEntry(entry.folder.get(), std::string(link.data(), static_cast<std::size_t>(length)), entry);
    }
    return error;
}

// The status of the file that is to be replaced; none when there is no such file yet.
using OldStatus = std::optional<struct stat>;

std::error_code examineTarget(Entry const& target, OldStatus& old)
{
    struct stat status;
    if (fstatat(target.folder.get(), target.name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == -1) {
        return errno == ENOENT ? std::error_code() : lastError();
    }
    if (!S_ISREG(status.st_mode)) {
        return systemError(S_ISDIR(status.st_mode) ? EISDIR : EINVAL);
    }
    old = status;
    return outcome(faccessat(target.folder.get(), target.name.c_str(), W_OK, AT_EACCESS));
}

// What the names of all temporary files for `name` begin with. Long names are cut so that the rest finds room, and not
// inside a character: some file systems take no broken ones.
std::string tempPrefix(std::string const& name)
{
    std::size_t length = std::min<std::size_t>(name.size(), NAME_MAX - 45);
    while (length < name.size() && length > 0 && (static_cast<unsigned char>(name[length]) & 0xC0U) == 0x80) {
        --length;
    }
    return "." + name.substr(0, length) + ".";
}

std::string newTempName(std::string const& name)
{
    static std::atomic<unsigned long> counter{0};
    return tempPrefix(name) + std::to_string(getpid()) + "-" + std::to_string(counter++) + ".tmp";
}

bool areDigits(std::string_view text)
{
    return !text.empty() && text.find_first_not_of("0123456789") == std::string_view::npos;
}

bool isTempName(std::string_view name, std::string_view prefix)
{
    constexpr std::string_view kEnd = ".tmp";
    if (name.size() < prefix.size() + kEnd.size() || name.substr(0, prefix.size()) != prefix ||
        name.substr(name.size() - kEnd.size()) != kEnd) {
        return false;
    }
    std::string_view const numbers = name.substr(prefix.size(), name.size() - prefix.size() - kEnd.size());
    std::size_t const dash = numbers.find('-');
    return dash != std::string_view::npos && areDigits(numbers.substr(0, dash)) && areDigits(numbers.substr(dash + 1));
}

// A temporary file is locked by its writer as long as the writer lives.
void removeIfAbandoned(Handle const& folder, char const* name)
{
    Handle const file = openAt(folder.get(), name, O_RDWR | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY);
    if (file.isOpen() && calls().flock(file.get(), LOCK_EX | LOCK_NB) == 0) {
        calls().unlinkat(folder.get(), name, 0);
    }
}

FolderReader readerOf(Handle folder)
{
    FolderReader reader(folder.isOpen() ? fdopendir(folder.get()) : nullptr, closedir);
    if (reader) {
        folder.release();
    }
    return reader;
}

void removeAbandoned(Entry const& target)
{
    FolderReader const reader = readerOf(openAt(target.folder.get(), ".", kFolderFlags));
    std::string const prefix = tempPrefix(target.name);
    while (dirent const* const entry = reader ? readdir(reader.get()) : nullptr) {
        if (isTempName(entry->d_name, prefix)) {
            removeIfAbandoned(target.folder, entry->d_name);
        }
    }
}

std::error_code takeOwner(struct stat const& old, Handle const& file)
{
    struct stat status;
    if (fstat(file.get(), &status) == -1) {
        return lastError();
    }
    if (status.st_uid == old.st_uid && status.st_gid == old.st_gid) {
        return {};
    }
    auto const give = [&](uid_t owner) {
        return retried([&] { return calls().fchown(file.get(), owner, old.st_gid); });
    };
    constexpr uid_t kUnchanged = static_cast<uid_t>(-1);
    // Only the administrator gives files away, but everybody shares them with the own groups.
    int result = give(old.st_uid);
    if (result == -1 && errno == EPERM) {
        result = give(kUnchanged);
    }
    return result == -1 && errno == EPERM ? std::error_code() : outcome(result);
}

// The list of users and groups with rights of their own. The temporary file may have got one from its folder.
std::error_code takeAccessList(Entry const& target, Handle const& file)
{
    std::string const path = "/proc/self/fd/" + std::to_string(target.folder.get()) + "/" + target.name;
    std::vector<char> list(XATTR_SIZE_MAX);
    ssize_t const size = lgetxattr(path.c_str(), kAcl, list.data(), list.size());
    if (size > 0) {
        return outcome(retried(
            [&] { return calls().fsetxattr(file.get(), kAcl, list.data(), static_cast<std::size_t>(size), 0); }));
    }
    std::error_code const error = outcome(retried([&] { return calls().fremovexattr(file.get(), kAcl); }));
    return error == systemError(ENODATA) || error == systemError(EOPNOTSUPP) ? std::error_code() : error;
}

std::error_code takeMode(struct stat const& old, Handle const& file)
{
    struct stat status;
    if (fstat(file.get(), &status) == -1) {
        return lastError();
    }
    bool const sameOwner = status.st_uid == old.st_uid && status.st_gid == old.st_gid;
    // Running as the owner is not for another owner.
    mode_t const mode = old.st_mode & (sameOwner ? 07777U : 0777U);
    return outcome(retried([&] { return calls().fchmod(file.get(), mode); }));
}

// In this order: a change of the owner takes away mode bits, the list of users changes them.
std::error_code takePermissions(Entry const& target, OldStatus const& old, Handle const& file)
{
    if (!old) {
        return {};
    }
    if (auto const error = takeOwner(*old, file)) {
        return error;
    }
    if (auto const error = takeAccessList(target, file)) {
        return error;
    }
    return takeMode(*old, file);
}

std::error_code findFolder(std::string const& path)
{
    struct statx status;
    if (auto const error = examine(path, status)) {
        return error;
    }
    return systemError(S_ISDIR(status.stx_mode) ? 0 : ENOTDIR);
}

// Reads on until the end shows: the file may grow meanwhile.
std::error_code readToEnd(Handle const& file, std::string& content)
{
    struct stat status;
    if (fstat(file.get(), &status) == -1) {
        return lastError();
    }
    std::string bytes;
    std::size_t total = 0;
    for (std::size_t wanted = static_cast<std::size_t>(status.st_size) + 1; total == bytes.size(); wanted *= 2) {
        bytes.resize(wanted);
        std::size_t done = 0;
        if (auto const error = readBytes(file, &bytes[total], wanted - total, done)) {
            return error;
        }
        total += done;
    }
    bytes.resize(total);
    content = std::move(bytes);
    return {};
}

// What a step returns when another way, or another attempt, may lead to the end.
std::error_code tryAgain()
{
    return systemError(EAGAIN);
}

// The new content beside the target until it takes the target's place. Removes itself unless it did.
class TempFile {
public:
    explicit TempFile(Entry const& target) : target_(target) {}
    TempFile(TempFile const&) = delete;
    TempFile& operator=(TempFile const&) = delete;
    ~TempFile()
    {
        if (!name_.empty()) {
            retried([&] { return calls().unlinkat(folder(), name_.c_str(), 0); });
        }
    }

    Handle const& file() const { return file_; }

    // A file without a name vanishes with its process. Not every file system has them.
    std::error_code createUnnamed(mode_t mode)
    {
        file_ = openAt(folder(), ".", O_TMPFILE | O_RDWR, mode);
        return file_.isOpen() ? std::error_code() : tryAgain();
    }

    std::error_code createNamed(mode_t mode)
    {
        file_ = Handle(claimName([&](char const* name) {
            return calls().openat(folder(), name, O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, mode);
        }));
        if (!file_.isOpen()) {
            return lastError();
        }
        lock();
        struct stat status;
        bool const isThere = fstat(file_.get(), &status) == 0 && status.st_nlink > 0;
        return isThere ? std::error_code() : tryAgain(); // Before it was locked, it looked abandoned.
    }

    std::error_code giveName()
    {
        if (!name_.empty()) {
            return {};
        }
        lock();
        std::string const source = "/proc/self/fd/" + std::to_string(file_.get());
        int const result = claimName([&](char const* name) {
            return calls().linkat(AT_FDCWD, source.c_str(), folder(), name, AT_SYMLINK_FOLLOW);
        });
        return result == -1 && isRefusal(errno) ? tryAgain() : outcome(result);
    }

    std::error_code takePlace()
    {
        int const result =
            retried([&] { return calls().renameat(folder(), name_.c_str(), folder(), target_.name.c_str()); });
        if (result == -1) {
            return errno == ENOENT ? tryAgain() : lastError();
        }
        name_.clear();
        return {};
    }

private:
    int folder() const { return target_.folder.get(); }

    // Makes the file by a name that is free; what `make` returned.
    template <class Make>
    int claimName(Make const& make)
    {
        for (;;) {
            std::string name = newTempName(target_.name);
            int const result = retried([&] { return make(name.c_str()); });
            if (result != -1) {
                name_ = std::move(name); // Must not fail: the file is there already.
            }
            if (result != -1 || errno != EEXIST) {
                return result;
            }
        }
    }

    // Without a lock another writer may take the file for abandoned and remove it, and this one starts again.
    void lock() const { calls().flock(file_.get(), LOCK_EX | LOCK_NB); }

    // No /proc, or no rights to what is in it.
    static bool isRefusal(int error)
    {
        return error == ENOENT || error == EACCES || error == EPERM || error == EXDEV || error == EOPNOTSUPP;
    }

    Entry const& target_;
    Handle file_;
    std::string name_;
};

std::error_code replaceOnce(Entry const& target, OldStatus const& old, std::string_view content, bool named)
{
    TempFile temp(target);
    mode_t const mode = old ? old->st_mode & 0600U : 0666U; // Nobody reads it before its permissions are right.
    if (auto const error = named ? temp.createNamed(mode) : temp.createUnnamed(mode)) {
        return error;
    }
    if (auto const error = writeAll(temp.file(), content)) {
        return error;
    }
    if (auto const error = takePermissions(target, old, temp.file())) {
        return error;
    }
    if (auto const error = flush(temp.file())) { // Before the rename: the name never shows unwritten blocks.
        return error;
    }
    if (auto const error = temp.giveName()) {
        return error;
    }
    return temp.takePlace();
}

} // namespace

std::error_code replaceFile(std::string const& path, std::string_view content)
{
    Entry target;
    if (auto const error = findTarget(path, target)) {
        return error;
    }
    OldStatus old;
    if (auto const error = examineTarget(target, old)) {
        return error;
    }
    Handle const folder = openAt(target.folder.get(), ".", kFolderFlags);
    if (!folder.isOpen()) {
        return lastError();
    }
    removeAbandoned(target);
    std::error_code error = replaceOnce(target, old, content, false);
    for (int attempt = 0; error == tryAgain() && attempt < kMostAttempts; ++attempt) {
        error = replaceOnce(target, old, content, true);
    }
    return error ? error : flushEntries(folder);
}

std::error_code replaceFileBy(std::string const& path, std::string const& source)
{
    Entry target;
    if (auto const error = findTarget(path, target)) {
        return error;
    }
    OldStatus old;
    if (auto const error = examineTarget(target, old)) {
        return error;
    }
    Handle const folder = openAt(target.folder.get(), ".", kFolderFlags);
    Handle const file = openAt(AT_FDCWD, source, O_RDWR | O_NOFOLLOW);
    if (!folder.isOpen() || !file.isOpen()) {
        return lastError();
    }
    if (auto const error = takePermissions(target, old, file)) {
        return error;
    }
    if (auto const error = flush(file)) {
        return error;
    }
    if (retried([&] { return calls().renameat(AT_FDCWD, source.c_str(), folder.get(), target.name.c_str()); }) == -1) {
        return lastError();
    }
    return flushEntries(folder);
}

std::error_code makeFolder(std::string const& path, mode_t permissions)
{
    if (!isPath(path)) {
        return systemError(EILSEQ);
    }
    if (retried([&] { return calls().mkdir(path.c_str(), permissions); }) == -1) {
        return lastError();
    }
    std::error_code const error = flushFolder(parentOf(path));
    if (!error || error == std::errc::permission_denied) { // Folders can be made where they cannot be listed.
        return {};
    }
    calls().unlinkat(AT_FDCWD, path.c_str(), AT_REMOVEDIR);
    return error;
}

std::error_code makeFolders(std::string const& path, mode_t permissions)
{
    std::vector<std::string> missing;
    for (std::string current = path;; current = parentOf(current)) {
        std::error_code const error = findFolder(current);
        if (!error) {
            break;
        }
        if (error != std::errc::no_such_file_or_directory) {
            return error;
        }
        missing.push_back(current);
    }
    for (std::size_t i = missing.size(); i-- > 0;) {
        std::error_code const error = makeFolder(missing[i], i == 0 ? permissions : permissions | 0300U);
        if (error && findFolder(missing[i])) { // Another process may have made it.
            return error;
        }
    }
    return {};
}

std::error_code removeFile(std::string const& path)
{
    Entry entry;
    if (auto const error = findEntry(AT_FDCWD, path, entry)) {
        return error;
    }
    Handle const folder = openAt(entry.folder.get(), ".", kFolderFlags);
    if (!folder.isOpen()) {
        return lastError();
    }
    if (retried([&] { return calls().unlinkat(folder.get(), entry.name.c_str(), 0); }) == -1) {
        return lastError();
    }
    return flushEntries(folder);
}

std::error_code flushFolder(std::string const& path)
{
    if (!isPath(path)) {
        return systemError(EILSEQ);
    }
    Handle const folder = openAt(AT_FDCWD, path, kFolderFlags);
    return folder.isOpen() ? flushEntries(folder) : lastError();
}

std::error_code examine(std::string const& path, struct statx& status)
{
    if (!isPath(path)) {
        return systemError(EILSEQ);
    }
    return outcome(statx(AT_FDCWD, path.c_str(), 0, STATX_BASIC_STATS | STATX_BTIME, &status));
}

bool mayWriteIn(std::string const& path)
{
    return !findFolder(path) && faccessat(AT_FDCWD, path.c_str(), W_OK | X_OK, AT_EACCESS) == 0;
}

FolderReader openFolder(std::string const& path)
{
    if (!isPath(path)) {
        errno = EILSEQ;
        return {nullptr, closedir};
    }
    return readerOf(openAt(AT_FDCWD, path, kFolderFlags));
}

std::error_code openForReading(std::string const& path, Handle& file)
{
    return detail::openRegular(path, O_RDONLY, file);
}

std::error_code readBytes(Handle const& file, void* buffer, std::size_t count, std::size_t& done)
{
    return detail::readAll(buffer, count, done, [&](void* rest, std::size_t wanted, std::size_t) {
        return calls().read(file.get(), rest, wanted);
    });
}

std::error_code readFile(std::string const& path, std::string& content)
{
    Handle file;
    if (auto const error = openForReading(path, file)) {
        return error;
    }
    try {
        return readToEnd(file, content);
    } catch (std::bad_alloc const&) {
        return systemError(ENOMEM);
    } catch (std::length_error const&) {
        return systemError(ENOMEM);
    }
}

} // namespace os
