#include "host/commits/planned_removals.h"

#include "host/changes/missing_files.h"
#include "host/changes/staging.h"
#include "host/errors/failure.h"

#include <algorithm>
#include <set>

namespace tav {

namespace {

using Paths = std::set<OdString>;

/// Paths that are removed on purpose: with 'tav rm', or by moving the file.
Paths pathsLeft(common::State const& state, Paths left)
{
    for (common::StagedFile const& file : state.stagedFiles) {
        if (file.change == common::FileChange::removed) {
            left.insert(file.path);
        }
    }
    left.merge(formerPaths(state));
    return left;
}

/// Leaves the files `kept` in the repository. A copy of one of them is not a renamed file, and nobody need have staged
/// it.
void keep(Paths const& kept, Paths const& staged, std::vector<PlannedFile>& plan)
{
    auto const isLeftOut = [&](PlannedFile const& file) {
        bool const isRemoval = file.change == common::FileChange::removed && kept.count(file.path) > 0;
        return isRemoval || (kept.count(file.previousPath) > 0 && staged.count(file.path) == 0);
    };
    plan.erase(std::remove_if(plan.begin(), plan.end(), isLeftOut), plan.end());
    for (PlannedFile& file : plan) {
        if (kept.count(file.previousPath) > 0) {
            file.previousPath = OdString::kEmpty;
        }
    }
}

} // namespace

void planMissing(
    std::vector<PlannedFile>& plan, common::State const& state, std::set<OdString> const& moved, Missing missing,
    common::RootPath const& root)
{
    Paths const left = pathsLeft(state, moved);
    std::vector<OdString> paths;
    for (PlannedFile const& file : plan) {
        if (file.change == common::FileChange::removed && left.count(file.path) == 0) {
            paths.push_back(file.path);
        }
    }
    if (missing == Missing::areKept) {
        return keep({paths.begin(), paths.end()}, stagedPaths(state), plan);
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
