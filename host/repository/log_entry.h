/// Entering a command into the log of operations.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_state.h"

#include <cstdint>
#include <functional>

namespace tav {

/// The entry of a command that changes files of the working folder or what is staged. It is taken out again when it
/// goes without `keep`, as the command fails then and leaves all as it was.
class LogEntry {
public:
    /// `state` is as it was before the command, and `database` lives longer.
    LogEntry(LocalDatabase& database, OdString const& command, common::State const& state);
    LogEntry(LogEntry const&) = delete;
    LogEntry& operator=(LogEntry const&) = delete;
    ~LogEntry();

    /// What the command is about to do, to be filled in before the entry is written.
    Operation& operation() { return operation_; }

    /// Writes the entry, with what is staged in `after`, before the command changes anything on the disk; a second time
    /// when it is known only then what is staged. Where nothing changes, nothing is written, unless there is something
    /// that belongs to the entry: `add` gets its number, as a part of the same transaction.
    void write(common::State const& after, std::function<void(std::int64_t id)> const& add = {});
    void keep() { operation_.id = 0; }

private:
    LocalDatabase& database_;
    common::State before_; ///< without the index
    Operation operation_;
};

} // namespace tav
