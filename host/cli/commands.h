/// The commands of tav, each in the file of its name.
#pragma once

#include <CLI/CLI.hpp>

namespace tav {

// Each adds its command with its options to the application; parsing the command line then runs it. A command that
// fails throws `Failure`.
void addInit(CLI::App& app);
void addStatus(CLI::App& app);
void addAdd(CLI::App& app);
void addUnstage(CLI::App& app);
void addMv(CLI::App& app);
void addRm(CLI::App& app);
void addFiles(CLI::App& app);
void addIgnore(CLI::App& app);

} // namespace tav
