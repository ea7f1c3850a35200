#include "host/user/projects.h"

#include "host/errors/failure.h"
#include "host/errors/save_report.h"
#include "host/text/utf8.h"
#include "host/user/user_folders.h"

#include "platform/os/os_files.h"
#include "platform/os/os_lock.h"

#include <chrono>
#include <memory>

namespace tav {

namespace {

constexpr std::chrono::milliseconds kPatience(2000);
constexpr char const* kNext = "Check the folder 'tav' in XDG_CONFIG_HOME, by default in '~/.config'.";

std::string folder()
{
    return userFolder("XDG_CONFIG_HOME", ".config") + "/tav";
}

std::shared_ptr<common::Config> load(SaveReport const& report)
{
    return valueOrFail(common::Config::load(fromUtf8(folder()), report), kNext);
}

os::FileLock lock()
{
    os::FileLock held;
    std::error_code error = os::makeFolders(folder(), 0777);
    if (!error) {
        error = held.acquire(folder() + "/tav.lock", "tav", kPatience);
    }
    if (error) {
        throw Failure("The list of projects cannot be locked: " + error.message() + ".", kNext);
    }
    return held;
}

} // namespace

common::ConfigData readProjects()
{
    SaveReport const nothingToSave;
    return load(nothingToSave)->read();
}

void addProject(OdString const& path, OdString const& name, OdString const& id)
{
    os::FileLock const held = lock();
    SaveReport report;
    load(report)->write()->add(path, name, id);
    report.failUnlessSaved(kNext);
}

} // namespace tav
