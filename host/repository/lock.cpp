#include "host/repository/lock.h"

#include "host/errors/failure.h"

#include <unistd.h>

#include <array>
#include <chrono>

namespace tav {

namespace {

constexpr std::chrono::milliseconds kPatience(2000);

std::string hostName()
{
    std::array<char, 256> name{};
    return gethostname(name.data(), name.size() - 1) == 0 ? name.data() : "this machine";
}

std::string lockPath(common::RootPath const& root)
{
    return (root.tavPath() + L"/tav.lock").ansi_str();
}

/// Whether something else has the name of the lock.
bool isNoLock(std::error_code const& error)
{
    return error == std::errc::too_many_symbolic_link_levels || error == std::errc::too_many_links ||
           error == std::errc::is_a_directory || error == std::errc::not_supported;
}

} // namespace

os::FileLock lockRepository(common::RootPath const& root, std::string const& name)
{
    std::string const path = lockPath(root);
    std::string const note = "'tav " + name + "', process " + std::to_string(getpid()) + " on " + hostName();
    os::FileLock lock;
    std::error_code const error = lock.acquire(path, note, kPatience);
    if (error == std::errc::operation_would_block) {
        throw Failure(
            os::FileLock::holder(path) + ", is changing the repository.", "Run the command again when that is done.");
    }
    if (isNoLock(error)) {
        throw Failure(
            "The repository cannot be locked: " + error.message() + ".",
            "Move '" + path + "' away; the next command makes a new one.");
    }
    if (error) {
        throw Failure(
            "The repository cannot be locked: " + error.message() + ".",
            "Check your permissions for '" + root.tavPath().ansi_str() + "'.");
    }
    return lock;
}

std::string lockHolder(common::RootPath const& root)
{
    std::string const path = lockPath(root);
    return os::FileLock::isHeld(path) ? os::FileLock::holder(path) : std::string();
}

} // namespace tav
