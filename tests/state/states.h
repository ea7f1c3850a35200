/// Repositories with a state, and states told in words, so that a test compares the whole of one at once.
#pragma once

#include "common/mu_common_state.h"

#include "platform/sdk/OdString.h"
#include "tests/support/recording_io.h"
#include "tests/support/temp_repository.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <limits>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace states {

using common::Cache;
using common::FileChange;
using common::IndexData;
using common::StagedFile;
using common::State;
using common::Transaction;

/// One line for HEAD and for each staged file, rename and index record:
///     HEAD feature 17
///     staged modified plans/ground.dwg
///     rename plans/roof.dwg -> plans/roof-new.dwg
///     index plans/ground.dwg 1700000000 modified
inline std::string inWords(State const& state)
{
    std::string words = "HEAD " + state.head.ansi_str();
    words += state.headCommit ? " " + std::to_string(*state.headCommit) + "\n" : "\n";
    for (StagedFile const& file : state.stagedFiles) {
        Expected<OdString> const change = common::toString(file.change);
        std::string const name = change.hasValue() ? change.value().ansi_str() : "unknown";
        words += "staged " + name + " " + file.path.ansi_str() + "\n";
    }
    for (auto const& [path, previous] : state.renames) {
        words += "rename " + previous.ansi_str() + " -> " + path.ansi_str() + "\n";
    }
    for (auto const& [path, data] : state.index) {
        words += "index " + path.ansi_str() + " " + std::to_string(data.lastChecked);
        words += data.modified ? " modified\n" : "\n";
    }
    return words;
}

/// A message as a test expects it; the code shows when it is not 0.
inline std::string inWords(ErrorMessage const& error)
{
    return "error" + (error.code == 0 ? "" : " " + std::to_string(error.code)) + ": " + error.message.ansi_str();
}

/// What loading came to.
inline std::string inWords(Expected<std::shared_ptr<Cache>> const& loaded)
{
    return loaded.hasValue() ? inWords(loaded.value()->read()) : inWords(loaded.error());
}

/// The error of a member of another type than wanted.
inline std::string mismatch(std::string const& wanted, std::string const& found, std::string const& key)
{
    std::string const place = key.empty() ? "" : "\njson key:\t\"" + key + "\"";
    return "error: Error:\tExpected json type '" + wanted + "', found '" + found + "'" + place;
}

/// The error of a member that is not there.
inline std::string missing(std::string const& key)
{
    return "error: Unable to find json key '" + key + "'\njson key:\t\"" + key + "\"";
}

/// The error of a text that is not JSON.
inline std::string const kNoJson = "error: Unable to parse json, please check if syntax is valid";

/// A repository without a state file yet, and its host.
class Repository : public support::TempRepository {
public:
    Repository() = default;
    /// With this state file.
    explicit Repository(std::string_view document) { writeState(document); }

    void writeState(std::string_view document) const { write(".tav/tav.state", document); }
    std::string stateFile() const { return read(".tav/tav.state"); }
    std::string statePath() const { return pathTo(".tav/tav.state"); }

    Expected<std::shared_ptr<Cache>> load() const { return Cache::get(root(), io_); }
    /// What loading comes to, in words.
    std::string loaded() const { return inWords(load()); }
    /// The cache of a state that loads.
    std::shared_ptr<Cache> open() const
    {
        Expected<std::shared_ptr<Cache>> cache = load();
        if (!cache.hasValue()) {
            throw std::runtime_error(inWords(cache.error()));
        }
        return cache.value();
    }
    /// Saves `state` and gives the state file.
    std::string saved(State state) const
    {
        Cache(root(), std::move(state), io_).write();
        return stateFile();
    }

    support::RecordingIo const& io() const { return io_; }
    std::vector<std::string> const& calls() const { return io_.calls(); }

private:
    support::RecordingIo const io_;
};

/// What the host is told of a state file that cannot be written.
inline std::string unwritable(Repository const& repository)
{
    return "report error: Error writing to file '" + repository.statePath() + "'";
}

} // namespace states
