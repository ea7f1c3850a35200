/// Who makes a commit.
#pragma once

#include <string>

namespace tav {

/// The user's name from the settings. The first time, a user at a terminal is asked for it, and the answer is saved.
std::string commitAuthor();

} // namespace tav
