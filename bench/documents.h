/// Documents of the sizes that large projects have, always the same ones.
#pragma once

#include "json/json_value.h"

#include <string>

namespace bench {

/// The path of the drawing with this number; a hundred share a folder, and every eighth folder is outside ASCII.
std::wstring drawingPath(int number);

/// The state of a repository with so many records in its index.
kutils::json::Value stateDocument(int records);

/// What a fetch brings: so many commits of `files` files each.
kutils::json::Value fetchDocument(int commits, int files);

} // namespace bench
