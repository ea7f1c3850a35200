/// Names that people give: of repositories, and of branches and tags.
#pragma once

#include "platform/sdk/OdString.h"

#include <optional>
#include <string>

namespace tav {

/// Why `name` cannot be a name that people read, as the end of a sentence ("is empty"); none when it can.
std::optional<std::string> whyNotName(OdString const& name);

/// Why `name` cannot be the name of a branch or tag ("begins with a dash"); none when it can. It can be mistaken
/// neither for an option nor for the number or hash of a commit.
std::optional<std::string> whyNotReferenceName(OdString const& name);

} // namespace tav
