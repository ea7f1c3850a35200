#include "host/user/settings.h"

#include "host/errors/failure.h"
#include "host/text/characters.h"
#include "host/text/size.h"
#include "host/text/utf8.h"
#include "host/user/config_lock.h"
#include "host/user/user_folders.h"

#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <utility>

namespace tav {

namespace {

using Words = std::vector<char const*>;

struct Kind {
    char const* key;
    Words values;            ///< that it can have; none: any text of one line
    bool isProgram = false;  ///< never taken from a repository
    bool mayBeEmpty = false; ///< which then means something
    bool isSize = false;
    char const* variable = nullptr; ///< of the environment, which comes before all files
    Words lateVariables = {};       ///< of the environment, which come behind them
};

std::vector<Kind> const& kinds()
{
    static std::vector<Kind> const all = {
        {"color", {"auto", "always", "never"}},
        {"editor", {}, true, false, false, "TAV_EDITOR", {"VISUAL", "EDITOR"}},
        {"log.date", {"both", "relative", "absolute"}},
        {"open.program", {}, true},
        {"pager", {}, true, true, false, "TAV_PAGER", {"PAGER"}},
        {"undo.size", {}, false, false, true},
        {"user.name", {}},
    };
    return all;
}

/// Some systems have a name for the editor of their users' choice.
std::string standardEditor()
{
    return access("/usr/bin/editor", X_OK) == 0 ? "editor" : "vi";
}

std::string standardValue(std::string const& key)
{
    return key == "color"          ? "auto"
           : key == "editor"       ? standardEditor()
           : key == "log.date"     ? "both"
           : key == "open.program" ? "xdg-open"
           : key == "pager"        ? "less"
           : key == "undo.size"    ? "1 GB"
                                   : userName();
}

Kind const* kindOf(std::string const& key)
{
    auto const kind = std::find_if(kinds().begin(), kinds().end(), [&](Kind const& each) { return each.key == key; });
    return kind == kinds().end() ? nullptr : &*kind;
}

bool isOneLine(std::string const& value)
{
    OdString const text = fromUtf8(value);
    return std::none_of(text.c_str(), text.c_str() + text.getLength(), isControl);
}

std::string listOf(Words const& words)
{
    std::string text;
    for (std::size_t i = 0; i < words.size(); ++i) {
        text += (i == 0 ? "'" : i + 1 < words.size() ? ", '" : " or '") + std::string(words[i]) + "'";
    }
    return text;
}

bool isBlank(std::string const& value)
{
    return value.find_first_not_of(' ') == std::string::npos;
}

/// What `value` has to be instead; none when it is good.
std::optional<std::string> whyNotValue(Kind const& kind, std::string const& value)
{
    bool const isListed = std::find(kind.values.begin(), kind.values.end(), value) != kind.values.end();
    if (!kind.values.empty()) {
        return isListed ? std::nullopt : std::optional(listOf(kind.values));
    }
    if (kind.isSize) {
        return parseSize(value) ? std::nullopt : std::optional<std::string>("a size like '500 MB'");
    }
    bool const isGood = isOneLine(value) && (!isBlank(value) || (value.empty() && kind.mayBeEmpty));
    return isGood ? std::nullopt : std::optional<std::string>("a line of text that is not empty");
}

bool isIgnored(std::string const& key, std::string const& value, Origin origin)
{
    Kind const* const kind = kindOf(key);
    return !kind || (kind->isProgram && origin == Origin::repository) || whyNotValue(*kind, value);
}

std::optional<std::string> variable(Kind const& kind, char const* name)
{
    char const* const value = name ? std::getenv(name) : nullptr;
    return !value || whyNotValue(kind, value) ? std::nullopt : std::optional<std::string>(value);
}

std::optional<std::string> earlyVariable(Kind const& kind)
{
    if (kind.key != std::string("color")) {
        return variable(kind, kind.variable);
    }
    char const* const noColour = std::getenv("NO_COLOR");
    return noColour && *noColour ? std::optional<std::string>("never") : std::nullopt;
}

std::optional<std::string> lateVariable(Kind const& kind)
{
    for (char const* const name : kind.lateVariables) {
        if (auto value = variable(kind, name)) {
            return value;
        }
    }
    return std::nullopt;
}

std::optional<std::string> used(ConfigFile const& file, std::string const& key, Origin origin)
{
    auto value = file.text(key);
    return value && isIgnored(key, *value, origin) ? std::nullopt : value;
}

std::vector<SettingEntry> entriesOf(ConfigFile const& file, Origin origin)
{
    std::vector<SettingEntry> entries;
    for (std::string const& key : file.keys()) {
        auto const value = file.text(key);
        entries.push_back({key, value.value_or(""), origin, !value || isIgnored(key, *value, origin)});
    }
    return entries;
}

} // namespace

std::string userSettingsPath()
{
    return userConfigFolder() + "/config";
}

std::string repositorySettingsPath(std::string const& tavFolder)
{
    return tavFolder + "/config";
}

void requireSettingKey(std::string const& key)
{
    if (!kindOf(key)) {
        throw Failure("There is no setting '" + key + "'.", "Run 'tav config --list' to see those that there are.");
    }
}

void checkSetting(std::string const& key, std::string const& value, Origin origin)
{
    requireSettingKey(key);
    Kind const& kind = *kindOf(key);
    if (kind.isProgram && origin == Origin::repository) {
        throw Failure(
            "'" + key + "' names a program, and a repository may come from anybody.", "Set it for yourself only.");
    }
    if (auto const wanted = whyNotValue(kind, value)) {
        throw Failure("'" + value + "' is not a value of '" + key + "'.", "Give " + *wanted + ".");
    }
}

Settings::Settings(std::string const& tavFolder) : user_(userSettingsPath())
{
    if (!tavFolder.empty()) {
        repository_.emplace(repositorySettingsPath(tavFolder));
    }
}

SettingEntry Settings::effective(std::string const& key) const
{
    Kind const& kind = *kindOf(key);
    if (auto const value = earlyVariable(kind)) {
        return {key, *value, Origin::environment, false};
    }
    auto const ofRepository = repository_ ? used(*repository_, key, Origin::repository) : std::nullopt;
    if (ofRepository) {
        return {key, *ofRepository, Origin::repository, false};
    }
    if (auto const value = used(user_, key, Origin::user)) {
        return {key, *value, Origin::user, false};
    }
    if (auto const value = lateVariable(kind)) {
        return {key, *value, Origin::environment, false};
    }
    return {key, standardValue(key), Origin::standard, false};
}

std::vector<SettingEntry> Settings::all() const
{
    std::vector<SettingEntry> entries;
    for (Kind const& kind : kinds()) {
        entries.push_back(effective(kind.key));
    }
    for (Origin const origin : {Origin::repository, Origin::user}) {
        for (SettingEntry& entry : in(origin)) {
            if (entry.isIgnored) {
                entries.push_back(std::move(entry));
            }
        }
    }
    std::stable_sort(entries.begin(), entries.end(), [](auto const& a, auto const& b) { return a.key < b.key; });
    return entries;
}

std::vector<SettingEntry> Settings::in(Origin origin) const
{
    if (origin == Origin::user) {
        return entriesOf(user_, origin);
    }
    return repository_ ? entriesOf(*repository_, origin) : std::vector<SettingEntry>();
}

} // namespace tav
