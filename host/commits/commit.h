/// From the working folder to a new commit.
#pragma once

#include "host/commits/planned_removals.h"
#include "host/repository/journal.h"

#include <cstdint>

namespace tav {

struct CommitOrder {
    OdString author;
    OdString message;
    Missing missing = Missing::areRemoved;
    bool takesModified = false; ///< changed files are taken without being staged; new ones are not
};

struct Committed {
    CommitRecord commit;
    bool isNew; ///< false: the order repeats the last commit, and there is nothing else to commit
};

/// Commits what is staged, what is gone, as far as the order says so, and what has been renamed. Contents are stored,
/// flushed and read back before the server hears of the commit; killed at any point, `finishCommit` or the same order
/// leads to one commit. Throws `Failure`; staging and working folder are as they were then. The caller holds the lock
/// of the repository since `start`, and nothing is unfinished.
Committed commit(common::RootPath const& root, LocalDatabase& database, CommitOrder const& order, std::uint64_t start);

/// Sends a commit whose contents are stored, unless the server has it, and enters it here. Throws `Failure`; when it is
/// the server that refuses, the commit is given up.
CommitRecord finishCommit(common::RootPath const& root, LocalDatabase& database, PendingCommit const& pending);

} // namespace tav
