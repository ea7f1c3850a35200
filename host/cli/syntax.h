/// What may be typed: the commands with their options, and their help.
#pragma once

namespace CLI {
class App;
}

namespace tav {

/// Adds every command to the application; parsing the command line then runs the one that is named.
void addCommands(CLI::App& app);

} // namespace tav
