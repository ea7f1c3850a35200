/// How a command changes what is staged, kept so that it can be taken back to the byte.
#pragma once

#include "common/mu_common_state.h"

#include <cstdint>
#include <map>
#include <utility>
#include <vector>

namespace tav {

enum class Side { before, after };

/// Both lists of staged files are equal but for one part, and both maps of renames but for some paths.
struct StagingChange {
    std::size_t position = 0; ///< where the part begins
    std::size_t behind = 0;   ///< how many files are staged behind it
    std::vector<common::StagedFile> before;
    std::vector<common::StagedFile> after;
    /// Previous paths before and after, by path; empty: no rename.
    std::map<OdString, std::pair<OdString, OdString>> renames;
};

/// What is staged in `state`, without the index.
common::State stagedPart(common::State const& state);

StagingChange stagingChange(common::State const& before, common::State const& after);

bool isEmpty(StagingChange const& change);

/// Whether `state` is as it was on `side` of the change. A change that is empty does not look at it.
bool isOn(Side side, StagingChange const& change, common::State const& state);

/// Makes `state`, which is on the other side, what it was on `side`.
void bringTo(Side side, StagingChange const& change, common::State& state);

} // namespace tav
