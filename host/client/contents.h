/// Which contents of the known history are in this folder.
#pragma once

#include "host/repository/local_database.h"
#include "host/storage/local_storage.h"

#include "common/mu_common_repo_prop.h"

#include <vector>

namespace tav {

/// The URLs of all files of all known commits, of those that operations may have to bring back, and of those that have
/// been put aside, each once.
struct Contents {
    std::vector<OdString> here;      ///< kept here; only reading them shows whether they are intact
    std::vector<OdString> elsewhere; ///< of commits that were made in other folders, where their contents are
};

Contents contentsOf(common::RootPath const& root, LocalDatabase const& database);

/// Throws `Failure` for the first of `files` whose content was never here: that is no damage.
void requireHere(Tree const& files, LocalDatabase const& database, LocalStorage& storage);

} // namespace tav
