#include "host/changes/changes.h"
#include "host/changes/last_commit.h"
#include "host/changes/renames.h"
#include "host/changes/staging.h"
#include "host/cli/commands.h"
#include "host/cli/commit_output.h"
#include "host/cli/output.h"
#include "host/cli/typed_command.h"
#include "host/errors/failure.h"
#include "host/repository/log_entry.h"
#include "host/repository/names.h"
#include "host/repository/open.h"
#include "host/repository/working_state.h"
#include "host/session/write_session.h"
#include "host/text/plural.h"

#include <algorithm>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace tav {

namespace {

using Paths = std::set<OdString>;

std::vector<common::StagedFile>
chosenFiles(UnstageOptions const& options, common::State const& state, common::RootPath const& root)
{
    NameFinder const finder(state.stagedFiles, root);
    if (options.all) {
        return finder.all();
    }
    std::vector<common::StagedFile> chosen;
    for (std::string const& name : options.names) {
        std::vector<common::StagedFile> const found = finder.find(name);
        if (found.empty()) {
            throw Failure("No staged file matches '" + name + "'.", "Run 'tav status' to see what is staged.");
        }
        chosen.insert(chosen.end(), found.begin(), found.end());
    }
    return chosen;
}

/// The paths of `files`, and those that they had before they were renamed.
Paths pathsOf(std::vector<common::StagedFile> const& files, common::State const& state)
{
    Paths paths;
    for (common::StagedFile const& file : files) {
        paths.insert(file.path);
        auto const rename = state.renames.find(file.path);
        if (rename != state.renames.end()) {
            paths.insert(rename->second);
        }
    }
    return paths;
}

bool isAnyGone(Paths const& paths, common::RootPath const& root)
{
    FolderView view(root);
    return std::any_of(
        paths.begin(), paths.end(), [&](OdString const& path) { return view.look(path).presence == Presence::isGone; });
}

/// What the next commit does to `paths` although nothing is staged for them, in lines: it takes files that are gone for
/// removed, or for renamed where their content is elsewhere.
std::vector<std::string> changesThatStay(
    Paths const& paths, common::State const& state, common::RootPath const& root, LocalDatabase const& database)
{
    FolderChanges const changes = compare(root, matchFolder(root, lastCommitFiles(root), database.verifiedFiles()));
    Paths left = claimedPaths(state);
    std::vector<std::string> lines;
    for (auto const& [path, previous] : findRenames(changes, state, database, root)) {
        if (paths.count(path) > 0 || paths.count(previous) > 0) {
            lines.push_back(changeLine(common::FileChange::added, path, previous));
        }
        left.insert(previous);
    }
    for (auto const& file : changes.removed) {
        OdString const& path = file.committed.path;
        if (paths.count(path) > 0 && left.count(path) == 0) {
            lines.push_back(changeLine(common::FileChange::removed, path, OdString()));
        }
    }
    return lines;
}

} // namespace

void unstageFiles(UnstageOptions const& options)
{
    WriteSession session(openRepository(""), "unstage", Recovery::attempted);
    common::RootPath const& root = session.root();
    std::size_t count = 0;
    std::vector<std::string> lines;
    std::optional<LogEntry> entry;
    changeState(root, [&](common::Cache& cache) {
        entry.emplace(session.database(), typedCommand("unstage", options.names, options.all), cache.read());
        std::vector<common::StagedFile> const chosen = chosenFiles(options, cache.read(), root);
        Paths const paths = pathsOf(chosen, cache.read());
        count = unstage(chosen, cache.write());
        if (isAnyGone(paths, root)) {
            lines = changesThatStay(paths, cache.read(), root, session.database());
        }
        entry->write(cache.read());
    });
    entry->keep();
    if (lines.empty()) {
        report("Took " + counted(count, "file") + " out of the next commit.\n");
        return;
    }
    report(
        "Unstaged " + counted(count, "file") +
        ". The next commit takes these all the same, since files are gone (use 'tav restore NAME' to bring one "
        "back):\n");
    for (std::string const& line : lines) {
        report("        " + line + "\n");
    }
}

} // namespace tav
