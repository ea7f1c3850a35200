/// Which contents of the known history are in this folder.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_repo_prop.h"

#include <vector>

namespace tav {

/// The URLs of all files of all known commits, and of those that operations may have to bring back, each once.
struct Contents {
    std::vector<OdString> here;      ///< kept here; only reading them shows whether they are intact
    std::vector<OdString> elsewhere; ///< of commits that were made in other folders, where their contents are
};

Contents contentsOf(common::RootPath const& root, LocalDatabase const& database);

} // namespace tav
