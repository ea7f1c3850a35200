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
void addCommit(CLI::App& app);
void addLog(CLI::App& app);
void addShow(CLI::App& app);
void addDiff(CLI::App& app);
void addRestore(CLI::App& app);
void addCheckout(CLI::App& app);
void addSwitch(CLI::App& app);
void addBranch(CLI::App& app);
void addTag(CLI::App& app);
void addFiles(CLI::App& app);
void addIgnore(CLI::App& app);
void addProjects(CLI::App& app);
void addVerify(CLI::App& app);
void addGc(CLI::App& app);
void addExport(CLI::App& app);

} // namespace tav
