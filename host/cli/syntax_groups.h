/// The commands in groups, in the order of the help. Each group is a source of its own, because the templates of CLI11
/// take long to compile.
#pragma once

#include <CLI/CLI.hpp>

#include <cstddef>
#include <optional>
#include <string>

namespace tav {

void addChangeCommands(CLI::App& app); ///< work in the folder, up to its commit
/// Looking at versions. `behindDashes` is that of `addCommands`.
void addHistoryCommands(CLI::App& app, std::optional<std::size_t> behindDashes);
void addReferenceCommands(CLI::App& app); ///< going to versions, branches and tags, and back
void addSetupCommands(CLI::App& app);     ///< the repository as a whole

inline void addJson(CLI::App& command, bool& json)
{
    command.add_flag("--json", json, "Print a document for programs");
}

/// Why `text` is not a count of what is listed; empty when it is one. The parser's own check names the whole range of
/// numbers.
inline std::string whyNoCount(std::string const& text)
{
    bool const hasDigits = !text.empty() && text.size() <= 18 && text.find_first_not_of("0123456789") == text.npos;
    bool const isPositive = text.find_first_not_of('0') != text.npos;
    return hasDigits && isPositive ? std::string() : "'" + text + "' is not a number, 1 or more";
}

/// The examples of a command, below its help.
inline void addExamples(CLI::App& command, char const* examples)
{
    command.footer(std::string("Examples:\n") + examples);
}

} // namespace tav
