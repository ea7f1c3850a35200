#include "host/commits/commit_plan.h"

#include "host/errors/failure.h"

#include "common/mu_common_diff.h"

#include "platform/ut/FileName.h"

#include <filesystem>
#include <map>
#include <string>
#include <utility>

namespace tav {

namespace {

using Plan = std::map<OdString, PlannedFile>;

/// Whether a pipe, a link that leads nowhere or the like has the place of a file. A folder there has removed the file.
bool isSomethingElse(OdString const& path, common::RootPath const& root)
{
    std::error_code error;
    auto const type = std::filesystem::symlink_status(root.pathTo(path).ansi_str(), error).type();
    return type != std::filesystem::file_type::not_found && type != std::filesystem::file_type::directory;
}

/// A new file that is gone leaves nothing to commit. To go on without it would drop what somebody has chosen.
void failForGone(std::vector<std::string> gone)
{
    if (!gone.empty()) {
        Failure failure(
            "These new files are staged, but they are gone.",
            "Bring them back, or take them out of the commit with 'tav unstage', a file or folder, or --all:");
        failure.details = std::move(gone);
        throw failure;
    }
}

void planStaged(common::State const& state, Tree const& base, common::RootPath const& root, Plan& plan)
{
    std::vector<std::string> gone;
    for (common::StagedFile const& file : state.stagedFiles) {
        auto const rename = state.renames.find(file.path);
        bool const isRenamed = rename != state.renames.end() && base.count(rename->second) > 0;
        bool const isGone =
            file.change != common::FileChange::removed && !ut::FileName::fileExists(root.pathTo(file.path));
        if (isGone && isSomethingElse(file.path, root)) {
            throw Failure(
                "'" + file.path.ansi_str() + "' is staged, but it is not a regular file any more.",
                "Move what is there away, or run 'tav unstage' for it.");
        }
        if (isGone && base.count(file.path) == 0) {
            gone.push_back(file.path.ansi_str());
        }
        common::FileChange const change = isGone ? common::FileChange::removed : file.change;
        plan.insert_or_assign(file.path, PlannedFile{file.path, change, isRenamed ? rename->second : OdString::kEmpty});
    }
    failForGone(std::move(gone));
}

void planRenames(Renames const& renames, Plan& plan)
{
    for (auto const& [path, previous] : renames) {
        PlannedFile& planned = plan.emplace(path, PlannedFile{path, common::FileChange::added, {}}).first->second;
        if (planned.previousPath.isEmpty()) {
            planned.previousPath = previous;
        }
    }
}

} // namespace

std::vector<PlannedFile> planCommit(
    common::State const& state, common::RepoChanges const& changes, Renames const& found, Tree const& base,
    common::RootPath const& root)
{
    Plan plan;
    planStaged(state, base, root, plan);
    for (auto const& file : changes.removed) {
        plan.emplace(file.committed.path, PlannedFile{file.committed.path, common::FileChange::removed, {}});
    }
    planRenames(found, plan);
    std::vector<PlannedFile> files;
    for (auto& [path, file] : plan) {
        files.push_back(std::move(file));
    }
    return files;
}

bool hasChanges(common::RepoChanges const& changes)
{
    return !changes.modified.empty() || !changes.untracked.empty();
}

void failForNothing(common::RepoChanges const& changes, common::RootPath const& root)
{
    // The library has the words for a folder without any change.
    auto const staged = common::RepoFileExplorer(changes, root).stagedFiles();
    if (!hasChanges(changes) && !staged.hasValue()) {
        throw Failure(staged.error(), "Change something first.");
    }
    throw Failure("Nothing is staged.", "Use 'tav add NAME' or 'tav add --all' to stage what to commit.");
}

} // namespace tav
