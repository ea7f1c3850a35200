/// The operations of a working folder, as tables of its database: the journal of the one that is under way, and the log
/// from which operations are undone.
///
/// The row of an operation is written before its first effect. All that changes is part of a `WriteTransaction` of the
/// caller. One thread. Every operation throws `Failure` when the database cannot be used.
#pragma once

#include "host/database/sqlite.h"
#include "host/repository/operation.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

namespace tav {

class Operations {
public:
    /// The tables in `database`, which lives longer.
    explicit Operations(Database& database) : database_(&database) {}

    /// Makes the tables in a database without them. What an earlier version of tav has noted there and not ended
    /// becomes the first operation.
    static void create(Database& database);
    /// What is to be completed in a database of an earlier version, without them.
    static PendingOperation pendingIn(Database const& database);

    /// Adds an operation in its phase and with the present date, and returns its number. Operations that are undone
    /// cannot be done again then; those that are too old go.
    std::int64_t add(Operation const& operation);
    void setPhase(std::int64_t id, Phase phase);
    void setStaging(std::int64_t id, StagingChange const& change);
    /// Adds files, or changes what the contents of files are. Their permissions stay as they were added.
    void setFiles(std::int64_t id, std::vector<FileContents> const& files);
    void remove(std::int64_t id);

    /// The operation that is under way, without its files and what it stages.
    std::optional<Operation> running() const;
    /// The same of those in `phase` with the highest or lowest number.
    std::optional<Operation> last(Phase phase) const;
    std::optional<Operation> first(Phase phase) const;
    /// The last ones, the newest first, in whatever phase.
    std::vector<Operation> latest(std::size_t count) const;
    /// Reads the files of `operation`, and what it stages.
    void readDetails(Operation& operation) const;
    /// The path of a file that had the content at `url`; empty when there is none.
    OdString pathAt(OdString const& url) const;
    /// The URLs of all contents that operations need, in ascending order.
    std::vector<OdString> urls() const;

    /// What is to be done to complete it.
    PendingOperation pending() const;

    /// Says of the operation that is under way, or is added next, what completes it; in place of what was noted before.
    void setPending(PendingCommit const& commit);
    void setPending(PendingCheckout const& checkout);
    void clearPending();

private:
    std::optional<Operation> one(char const* condition) const;
    PendingCommit pendingCommit() const;
    IndexUpdates indexUpdates() const;
    void put(IndexUpdates const& files);
    void removeFrom(char const* table, std::int64_t id);
    void removeOld();

    Database* database_;
};

} // namespace tav
