/// The per-user configuration: the projects that the user works with.
///
/// Nothing here takes a lock, but the creation of the process-wide factory is safe. Loading, writing and the release of
/// one configuration belong to one thread.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"
#include "common/mu_common_io_utils.h"

#include "platform/sdk/OdString.h"
#include "platform/ut/FileName.h"

#include <functional>
#include <map>
#include <memory>
#include <set>

namespace common {

/// The folder of a configuration, as it was given: "a" and "a/" are two folders. A plain value.
class MU_COMMON_EXPORT ConfigPath {
public:
    /// Takes `path` without looking at the disk.
    explicit ConfigPath(OdString const& path);

    /// Checks `path` and makes the folder when it is missing, with its parents. The configuration file is not made.
    /// Errors: `path` is empty; neither the folder nor any parent that `path` names exists (the root of the file system
    /// and the current folder do not count); the nearest one that exists is not writable; the folder cannot be made.
    static Expected<ConfigPath> get(OdString const& path);

    /// Path of the configuration file in `folder`.
    static OdString configFile(OdString const& folder);
    /// Path of the configuration file in this folder.
    OdString configFile() const;
    /// The folder as it was given.
    OdString path() const;

private:
    OdString path_;
};

/// Orders configuration folders by the characters of their paths.
struct MU_COMMON_EXPORT ConfigPathOrder {
    /// Whether `a` comes before `b`.
    bool operator()(ConfigPath const& a, ConfigPath const& b) const;
};

/// What is known of a project besides its path.
struct ProjectInfo {
    OdString name;  ///< shown to the user
    OdString cloud; ///< its identifier on the server
};

/// The content of a configuration.
struct MU_COMMON_EXPORT ConfigData {
    std::map<OdString, ProjectInfo> projects; ///< by the path of the working folder

    /// Adds a project, or replaces what is known of one.
    void add(OdString const& path, OdString const& name, OdString const& cloud);
    /// Removes a project, if it exists.
    void remove(OdString const& path);
};

/// What the host implements to be notified of changes. Registered by address, so it must remove itself before it is
/// destroyed.
class MU_COMMON_EXPORT ConfigListener {
public:
    /// Called when a `WriteConfigData` is destroyed. An exception from here ends the process.
    virtual void configChanged() = 0;

protected:
    ConfigListener() = default;
    ConfigListener(ConfigListener const&) = default;
    ConfigListener& operator=(ConfigListener const&) = default;
    ~ConfigListener() = default;
};

/// Orders listeners by their addresses.
struct MU_COMMON_EXPORT ListenerOrder {
    /// Whether the address of `a` is lower than that of `b`.
    bool
    operator()(std::reference_wrapper<ConfigListener> const& a, std::reference_wrapper<ConfigListener> const& b) const;
};

/// The listeners of a configuration, which it does not own.
using ConfigListeners = std::set<std::reference_wrapper<ConfigListener>, ListenerOrder>;

/// Gives access for writing as long as it lives. Its destructor calls all listeners, in ascending order of addresses,
/// whether or not anything was changed, and allocates no memory for that. During these calls, a listener may add and
/// remove listeners, and destroy removed ones: a removed one is not called any more, and an added one is called if it
/// comes later in the order. A listener may also release the last owner of the configuration, which is then destroyed
/// when all have been called.
class MU_COMMON_EXPORT WriteConfigData {
public:
    /// Keeps data and listeners by reference, and `owner`, which may be null, alive as long as itself.
    WriteConfigData(ConfigData& data, ConfigListeners& listeners, std::shared_ptr<void const> owner = nullptr);
    WriteConfigData(WriteConfigData const&) = delete;
    WriteConfigData& operator=(WriteConfigData const&) = delete;
    ~WriteConfigData();

    /// The content, valid as long as the configuration.
    ///@{
    ConfigData* operator->() const { return &data_; }
    ConfigData& operator*() const { return data_; }
    ///@}

private:
    ConfigData& data_;
    ConfigListeners& listeners_;
    std::shared_ptr<void const> owner_;
};

/// The configuration of one folder. Held by `std::shared_ptr`; it is written to the disk only when the last owner
/// releases it.
class MU_COMMON_EXPORT Config : public std::enable_shared_from_this<Config> {
public:
    class Factory;

    /// `io` is kept by address and must outlive the configuration.
    Config(ConfigPath const& path, ConfigData data, IoInterface const& io);
    /// Starts without projects.
    Config(ConfigPath const& path, IoInterface const& io);
    /// A temporary host would be gone when the outcome is reported.
    ///@{
    Config(ConfigPath const& path, ConfigData data, IoInterface const&& io) = delete;
    Config(ConfigPath const& path, IoInterface const&& io) = delete;
    ///@}
    Config(Config const&) = delete;
    Config& operator=(Config const&) = delete;
    /// If `write` was ever called, replaces the configuration file as a whole and reports the outcome to the host,
    /// once. Errors reported: the document cannot be built; the file cannot be written. Both leave the old file, except
    /// when only its folder cannot be flushed: then the new file is there, but a crash may bring the old one back.
    ~Config();

    /// The configuration of `folder`, which is made when it is missing. As long as one that was read from a file lives,
    /// every caller gets that same one, as it is in memory. Without a file, every caller gets a separate one, without
    /// projects. Errors: those of `ConfigPath::get`; the file cannot be read, is not JSON or does not have the expected
    /// form.
    static Expected<std::shared_ptr<Config>> load(OdString const& folder, IoInterface const& io);
    /// A temporary host would be gone when the outcome is reported.
    static Expected<std::shared_ptr<Config>> load(OdString const& folder, IoInterface const&& io) = delete;

    /// The table of living configurations in this process.
    static Factory& factory();

    /// The content, for reading, valid as long as the configuration.
    ConfigData const& read() const { return data_; }
    /// The content, for writing; from here on, the configuration is saved when it is destroyed. The result counts as an
    /// owner of a configuration that is held by `std::shared_ptr`; any other configuration must outlive it.
    WriteConfigData write();

    /// Registers `listener`, once.
    void addListener(ConfigListener& listener);
    /// Removes `listener`; does nothing for a listener that is not registered.
    void removeListener(ConfigListener& listener);

    /// The folder.
    ConfigPath path() const { return path_; }

private:
    WriteOutcome save() const;

    ConfigListeners listeners_;
    ut::FileName configFile_;
    ConfigPath path_;
    bool modified_ = false;
    ConfigData data_;
    IoInterface const* io_;
};

/// Remembers living configurations by their folder, without keeping them alive.
class MU_COMMON_EXPORT Config::Factory {
public:
    /// The living configuration of `path`, unchanged; `data` and `io` are then ignored. If there is none, a new one
    /// with `data`.
    std::shared_ptr<Config> get(ConfigPath const& path, ConfigData data, IoInterface const& io);
    /// A temporary host would be gone when the outcome is reported.
    std::shared_ptr<Config> get(ConfigPath const& path, ConfigData data, IoInterface const&& io) = delete;
    /// Forgets the configuration of `path`, which lives on with its owners.
    void erase(ConfigPath const& path);

private:
    std::map<ConfigPath, std::weak_ptr<Config>, ConfigPathOrder> living_;
};

} // namespace common
