/// Contents that earlier versions of tav kept whole become differences.
#pragma once

#include "host/repository/local_database.h"
#include "host/storage/freed.h"

#include "common/mu_common_expected.h"
#include "common/mu_common_repo_prop.h"

#include <optional>

namespace tav {

struct TurnedOver {
    Freed freed;
    std::optional<ErrorMessage> error; ///< why it was not done to the end; what was done stays
};

/// Goes through the commits that it has not gone through yet, the oldest first, and keeps each object as the difference
/// to the version before it, or to a similar file, where that takes less room. Each object can be read at any time.
TurnedOver turnOverObjects(common::RootPath const& root, LocalDatabase& database);

} // namespace tav
