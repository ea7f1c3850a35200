#include "host/cli/commands.h"
#include "host/cli/current_settings.h"
#include "host/cli/output.h"
#include "host/errors/failure.h"
#include "host/repository/lock.h"
#include "host/repository/open.h"
#include "host/text/utf8.h"
#include "host/user/config_lock.h"

#include <string>
#include <vector>

namespace tav {

namespace {

char const* nameOf(Origin origin)
{
    switch (origin) {
    case Origin::environment: return "environment";
    case Origin::repository: return "repository";
    case Origin::user: return "user";
    case Origin::standard: return "default";
    }
    return "";
}

void printDocument(std::vector<SettingEntry> const& entries)
{
    kutils::json::Array array;
    for (SettingEntry const& entry : entries) {
        kutils::json::Object object;
        object[L"key"] = jsonText(fromUtf8(entry.key));
        object[L"value"] = jsonText(fromUtf8(entry.value));
        object[L"origin"] = jsonText(fromUtf8(nameOf(entry.origin)));
        object[L"ignored"] = entry.isIgnored;
        array.emplace_back(std::move(object));
    }
    printJson(std::move(array));
}

void list(std::vector<SettingEntry> const& entries, bool json)
{
    if (json) {
        printDocument(entries);
        return;
    }
    for (SettingEntry const& entry : entries) {
        print(
            shown(fromUtf8(entry.key)) + " = " + shown(fromUtf8(entry.value)) + "  (" + nameOf(entry.origin) +
            (entry.isIgnored ? ", ignored" : "") + ")\n");
    }
}

Origin chosenFile(ConfigOptions const& options)
{
    return options.repository ? Origin::repository : Origin::user;
}

std::string placeOf(Origin origin)
{
    return origin == Origin::repository ? "this repository" : "you";
}

/// The value of one of the files, or else the one in effect.
SettingEntry find(std::string const& key, ConfigOptions const& options)
{
    requireSettingKey(key);
    Settings const settings = currentSettings();
    if (!options.user && !options.repository) {
        return settings.effective(key);
    }
    for (SettingEntry const& entry : settings.in(chosenFile(options))) {
        if (entry.key == key) {
            return entry;
        }
    }
    throw Failure(
        "'" + key + "' is not set for " + placeOf(chosenFile(options)) + ".",
        "Run 'tav config --list' to see what is in effect.");
}

void show(std::string const& key, ConfigOptions const& options)
{
    SettingEntry const entry = find(key, options);
    if (options.json) {
        printDocument({entry});
    } else {
        print(shownLine(fromUtf8(entry.value)) + "\n");
    }
}

struct LockedFile {
    os::FileLock lock;
    ConfigFile file;
};

LockedFile lockedFile(Origin origin)
{
    if (origin == Origin::user) {
        os::FileLock lock = lockUserConfig();
        return {std::move(lock), ConfigFile(userSettingsPath())};
    }
    common::RootPath const root = openRepository("");
    os::FileLock lock = lockRepository(root, "config");
    return {std::move(lock), ConfigFile(repositorySettingsPath(root.tavPath().ansi_str()))};
}

/// What has been set may have no effect here.
void noteOther(std::string const& key, Origin origin)
{
    SettingEntry const effective = currentSettings().effective(key);
    if (effective.origin != origin) {
        printNote(
            "Here the value is '" + effective.value + "': " +
            (effective.origin == Origin::repository ? "this repository has its own."
                                                    : "the environment takes precedence."));
    }
}

void unset(std::string const& key, Origin origin)
{
    LockedFile locked = lockedFile(origin);
    if (!locked.file.remove(key)) { // Also a key of another tav.
        throw Failure(
            "'" + key + "' is not set for " + placeOf(origin) + ".", "Run 'tav config --list' to see what is set.");
    }
    locked.file.save();
    report("'" + shown(fromUtf8(key)) + "' is no longer set for " + placeOf(origin) + ".\n");
}

} // namespace

void saveSetting(std::string const& key, std::string const& value, Origin origin)
{
    checkSetting(key, value, origin);
    LockedFile locked = lockedFile(origin);
    locked.file.set(key, value);
    locked.file.save();
}

void config(ConfigOptions const& options)
{
    if (!options.key) {
        Settings const settings = currentSettings();
        bool const isOfFile = options.user || options.repository;
        list(isOfFile ? settings.in(chosenFile(options)) : settings.all(), options.json);
    } else if (options.unset) {
        unset(*options.key, chosenFile(options));
    } else if (options.value) {
        Origin const origin = chosenFile(options);
        saveSetting(*options.key, *options.value, origin);
        report(
            "'" + shown(fromUtf8(*options.key)) + "' is '" + shown(fromUtf8(*options.value)) + "' for " +
            placeOf(origin) + ".\n");
        noteOther(*options.key, origin);
    } else {
        show(*options.key, options);
    }
}

} // namespace tav
