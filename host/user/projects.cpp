#include "host/user/projects.h"

#include "host/errors/failure.h"
#include "host/errors/save_report.h"
#include "host/text/utf8.h"
#include "host/user/config_lock.h"

#include <memory>

namespace tav {

namespace {

constexpr char const* kNext = "Check the folder 'tav' in XDG_CONFIG_HOME, by default in '~/.config'.";

std::shared_ptr<common::Config> load(SaveReport const& report)
{
    return valueOrFail(common::Config::load(fromUtf8(userConfigFolder()), report), kNext);
}

} // namespace

common::ConfigData readProjects()
{
    SaveReport const nothingToSave;
    return load(nothingToSave)->read();
}

void addProject(OdString const& path, OdString const& name, OdString const& id)
{
    os::FileLock const held = lockUserConfig();
    SaveReport report;
    load(report)->write()->add(path, name, id);
    report.failUnlessSaved(kNext);
}

} // namespace tav
