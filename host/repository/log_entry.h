/// Entering a command into the log of operations.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_state.h"

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
    /// when it is known only then what is staged. Where nothing changes, nothing is written.
    void write(common::State const& after);
    void keep() { operation_.id = 0; }

private:
    LocalDatabase& database_;
    common::State before_; ///< without the index
    Operation operation_;
};

} // namespace tav
