/// The journal: the operation that a command has begun. The database keeps it until the operation has ended, so that
/// the next command can complete it.
#pragma once

#include "host/repository/local_database.h"

#include <string>

namespace tav {

/// Throws `Failure` when the journal cannot be read.
PendingOperation readJournal(LocalDatabase const& database);

/// Write the operation that begins, as part of a `WriteTransaction` of the caller. A checkout replaces one that was
/// interrupted and not completed.
void beginCommit(Operation const& operation, PendingCommit const& commit, LocalDatabase& database);
void beginMove(Operation operation, PendingCheckout const& checkout, LocalDatabase& database);

/// Ends the operation, which stays in the log.
void endOperation(LocalDatabase& database);
/// Removes the operation, which has changed nothing.
void giveUpOperation(LocalDatabase& database);

/// Describes an interrupted checkout for the user: "'tav switch a' was interrupted: ...".
std::string describe(PendingCheckout const& checkout, LocalDatabase const& database);

/// A notice, for commands that only read, about an operation that has not ended because its command was interrupted or
/// is still running; empty when there is none.
std::string pendingNotice(common::RootPath const& root, LocalDatabase const& database);

} // namespace tav
