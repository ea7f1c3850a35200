/// The journal: the operation that a command has begun, kept in the database until it has ended, so that the next
/// command can complete it.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_state.h"

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <variant>
#include <vector>

namespace tav {

/// A content that a commit brings.
struct NewContent {
    OdString url;
    Digest digest{};
    std::uint64_t size = 0;
};

/// Index records of files, by path, that become true with the operation: these files are as the current commit has them
/// then. None: the commit has no such file, or its time is not known.
using IndexUpdates = std::map<OdString, std::optional<common::IndexData>>;

/// A commit whose contents are all stored. Sending the document again does no harm: the server knows a commit by its
/// hash.
struct PendingCommit {
    OdString document;
    std::vector<NewContent> contents;
    IndexUpdates files; ///< those that it takes and those that it removes
};

/// A working folder that is being made to hold another commit.
struct PendingCheckout {
    OdString target;                  ///< hash of the commit
    OdString branch;                  ///< where HEAD points to afterwards
    bool isWritten;                   ///< whether all files are there already
    std::vector<OdString> begun = {}; ///< targets of checkouts that were interrupted before this one, and not completed
    IndexUpdates files = {};          ///< those that it has written and removed, once that is done
};

/// `std::monostate`: no operation is pending.
using PendingOperation = std::variant<std::monostate, PendingCommit, PendingCheckout>;

/// Throws `Failure` when the journal cannot be read.
PendingOperation readJournal(LocalDatabase const& database);

/// Writes what has begun; on its own, or as a part of a `WriteTransaction` of the caller.
void writeJournal(PendingCommit const& commit, LocalDatabase& database);
void writeJournal(PendingCheckout const& checkout, LocalDatabase& database);

/// The operation has ended, or is given up.
void clearJournal(LocalDatabase& database);

/// Says of a checkout which command was interrupted: "'tav switch a' was interrupted: ...".
std::string describe(PendingCheckout const& checkout, LocalDatabase const& database);

/// What a reader of the repository should know of an operation that has not ended, because its command was interrupted
/// or is still running; empty when there is none.
std::string pendingNotice(common::RootPath const& root, LocalDatabase const& database);

} // namespace tav
