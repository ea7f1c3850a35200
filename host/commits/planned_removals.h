/// Which removals go into a commit.
#pragma once

#include "host/commits/commit_plan.h"

#include <set>
#include <vector>

namespace tav {

/// What a commit does with files that are missing and were not removed with 'tav rm'.
enum class Missing {
    areRemoved,    ///< unless so much is missing that it may be a mistake
    areAllRemoved, ///< however many they are
    areKept        ///< the commit has them as the previous one has
};

/// Takes the missing files out of `plan`, or leaves them in. Files whose copies have been found are missing too, unless
/// they are among `moved`, the former paths of files that were moved by hand; when they are taken out, their copies do
/// not count as renamed files. Throws `Failure`, which lists the missing files, when the user has to confirm the
/// removal.
void planMissing(
    std::vector<PlannedFile>& plan, common::State const& state, std::set<OdString> const& moved, Missing missing,
    common::RootPath const& root);

} // namespace tav
