/// Finding the files that a typed name means. For names of commits, see host/commits/commit_names.h.
#pragma once

#include "common/mu_common_diff.h"

#include <map>
#include <string>
#include <vector>

namespace tav {

/// Converts `typed`, which is absolute or relative to the current folder, to a path relative to the working folder of
/// `root`; the working folder itself gives an empty text. Does not access the disk. Throws `Failure` when the path is
/// outside the working folder.
OdString pathInRepository(common::RootPath const& root, std::string const& typed);

/// The path of the first unchanged file that `name` matches as an expression; empty when there is none.
/// Throws `Failure` when it is not a valid expression.
OdString findUnchanged(std::string const& name, common::RepoChanges const& changes, common::RootPath const& root);

/// Finds, among the files that a command can work on, the ones that a typed name means: the file of exactly that path;
/// else all files in the folder of that path; else the one file that the name matches as an expression.
class NameFinder {
public:
    /// The files that can be found are the candidates of `changes`.
    NameFinder(common::RepoChanges const& changes, common::RootPath const& root);
    /// The files that can be found are `staged`.
    NameFinder(std::vector<common::StagedFile> const& staged, common::RootPath const& root);

    /// All of them, in ascending order of paths.
    std::vector<common::StagedFile> all() const { return findInFolder(OdString()); }

    /// Empty when nothing is found. Throws `Failure` when an expression matches several files, with a list of them, and
    /// when the name is not a valid expression.
    std::vector<common::StagedFile> find(std::string const& typed) const;

private:
    using Files = std::map<OdString, common::FileChange>;

    std::vector<common::StagedFile> findInFolder(OdString const& folder) const;
    std::vector<common::StagedFile> findByExpression(OdString const& name) const;

    common::RootPath root_;
    common::RepoFileExplorer explorer_;
    Files files_;
};

} // namespace tav
