#include "common/mu_common_config.h"

#include "common/mu_common_document.h"
#include "common/mu_common_json.h"
#include "common/mu_common_translate.h"

#include "platform/ut/Dir.h"

#include <cwchar>
#include <string>
#include <utility>

namespace common {

using kutils::json::Object;
using kutils::json::Value;

namespace {

constexpr int kEverybody = 0777; // less the umask

// Never destroyed: documents are also written at the very end of the process.
OdString const& s_projects_map = *new OdString(L"projects_map");
OdString const& s_info = *new OdString(L"info");
OdString const& s_path = *new OdString(L"path");
OdString const& s_name = *new OdString(L"name");
OdString const& s_uid = *new OdString(L"uid");

std::wstring wide(OdString const& text)
{
    return std::wstring(text.c_str(), text.getLength());
}

Object serializeProjects(OdString const& path, ProjectInfo const& project)
{
    Object info;
    info[wide(s_name)] = wide(project.name);
    info[wide(s_uid)] = wide(project.cloud);
    Object object;
    object[wide(s_path)] = wide(path);
    object[wide(s_info)] = std::move(info);
    return object;
}

std::pair<OdString, ProjectInfo> deserializeProjects(Object object)
{
    Object const& info = getObjectValue(object, s_info, OdString::kEmpty);
    OdString path = getStringValue(object, s_path, OdString::kEmpty);
    OdString name = getStringValue(info, s_name, OdString::kEmpty);
    return {std::move(path), ProjectInfo{std::move(name), getStringValue(info, s_uid, OdString::kEmpty)}};
}

Expected<ConfigData> deserializeConfig(Object const& root)
{
    if (!hasKey(root, s_projects_map)) {
        return ConfigData();
    }
    auto projects =
        fromJsonMap<OdString, ProjectInfo>(getArrayValue(root, s_projects_map, OdString::kEmpty), deserializeProjects);
    if (!projects.hasValue()) {
        return projects.error();
    }
    return ConfigData{std::move(projects).visit(GetRValueOrThrow<std::map<OdString, ProjectInfo>>{})};
}

/// The nearest folder on the way up that exists; without components when there is none.
ut::FileName nearestExisting(OdString const& path)
{
    ut::FileName place(path);
    while (place.getDirCount() != 0 && !place.exists(ut::FileName::kAnyKind)) {
        place.removeLastDir();
    }
    return place;
}

} // namespace

ConfigPath::ConfigPath(OdString const& path) : path_(path) {}

Expected<ConfigPath> ConfigPath::get(OdString const& path)
{
    if (ut::Dir::exists(configFile(path))) {
        return ConfigPath(path);
    }
    if (path.isEmpty()) {
        return ErrorMessage(translate(L"VC config path is empty."));
    }
    ut::FileName const ancestor = nearestExisting(path);
    if (ancestor.getDirCount() == 0 || !ancestor.exists(ut::FileName::kAnyKind)) {
        return ErrorMessage(translate(L"The path %ls is not valid."), path.c_str());
    }
    if (!ancestor.isDirWritable()) {
        return ErrorMessage(translate(L"The directory %ls is not writable."), path.c_str());
    }
    if (!ut::FileName::mkdir(path, kEverybody, ut::FileName::kFullPath)) {
        return ErrorMessage(translate(L"Could not create directory at: %ls"), path.c_str());
    }
    return ConfigPath(path);
}

OdString ConfigPath::configFile(OdString const& folder)
{
    return folder + ut::FileName::getPathSeparator() + L"directories.state";
}

OdString ConfigPath::configFile() const
{
    return configFile(path_);
}

OdString ConfigPath::path() const
{
    return path_;
}

bool ConfigPathOrder::operator()(ConfigPath const& a, ConfigPath const& b) const
{
    return std::wcscmp(a.path().c_str(), b.path().c_str()) < 0;
}

void ConfigData::add(OdString const& path, OdString const& name, OdString const& cloud)
{
    projects[path] = ProjectInfo{name, cloud};
}

void ConfigData::remove(OdString const& path)
{
    projects.erase(path);
}

bool ListenerOrder::operator()(
    std::reference_wrapper<ConfigListener> const& a, std::reference_wrapper<ConfigListener> const& b) const
{
    return std::less<ConfigListener*>()(&a.get(), &b.get());
}

WriteConfigData::WriteConfigData(ConfigData& data, ConfigListeners& listeners, std::shared_ptr<void const> owner)
    : data_(data)
    , listeners_(listeners)
    , owner_(std::move(owner))
{
}

WriteConfigData::~WriteConfigData()
{
    // A listener may change the set, and for a copy of it there may be no memory: the next one is looked up by address.
    for (auto next = listeners_.begin(); next != listeners_.end();) {
        std::reference_wrapper<ConfigListener> const listener = *next;
        listener.get().configChanged();
        next = listeners_.upper_bound(listener);
    }
}

Config::Config(ConfigPath const& path, ConfigData data, IoInterface const& io)
    : configFile_(path.configFile())
    , path_(path)
    , data_(std::move(data))
    , io_(&io)
{
}

Config::Config(ConfigPath const& path, IoInterface const& io) : Config(path, ConfigData(), io) {}

Config::~Config()
{
    if (modified_) {
        io_->report(save());
    }
}

Expected<std::shared_ptr<Config>> Config::load(OdString const& folder, IoInterface const& io)
{
    Expected<ConfigPath> const path = ConfigPath::get(folder);
    if (!path.hasValue()) {
        return path.error();
    }
    ut::FileName const file(path.value().configFile());
    if (!file.exists(ut::FileName::kAnyKind)) {
        return std::make_shared<Config>(path.value(), io);
    }
    try {
        Value const document = readDocument(file.getFullPath());
        Expected<ConfigData> data = deserializeConfig(document.get_object());
        if (!data.hasValue()) {
            return data.error();
        }
        return factory().get(path.value(), std::move(data).visit(GetRValueOrThrow<ConfigData>{}), io);
    } catch (OdError const& error) {
        return ErrorMessage(error.description());
    }
}

Config::Factory& Config::factory()
{
    static Factory instance;
    return instance;
}

WriteConfigData Config::write()
{
    modified_ = true;
    return WriteConfigData(data_, listeners_, weak_from_this().lock());
}

void Config::addListener(ConfigListener& listener)
{
    listeners_.insert(listener);
}

void Config::removeListener(ConfigListener& listener)
{
    listeners_.erase(listener);
}

WriteOutcome Config::save() const
{
    try {
        Object root;
        if (!data_.projects.empty()) {
            root[wide(s_projects_map)] = toJson(data_.projects, serializeProjects);
        }
        return writeDocument(configFile_.getFullPath(), std::move(root));
    } catch (...) {
        return ErrorMessage(translate(L"An unexpected error occurred while deserializing the config file."));
    }
}

std::shared_ptr<Config> Config::Factory::get(ConfigPath const& path, ConfigData data, IoInterface const& io)
{
    std::weak_ptr<Config>& entry = living_[path];
    if (std::shared_ptr<Config> live = entry.lock()) {
        return live;
    }
    // Not make_shared: the entry that stays behind would keep the memory of the whole configuration.
    std::shared_ptr<Config> created(new Config(path, std::move(data), io));
    entry = created;
    return created;
}

void Config::Factory::erase(ConfigPath const& path)
{
    living_.erase(path);
}

} // namespace common
