/// Reading and changing the working state of a repository.
#pragma once

#include "common/mu_common_state.h"

#include <functional>
#include <memory>
#include <string>

namespace tav {

/// Makes the state file when there is none. Throws `Failure` when it cannot be written.
void makeState(common::RootPath const& root);

/// The state as it is on the disk, without waiting for a command that changes it. Throws `Failure` when it cannot be
/// read.
std::shared_ptr<common::Cache const> readState(common::RootPath const& root);

/// Calls `change` to change the state, and saves it: returns only when the new state is safe on the disk. When `change`
/// throws or saving fails, the state stays as it was, and that exception or `Failure` is thrown. The caller holds the
/// lock of the repository.
void changeState(common::RootPath const& root, std::function<void(common::Cache&)> const& change);

} // namespace tav
