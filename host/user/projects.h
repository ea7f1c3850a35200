/// The repositories that a user knows, in the configuration folder "tav".
#pragma once

#include "common/mu_common_config.h"

namespace tav {

/// Throws `Failure` when the configuration cannot be read.
common::ConfigData readProjects();

/// Adds or renews the repository in the working folder `path`. One process at a time changes the configuration, so none
/// loses what another has added. Throws `Failure`.
void addProject(OdString const& path, OdString const& name, OdString const& id);

/// Takes the repository in the working folder `path` off the list. Nothing else is changed. Throws `Failure`.
void forgetProject(OdString const& path);

/// Gives the repository that the list has in `from` the path `to`, unless the list has changed meanwhile. Throws
/// `Failure`.
void moveProject(OdString const& from, OdString const& to);

/// Whether there is a list: reading it makes the folder for it.
bool hasProjects();

} // namespace tav
