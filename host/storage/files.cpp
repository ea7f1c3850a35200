#include "host/storage/files.h"

#include "host/storage/storage_error.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

#include <algorithm>
#include <cerrno>
#include <string_view>
#include <sys/stat.h>

namespace tav {

bool exists(std::string const& path)
{
    struct statx status;
    std::error_code const error = os::examine(path, status);
    if (error != std::errc::no_such_file_or_directory && error != std::errc::not_a_directory) {
        check(error, "'" + path + "' cannot be examined");
    }
    return !error;
}

void makeFolders(std::string const& path)
{
    check(os::makeFolders(path, 0777), "The folder '" + path + "' cannot be made");
}

std::vector<std::string> entriesOf(std::string const& folder)
{
    std::vector<std::string> names;
    os::FolderReader const reader = os::openFolder(folder);
    if (!reader && errno != ENOENT) {
        check({errno, std::generic_category()}, "'" + folder + "' cannot be read");
    }
    while (dirent const* const entry = reader ? readdir(reader.get()) : nullptr) {
        std::string_view const name = entry->d_name;
        if (name != "." && name != "..") {
            names.emplace_back(name);
        }
    }
    std::sort(names.begin(), names.end());
    return names;
}

void flushFile(std::string const& path)
{
    os::OpenFile file;
    check(file.openForReading(path), "'" + path + "' cannot be opened");
    check(file.flush(), "'" + path + "' cannot be written");
}

void flushFolder(std::string const& path)
{
    check(os::flushFolder(path), "'" + path + "' cannot be written");
}

} // namespace tav
