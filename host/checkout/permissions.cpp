#include "host/checkout/permissions.h"

#include <filesystem>
#include <sys/stat.h>
#include <system_error>

namespace tav {

namespace {

constexpr mode_t kMask = 07777;

mode_t permissionsOfNewFiles()
{
    mode_t const mask = umask(0);
    umask(mask);
    return 0666 & ~mask;
}

} // namespace

std::uint32_t ownPermissions(std::string const& path)
{
    static mode_t const ofNewFiles = permissionsOfNewFiles();
    struct stat status = {};
    if (lstat(path.c_str(), &status) != 0 || !S_ISREG(status.st_mode)) {
        return 0;
    }
    mode_t const permissions = status.st_mode & kMask;
    return permissions == ofNewFiles ? 0 : permissions;
}

void setPermissions(std::string const& path, std::uint32_t permissions)
{
    std::error_code ignored;
    std::filesystem::permissions(path, static_cast<std::filesystem::perms>(permissions & kMask), ignored);
}

} // namespace tav
