/// Which commits come before which, for walks through a whole history.
#pragma once

#include "host/history/commit_tables.h"

#include <cstdint>
#include <unordered_map>
#include <vector>

namespace tav {

/// The parents of all commits, read at once. Commits are named by their numbers; parents have lower ones.
class Ancestry {
public:
    explicit Ancestry(CommitTables const& commits) : parents_(commits.parents()) {}

    std::vector<std::int64_t> const& parents(std::int64_t commit) const;
    std::int64_t firstParent(std::int64_t commit) const; ///< 0 when there is none

    /// `starts` and all commits before them, newest first.
    std::vector<std::int64_t> past(std::vector<std::int64_t> const& starts) const;

private:
    std::unordered_map<std::int64_t, std::vector<std::int64_t>> parents_;
};

} // namespace tav
