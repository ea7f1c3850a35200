/// A repository in which a test runs the commands of tav.
#pragma once

#include "tests/host/run_tav.h"
#include "tests/support/temp_repository.h"

#include <gtest/gtest.h>

#include <initializer_list>
#include <string>
#include <string_view>

namespace host_tests {

/// The state of a new repository.
inline constexpr char const* kFreshState = R"({
    "head" : {
        "reference" : "master"
    }
})";

/// A repository with a fresh state, no file and no properties, so that `status` shows what the test puts there.
class TavTest : public testing::Test {
protected:
    TavTest() { repo.write(".tav/tav.state", kFreshState); }

    /// Runs a command in the working folder.
    Outcome tav(Arguments const& arguments) const { return run(setting_, arguments); }

    Outcome tavIn(std::string const& folder, Arguments const& arguments) const
    {
        Setting setting = setting_;
        setting.folder = folder;
        return run(setting, arguments);
    }

    Outcome tavOnTerminal(Arguments const& arguments, std::vector<std::string> const& environment = {}) const
    {
        Setting setting = setting_;
        setting.isOnTerminal = true;
        setting.environment = environment;
        return run(setting, arguments);
    }

    Outcome tavInto(std::string const& file, Arguments const& arguments) const
    {
        Setting setting = setting_;
        setting.outFile = file;
        return run(setting, arguments);
    }

    std::string state() const { return repo.read(".tav/tav.state"); }

    Setting const& setting() const { return setting_; }

    support::TempRepository const repo;

private:
    Setting setting_ = settingFor(repo.path());

    static Setting settingFor(std::string const& folder)
    {
        Setting setting;
        setting.folder = folder;
        return setting;
    }
};

/// A state with `files` staged as added, in the order given.
inline std::string stateWithAdded(std::initializer_list<std::string_view> files)
{
    std::string text = "{\n    \"head\" : {\n        \"reference\" : \"master\"\n    },\n    \"staged_files\" : [";
    char const* separator = "\n";
    for (std::string_view const file : files) {
        text.append(separator).append("        {\n            \"file_change\" : \"added\",\n            \"path\" : \"");
        text.append(file).append("\"\n        }");
        separator = ",\n";
    }
    return text + "\n    ]\n}";
}

} // namespace host_tests
