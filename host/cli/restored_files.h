/// Files of a commit on their way into the working folder.
#pragma once

#include "host/checkout/working_tree.h"
#include "host/session/write_session.h"

#include <cstddef>
#include <string>
#include <vector>

namespace tav {

struct RestoredFiles {
    CommitRecord commit;
    Tree files; ///< of that commit, by the paths where they shall be
};

/// The files of the commit `typed` that `names` mean. Throws `Failure` for a name that means none.
RestoredFiles findRestoredFiles(
    std::string const& typed, std::vector<std::string> const& names, common::RootPath const& root,
    LocalDatabase const& database);

/// Writes the files, takes them out of what is staged, and enters that into the log as `command`. Returns how many had
/// another content. Throws `Failure`.
std::size_t
writeRestored(RestoredFiles const& restored, Discard discard, OdString const& command, WriteSession& session);

/// Prints what that would write, and changes nothing.
void previewRestored(
    RestoredFiles const& restored, Discard discard, common::RootPath const& root, LocalDatabase const& database);

} // namespace tav
