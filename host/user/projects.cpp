#include "host/user/projects.h"

#include "host/errors/failure.h"
#include "host/errors/save_report.h"
#include "host/text/utf8.h"
#include "host/user/config_lock.h"

#include <map>
#include <memory>

namespace tav {

namespace {

constexpr char const* kNext = "Check the folder 'tav' in XDG_CONFIG_HOME, by default in '~/.config'.";

std::shared_ptr<common::Config> load(SaveReport const& report)
{
    return valueOrFail(common::Config::load(fromUtf8(userConfigFolder()), report), kNext);
}

void replaceEntry(common::Config& config, OdString const& from, OdString const& to)
{
    std::map<OdString, common::ProjectInfo> const& projects = config.read().projects;
    auto const project = projects.find(from);
    if (project == projects.end()) {
        return;
    }
    common::ProjectInfo const info = project->second;
    bool const isListed = projects.count(to) > 0;
    common::WriteConfigData const data = config.write();
    data->remove(from);
    if (!isListed) {
        data->add(to, info.name, info.cloud);
    }
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

void forgetProject(OdString const& path)
{
    os::FileLock const held = lockUserConfig();
    SaveReport report;
    load(report)->write()->remove(path);
    report.failUnlessSaved(kNext);
}

void moveProject(OdString const& from, OdString const& to)
{
    os::FileLock const held = lockUserConfig();
    SaveReport report;
    replaceEntry(*load(report), from, to);
    report.failUnlessSaved(kNext);
}

bool hasProjects()
{
    return ut::FileName::fileExists(common::ConfigPath::configFile(fromUtf8(userConfigFolder())));
}

} // namespace tav
