/// Configurations of a test, in words.
#pragma once

#include "common/mu_common_config.h"

#include "tests/support/temp_folder.h"

#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <string_view>

namespace configurations {

using ConfigRef = std::shared_ptr<common::Config>;

inline char const* const kFile = "directories.state";

/// The projects in their order, "path = name (cloud)" each.
inline std::string inWords(common::ConfigData const& data)
{
    std::string words;
    for (auto const& [path, project] : data.projects) {
        words += (words.empty() ? "" : ", ") + path.ansi_str() + " = " + project.name.ansi_str() + " (" +
                 project.cloud.ansi_str() + ")";
    }
    return words.empty() ? "no projects" : words;
}

inline std::string inWords(ErrorMessage const& error)
{
    return "error" + (error.code == 0 ? "" : " " + std::to_string(error.code)) + ": " + error.message.ansi_str();
}

/// What loading the configuration of `folder` gives.
inline std::string loaded(OdString const& folder, common::IoInterface const& io)
{
    Expected<ConfigRef> const config = common::Config::load(folder, io);
    return config.hasValue() ? inWords(config.value()->read()) : inWords(config.error());
}

/// The configuration of `folder`; null, and a failure, if it cannot be loaded.
inline ConfigRef load(OdString const& folder, common::IoInterface const& io)
{
    Expected<ConfigRef> const config = common::Config::load(folder, io);
    EXPECT_TRUE(config.hasValue()) << inWords(config.error());
    return config.hasValue() ? config.value() : nullptr;
}

} // namespace configurations
