/// What a user can set: for all repositories in the user's folder for configuration, and for one of them in ".tav". A
/// repository may come from anywhere, so nothing in its file can run a program.
#pragma once

#include "host/user/config_file.h"

#include <optional>
#include <string>
#include <vector>

namespace tav {

/// Where a value comes from.
enum class Origin { environment, repository, user, standard };

struct SettingEntry {
    std::string key;
    std::string value;
    Origin origin;
    bool isIgnored; ///< it is in a file and has no effect there: no such setting or value, or it would run a program
};

/// The files of the user and of the repository whose ".tav" is the folder `tavFolder`, in bytes.
std::string userSettingsPath();
std::string repositorySettingsPath(std::string const& tavFolder);

/// Throws `Failure` when there is no setting `key`, when it cannot have that value, and when only a user can set it and
/// `origin` is a repository.
void checkSetting(std::string const& key, std::string const& value, Origin origin);
/// The first part of that.
void requireSettingKey(std::string const& key);

/// The settings that apply in one place.
class Settings {
public:
    /// Those of the user, and of the repository of `tavFolder` unless that is empty. Throws `Failure` when a file
    /// cannot be used.
    explicit Settings(std::string const& tavFolder);

    /// The value of a known key. Environment comes before repository, and that before the user's own.
    std::string value(std::string const& key) const { return effective(key).value; }
    SettingEntry effective(std::string const& key) const;
    /// The effective value of every key in ascending order, followed by the ignored entries.
    std::vector<SettingEntry> all() const;
    /// The entries of one of the two files.
    std::vector<SettingEntry> in(Origin origin) const;

private:
    ConfigFile user_;
    std::optional<ConfigFile> repository_;
};

} // namespace tav
