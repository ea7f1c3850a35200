/// Files of a commit outside of the repository.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_repo_prop.h"

#include <cstddef>
#include <string>

namespace tav {

/// Writes `files` into the folder `target`, in bytes, which is made when it is missing and must be empty else; returns
/// their number. All of it is safe on the disk then. Throws `Failure`; what was written until then stays there.
std::size_t
exportFiles(common::RootPath const& root, LocalDatabase const& database, Tree const& files, std::string const& target);

/// Writes one of the files of a commit to the path `target`, in bytes, whose folder exists. A file there is left as it
/// is. Safe on the disk then. Throws `Failure`; `target` is as before.
void exportFile(
    common::RootPath const& root, LocalDatabase const& database, Tree::value_type const& file,
    std::string const& target);

} // namespace tav
