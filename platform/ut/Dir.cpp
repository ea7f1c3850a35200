#include "platform/ut/Dir.h"

#include "platform/os/os_files.h"

#include <algorithm>
#include <cerrno>
#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <utility>

namespace ut {
namespace {

// The kind of an entry as `dirent` numbers it, DT_UNKNOWN for one that cannot be examined.
int examine(DIR* folder, char const* name, int flags)
{
    struct stat status;
    if (fstatat(dirfd(folder), name, &status, flags) == -1) {
        return DT_UNKNOWN;
    }
    return static_cast<int>(IFTODT(status.st_mode));
}

// What the entry counts as: DT_REG, DT_DIR, or anything else for an entry that is left out.
int kindOf(DIR* folder, dirent const& entry)
{
    int kind = entry.d_type;
    if (kind == DT_UNKNOWN) {
        kind = examine(folder, entry.d_name, AT_SYMLINK_NOFOLLOW);
    }
    bool const leadsToFile = kind == DT_LNK && examine(folder, entry.d_name, 0) == DT_REG;
    return leadsToFile ? static_cast<int>(DT_REG) : kind;
}

bool isItselfOrParent(std::string const& name)
{
    return name == "." || name == "..";
}

} // namespace

bool Dir::exists(OdString const& path)
{
    struct statx status;
    return !os::examine(path.ansi_str(), status) && S_ISDIR(status.stx_mode);
}

bool Dir::create(OdString const& path)
{
    return !os::makeFolder(path.ansi_str(), 0777);
}

bool Dir::open(OdString const& path)
{
    *this = Dir();
    os::FolderReader const folder = os::openFolder(path.ansi_str());
    if (!folder) {
        return false;
    }
    std::vector<Entry> entries;
    errno = 0;
    while (dirent const* const entry = readdir(folder.get())) {
        int const kind = kindOf(folder.get(), *entry);
        if ((kind == DT_REG || kind == DT_DIR) && !isItselfOrParent(entry->d_name)) {
            entries.push_back({entry->d_name, kind == DT_DIR});
        }
        errno = 0;
    }
    if (errno != 0) {
        return false;
    }
    std::sort(entries.begin(), entries.end(), [](Entry const& a, Entry const& b) { return a.name < b.name; });
    entries_ = std::move(entries);
    path_ = path;
    return true;
}

bool Dir::getFirst(OdString& name, OdString const& /*filter*/, int flags)
{
    position_ = 0;
    flags_ = flags;
    return getNext(name);
}

bool Dir::getNext(OdString& name)
{
    while (position_ < entries_.size()) {
        Entry const& entry = entries_[position_++];
        int const kind = entry.isDir ? kDirs : kFiles;
        bool const isHidden = entry.name.front() == '.';
        if ((flags_ & kind) != 0 && (!isHidden || (flags_ & kHidden) != 0)) {
            name = OdString(entry.name.data(), entry.name.size(), CP_UTF_8);
            return true;
        }
    }
    return false;
}

} // namespace ut
