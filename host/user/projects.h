/// The repositories that a user knows, in the configuration folder "tav".
#pragma once

#include "common/mu_common_config.h"

namespace tav {

/// Throws `Failure` when the configuration cannot be read.
common::ConfigData readProjects();

/// Adds or renews the repository in the working folder `path`. One process at a time changes the configuration, so none
/// loses what another has added. Throws `Failure`.
void addProject(OdString const& path, OdString const& name, OdString const& id);

} // namespace tav
