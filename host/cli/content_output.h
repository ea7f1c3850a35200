/// Contents of files of commits, printed as they are.
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

/// The file that "COMMIT:NAME" means; COMMIT may be missing and is the current one then. None when nothing in front of
/// a colon names a commit. Throws `Failure` when the commit has no such file, or several.
std::optional<FileOfCommit>
findFileOfCommit(std::string const& typed, LocalDatabase const& database, common::RootPath const& root);

/// Prints the content of a file, byte for byte. On a terminal only text is printed, with its control characters
/// escaped; `Failure` for anything else.
void printContent(FileOfCommit const& file, common::RootPath const& root);

} // namespace tav
