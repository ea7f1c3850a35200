/// Printing the contents of committed files unchanged.
#pragma once

#include "host/repository/local_database.h"

#include <optional>
#include <string>

namespace tav {

struct FileOfCommit {
    std::int64_t commit = 0; ///< number
    OdString path;
    OdString url;
};

/// The file that "COMMIT:NAME" means; without COMMIT, it is that of the current commit. None when nothing before a
/// colon names a commit. Throws `Failure` when the commit has no such file, or several.
std::optional<FileOfCommit>
findFileOfCommit(std::string const& typed, LocalDatabase const& database, common::RootPath const& root);

/// Throws `Failure` when what is before the first colon of `typed` names no commit; not when there is no colon.
void requireCommitOf(std::string const& typed, LocalDatabase const& database);

/// Prints the content of a file, byte for byte. On a terminal only text is printed, with its control characters
/// escaped; `Failure` for anything else.
void printContent(FileOfCommit const& file, common::RootPath const& root);

} // namespace tav
