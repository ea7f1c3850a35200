/// What may be typed: the commands with their options, and their help.
#pragma once

#include <cstddef>
#include <optional>

namespace CLI {
class App;
}

namespace tav {

/// Adds every command to the application; parsing the command line then runs the one that is named. So many words come
/// `behindDashes` ("--"), if that is typed: the parser leaves no trace of its place.
void addCommands(CLI::App& app, std::optional<std::size_t> behindDashes);

} // namespace tav
