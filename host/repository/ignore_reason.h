/// What the ignore rules of a repository match.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

namespace tav {

/// Why a scan skips a file or folder.
struct IgnoreReason {
    OdString name;          ///< of the file, or of the folder above it, that is skipped
    OdString rule;          ///< empty for a hidden name, which needs none
    std::size_t number = 0; ///< of the rule, from 1
};

/// Why a scan skips `path`, which is relative to the working folder and need not exist; none when it does not. Throws
/// `Failure` when the rules cannot be used, and for a name that no file can have.
std::optional<IgnoreReason> whyIgnored(common::RootPath const& root, OdString const& path);

/// Whether a file or folder of the working folder has a name that `rule` matches. Lists the whole folder.
bool matchesAnyName(common::RootPath const& root, OdString const& rule);

/// Whether a file or folder of the working folder is called `name` exactly. Lists the whole folder.
bool isAnyName(common::RootPath const& root, std::string const& name);

/// How many of `paths` would be ignored for `rule` if they were new: it matches their name, or that of a folder above.
std::size_t countMatches(std::vector<OdString> const& paths, OdString const& rule);

} // namespace tav
