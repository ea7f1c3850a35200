#include "tests/support/temp_folder.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <dirent.h>
#include <fcntl.h>
#include <fstream>
#include <iterator>
#include <sys/stat.h>
#include <unistd.h>

namespace support {
namespace {

[[noreturn]] void fail(std::string const& step, std::string const& path)
{
    std::fprintf(stderr, "TempFolder: %s '%s': %s\n", step.c_str(), path.c_str(), std::strerror(errno));
    std::abort();
}

void require(bool succeeded, char const* step, std::string const& path)
{
    if (!succeeded) {
        fail(step, path);
    }
}

bool isFolder(int parent, char const* name)
{
    struct stat status;
    return fstatat(parent, name, &status, AT_SYMLINK_NOFOLLOW) == 0 && S_ISDIR(status.st_mode);
}

std::vector<std::string> namesIn(int folder)
{
    std::vector<std::string> names;
    int const copy = openat(folder, ".", O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    DIR* const listing = copy == -1 ? nullptr : fdopendir(copy);
    if (listing == nullptr) {
        fail("cannot list", "a folder inside");
    }
    while (dirent const* const entry = readdir(listing)) {
        std::string_view const name = entry->d_name;
        if (name != "." && name != "..") {
            names.emplace_back(name);
        }
    }
    closedir(listing);
    return names;
}

// By handles instead of paths: a test may have made paths longer than the system takes.
void removeContent(int parent, char const* name)
{
    fchmodat(parent, name, 0700, 0); // A test may have shut the folder.
    int const folder = openat(parent, name, O_RDONLY | O_DIRECTORY | O_CLOEXEC | O_NOFOLLOW);
    require(folder != -1, "cannot open", name);
    for (std::string const& entry : namesIn(folder)) {
        bool const hasContent = isFolder(folder, entry.c_str());
        if (hasContent) {
            removeContent(folder, entry.c_str());
        }
        require(unlinkat(folder, entry.c_str(), hasContent ? AT_REMOVEDIR : 0) == 0, "cannot remove", entry);
    }
    close(folder);
}

void collectNames(int parent, char const* folderName, std::string const& prefix, std::vector<std::string>& names)
{
    int const folder = openat(parent, folderName, O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    require(folder != -1, "cannot open", folderName);
    for (std::string const& name : namesIn(folder)) {
        if (!isFolder(folder, name.c_str())) {
            names.push_back(prefix + name);
            continue;
        }
        names.push_back(prefix + name + "/");
        collectNames(folder, name.c_str(), prefix + name + "/", names);
    }
    close(folder);
}

void makeParents(std::string const& path, std::size_t from)
{
    for (std::size_t end = path.find('/', from); end != std::string::npos; end = path.find('/', end + 1)) {
        std::string const parent = path.substr(0, end);
        require(mkdir(parent.c_str(), 0777) == 0 || errno == EEXIST, "cannot make", parent);
    }
}

} // namespace

TempFolder::TempFolder()
{
    char const* const base = std::getenv("TMPDIR");
    path_ = std::string(base != nullptr ? base : "/tmp") + "/mu_test_XXXXXX";
    require(mkdtemp(path_.data()) != nullptr, "cannot make", path_);
}

TempFolder::~TempFolder()
{
    removeContent(AT_FDCWD, path_.c_str());
    require(rmdir(path_.c_str()) == 0, "cannot remove", path_);
}

OdString TempFolder::widePath() const
{
    return {path_.c_str(), path_.size(), CP_UTF_8};
}

std::string TempFolder::pathTo(std::string_view name) const
{
    return (path_ + "/").append(name);
}

OdString TempFolder::widePathTo(std::string_view name) const
{
    std::string const path = pathTo(name);
    return {path.c_str(), path.size(), CP_UTF_8};
}

void TempFolder::write(std::string_view name, std::string_view content) const
{
    std::string const path = pathTo(name);
    makeParents(path, path_.size() + 1);
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file.write(content.data(), static_cast<std::streamsize>(content.size()));
    file.close();
    require(file.good(), "cannot write", path);
}

std::string TempFolder::read(std::string_view name) const
{
    std::string const path = pathTo(name);
    std::ifstream file(path, std::ios::binary);
    require(file.good(), "cannot read", path);
    return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
}

void TempFolder::makeFolder(std::string_view name) const
{
    makeParents(pathTo(name) + "/", path_.size() + 1);
}

void TempFolder::makeLink(std::string_view name, std::string const& target) const
{
    std::string const path = pathTo(name);
    makeParents(path, path_.size() + 1);
    require(symlink(target.c_str(), path.c_str()) == 0, "cannot make the link", path);
}

bool TempFolder::has(std::string_view name) const
{
    struct stat status;
    return lstat(pathTo(name).c_str(), &status) == 0;
}

std::vector<std::string> TempFolder::list() const
{
    std::vector<std::string> names;
    collectNames(AT_FDCWD, path_.c_str(), "", names);
    std::sort(names.begin(), names.end());
    return names;
}

} // namespace support
