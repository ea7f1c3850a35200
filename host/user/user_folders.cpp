#include "host/user/user_folders.h"

#include "host/errors/failure.h"

#include <pwd.h>
#include <unistd.h>

#include <array>
#include <cstdlib>

namespace tav {

namespace {

std::string variable(char const* name)
{
    char const* const value = std::getenv(name);
    return value ? value : "";
}

std::string home()
{
    std::string const named = variable("HOME");
    if (!named.empty()) {
        return named;
    }
    passwd const* const user = getpwuid(geteuid());
    if (!user || !user->pw_dir || user->pw_dir[0] != '/') {
        throw Failure("You have no home folder.", "Set HOME, or XDG_DATA_HOME and XDG_CONFIG_HOME.");
    }
    return user->pw_dir;
}

} // namespace

std::string userFolder(char const* variableName, char const* fallback)
{
    std::string const named = variable(variableName);
    bool const isAbsolute = !named.empty() && named.front() == '/';
    return isAbsolute ? named : home() + "/" + fallback;
}

std::string userName()
{
    passwd const* const user = getpwuid(geteuid());
    std::string const name = user ? user->pw_name : std::to_string(geteuid());
    std::array<char, 256> machine{};
    return gethostname(machine.data(), machine.size() - 1) == 0 ? name + "@" + machine.data() : name;
}

} // namespace tav
