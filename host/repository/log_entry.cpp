#include "host/repository/log_entry.h"

namespace tav {

LogEntry::LogEntry(LocalDatabase& database, OdString const& command, common::State const& state)
    : database_(database)
    , before_(stagedPart(state))
{
    operation_.command = command;
    operation_.before = {database.currentCommit(), state.head};
    operation_.after = operation_.before;
}

LogEntry::~LogEntry()
{
    if (operation_.id == 0) {
        return;
    }
    try {
        WriteTransaction transaction(database_.database());
        database_.operations().remove(operation_.id);
        transaction.commit();
    } catch (...) {
        // The entry stays. All is as it was before it, which taking it back will find.
    }
}

void LogEntry::write(common::State const& after, std::function<void(std::int64_t id)> const& add)
{
    operation_.staging = stagingChange(before_, after);
    bool const isEmptyEntry =
        isEmpty(operation_.staging) && operation_.files.empty() && operation_.kind != Kind::rename && !add;
    if (isEmptyEntry) {
        return;
    }
    WriteTransaction transaction(database_.database());
    if (operation_.id == 0) {
        operation_.id = database_.operations().add(operation_);
    } else {
        database_.operations().setStaging(operation_.id, operation_.staging);
    }
    if (add) {
        add(operation_.id);
    }
    transaction.commit();
}

} // namespace tav
