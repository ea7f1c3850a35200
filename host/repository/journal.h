/// The journal: the operation that a command has begun. The database keeps it until the operation has ended, so that
/// the next command can complete it.
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

/// A content that a commit adds.
struct NewContent {
    OdString url;
    Digest digest{};
    std::uint64_t size = 0;
};

/// Index records of files, by path, that become valid when the operation ends: these files then match the current
/// commit. None: the commit has no such file, or its time is not known.
using IndexUpdates = std::map<OdString, std::optional<common::IndexData>>;

/// A commit whose contents are all stored. Sending the document again is harmless: the server recognises a commit by
/// its hash.
struct PendingCommit {
    OdString document;
    std::vector<NewContent> contents;
    IndexUpdates files; ///< those that it adds or changes and those that it removes
};

/// A checkout of another commit.
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

/// Writes the operation that begins, on its own or as part of a `WriteTransaction` of the caller.
void writeJournal(PendingCommit const& commit, LocalDatabase& database);
void writeJournal(PendingCheckout const& checkout, LocalDatabase& database);

/// Removes the operation, which has ended or was abandoned.
void clearJournal(LocalDatabase& database);

/// Describes an interrupted checkout for the user: "'tav switch a' was interrupted: ...".
std::string describe(PendingCheckout const& checkout, LocalDatabase const& database);

/// A notice, for commands that only read, about an operation that has not ended because its command was interrupted or
/// is still running; empty when there is none.
std::string pendingNotice(common::RootPath const& root, LocalDatabase const& database);

} // namespace tav
