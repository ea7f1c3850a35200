/// From the working folder to a new commit.
#pragma once

#include "host/commits/planned_removals.h"
#include "host/repository/journal.h"

#include <cstdint>
#include <optional>
#include <set>

namespace tav {

struct CommitOrder {
    OdString author;
    OdString message;
    Missing missing = Missing::areRemoved;
    bool takesModified = false;                ///< changed files are taken without being staged; new ones are not
    std::optional<CommitRecord> replaced = {}; ///< the commit whose place the new one takes: the current one
    std::set<OdString> only = {};              ///< what has changed at other paths stays; none: everything is taken
};

struct Committed {
    CommitRecord commit;
    bool isNew; ///< false: the order repeats the last commit, and there is nothing else to commit
};

/// Gets the commits that others have made. Throws `Failure` when no commit can be made here now.
void requireCommittable(common::RootPath const& root, LocalDatabase& database);

/// Commits what is staged, what has been renamed, and, as far as the order says so, the removal of missing files.
/// Contents are stored, flushed and read back before the commit is sent to the server. If the process is killed at any
/// point, `finishCommit` or the same order leads to one commit. Throws `Failure`; staging and working folder are then
/// as they were. The caller has held the lock of the repository since `start`, and no operation is pending.
Committed commit(common::RootPath const& root, LocalDatabase& database, CommitOrder const& order, std::uint64_t start);

/// Sends a commit whose contents are stored, unless the server has it, and enters it in the local database. Throws
/// `Failure`; if the server refused the commit, it is abandoned.
CommitRecord finishCommit(common::RootPath const& root, LocalDatabase& database, PendingCommit const& pending);

} // namespace tav
