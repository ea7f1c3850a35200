/// What takes back the changes of one commit.
#pragma once

#include "host/history/commit_tables.h"

#include "common/mu_common_state.h"

#include <map>
#include <set>
#include <vector>

namespace tav {

struct Opposite {
    Tree writes;                            ///< contents that come back
    Tree removals;                          ///< files that go, with their present contents
    Tree expected;                          ///< the present contents at the paths of both, where there are some
    std::vector<common::StagedFile> staged; ///< what the next commit has to take
    std::map<OdString, OdString> renames;   ///< former path by path, of files that are renamed back

    std::set<OdString> paths() const;
};

/// What takes `commit` back in the files `current`. Throws `Failure`, with a list of them, for files that are not as
/// the commit left them, and for a merge.
Opposite oppositeOf(CommitRecord const& commit, CommitTables const& commits, Tree const& current);

} // namespace tav
