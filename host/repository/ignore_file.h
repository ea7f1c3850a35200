/// Reading and changing the ignore rules of a repository.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <string>
#include <vector>

namespace tav {

/// Throws `Failure` when the ignore file exists and cannot be read: the library would treat it as empty, and files that
/// were meant to stay out would be offered for a commit.
void requireRules(common::RootPath const& root);

/// The rules in effect, in order: those of the ignore file, or the defaults when there is none. Throws `Failure` when
/// they cannot be used.
std::vector<OdString> ignoreRules(common::RootPath const& root);

/// The ignore file, whether or not it exists, as users know it.
constexpr char const* kIgnoreFile = ".tav/properties/ignore";
bool hasIgnoreFile(common::RootPath const& root);

/// Makes the properties folder and the ignore file with the default rules, as far as they are missing.
/// Throws `Failure` when one cannot be made.
void makeIgnoreFile(common::RootPath const& root);

/// Throws `Failure` for a rule that is not a valid expression or would not be read back.
void requireValidRule(OdString const& rule);

/// Adds `rule` after the last rule in effect, making the ignore file first when there is none. Text after an empty line
/// in the file has no effect and stays after the new rule. False when the rule exists already.
/// Throws `Failure` as `requireValidRule` does, and when the file cannot be written; the file is unchanged then.
bool addIgnoreRule(common::RootPath const& root, OdString const& rule);

/// Removes `rule`, making the ignore file first when there is none. False when there is no such rule. Throws `Failure`
/// when the file cannot be written; it is unchanged then.
bool removeIgnoreRule(common::RootPath const& root, OdString const& rule);

} // namespace tav
