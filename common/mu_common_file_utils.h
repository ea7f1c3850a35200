/// Walking folders: the files of a repository, its conflicted drawings, and any folder by name patterns.
///
/// Everything here reads the disk without locks: files that appear or disappear during a walk may or may not be listed.
/// Folders that cannot be opened are skipped silently at any depth, and links to folders are not followed.
#pragma once

#include "common/mu_common_expected.h"
#include "common/mu_common_export.h"
#include "common/mu_common_repo_files.h"
#include "common/mu_common_repo_prop.h"
#include "common/mu_common_versions.h"

#include "platform/sdk/OdString.h"

#include <cstdint>
#include <memory>
#include <regex>
#include <vector>

namespace common {

/// How to walk a folder.
struct MU_COMMON_EXPORT CollectOptions {
    /// Stores the choices.
    CollectOptions(bool relativePaths, bool collectDirs, bool includeHidden, std::vector<std::regex> excludes);

    bool relativePaths;            ///< results are relative to the walked folder, else they begin with it
    bool collectDirs;              ///< folders are listed too
    std::int32_t enumerationFlags; ///< 4 when hidden entries are listed, else 0
    /// An entry is skipped when one of these matches its whole bare name, in the narrow form; a folder is skipped with
    /// everything in it. The standard library runs them, so some, such as `(a*)*b`, take exponential time on a long
    /// name. Expressions from outside the host belong in the ignore file or must go through `RepoIgnore`, whose
    /// expressions run in bounded time.
    std::vector<std::regex> excludes;
};

/// What a walk found.
struct DirContents {
    std::vector<OdString> files; ///< in the order of the walk
    std::vector<OdString> dirs;  ///< in the same order; empty unless folders were requested
};

/// Sets the access and modification time of the file `path` to now. A missing file is not created, and failure is not
/// reported.
MU_COMMON_EXPORT void touch(OdString const& path);

/// Lists what is in `folder` and its sub-folders: first the files of a folder, then its sub-folders, depth first, names
/// in byte order.
MU_COMMON_EXPORT DirContents collectDirContents(OdString const& folder, CollectOptions const& options);

/// The files under version control, relative to the working folder: its files, except for hidden entries and those that
/// the ignore rules match, then the files of the properties folder, which travel with the repository.
/// Error: the properties folder is not below the working folder. Throws `std::regex_error` for an invalid ignore rule
/// and `OdError` for an ignore file that cannot be read (see `RepoIgnore`).
MU_COMMON_EXPORT Expected<std::vector<File>> collectRepoFiles(RootPath const& root);

/// The same. Adds to `unread` the folders that could not be opened, relative to the working folder and in the order of
/// the walk: their files are missing from the list. Folders that do not exist, or no longer, are among them.
MU_COMMON_EXPORT Expected<std::vector<File>> collectRepoFiles(RootPath const& root, std::vector<OdString>& unread);

/// The drawings that have other versions in the conflict folder, in ascending order of their paths.
MU_COMMON_EXPORT std::vector<std::unique_ptr<ConflictInfo>> collectConflictPaths(RootPath const& root);

} // namespace common
