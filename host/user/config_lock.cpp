#include "host/user/config_lock.h"

#include "host/errors/failure.h"
#include "host/user/user_folders.h"

#include "platform/os/os_files.h"

#include <chrono>

namespace tav {

namespace {

constexpr std::chrono::milliseconds kPatience(2000);

} // namespace

std::string userConfigFolder()
{
    return userFolder("XDG_CONFIG_HOME", ".config") + "/tav";
}

os::FileLock lockUserConfig()
{
    os::FileLock held;
    std::error_code error = os::makeFolders(userConfigFolder(), 0777);
    if (!error) {
        error = held.acquire(userConfigFolder() + "/tav.lock", "tav", kPatience);
    }
    if (error) {
        throw Failure(
            "Your configuration cannot be locked: " + error.message() + ".",
            "Check the folder 'tav' in XDG_CONFIG_HOME, by default in '~/.config'.");
    }
    return held;
}

} // namespace tav
