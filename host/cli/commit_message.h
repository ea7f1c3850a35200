/// The message of a new commit, from a file or from an editor.
#pragma once

#include "common/mu_common_repo_prop.h"

#include <string>
#include <vector>

namespace tav {

/// The text of the file `path`, "-" for standard input. Throws `Failure` when it cannot be read.
std::string readMessage(std::string const& path);

/// Whether there is a terminal for an editor.
bool canEdit();

/// Lets the user write a message in ".tav/COMMIT_MESSAGE", which begins with what was written for a commit that failed,
/// else with `former`, and shows `changes` as comment. Returns it without comments and without blank lines around it;
/// it is in that file too. Throws `Failure` when the editor fails.
std::string
editMessage(common::RootPath const& root, std::vector<std::string> const& changes, std::string const& former);

/// The path of that file, and its end when the commit has been made.
std::string messagePath(common::RootPath const& root);
void removeMessage(common::RootPath const& root);

} // namespace tav
