#include "host/commits/planned_removals.h"

#include "host/changes/missing_files.h"
#include "host/errors/failure.h"

#include <algorithm>
#include <set>

namespace tav {

namespace {

using Paths = std::set<OdString>;

/// Paths that are removed on purpose: with 'tav rm', or by a renaming.
Paths pathsLeft(std::vector<PlannedFile> const& plan, common::State const& state)
{
    Paths left;
    for (common::StagedFile const& file : state.stagedFiles) {
        if (file.change == common::FileChange::removed) {
            left.insert(file.path);
        }
    }
    for (PlannedFile const& file : plan) {
        left.insert(file.previousPath);
    }
    return left;
}

} // namespace

void planMissing(
    std::vector<PlannedFile>& plan, common::State const& state, Missing missing, common::RootPath const& root)
{
    Paths const left = pathsLeft(plan, state);
    auto const isMissing = [&](PlannedFile const& file) {
        return file.change == common::FileChange::removed && left.count(file.path) == 0;
    };
    if (missing == Missing::areKept) {
        plan.erase(std::remove_if(plan.begin(), plan.end(), isMissing), plan.end());
        return;
    }
    std::vector<OdString> paths;
    for (PlannedFile const& file : plan) {
        if (isMissing(file)) {
            paths.push_back(file.path);
        }
    }
    if (missing == Missing::areRemoved && mayBeMistake(paths, root)) {
        Failure failure(
            "The commit would remove these files, which were not removed with 'tav rm'.",
            "If a drive is missing, connect it; else add --all-removed to remove them, or --without-removed to keep "
            "them in the repository:");
        failure.details = missingLines(paths, root);
        throw failure;
    }
}

} // namespace tav
