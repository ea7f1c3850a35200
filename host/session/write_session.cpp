#include "host/session/write_session.h"

#include "host/changes/index_record.h"
#include "host/checkout/checkout.h"
#include "host/commits/commit.h"
#include "host/errors/failure.h"
#include "host/repository/journal.h"

#include <utility>

namespace tav {

WriteSession::WriteSession(common::RootPath const& root, std::string const& name, Recovery recovery)
    : WriteSession(root, lockRepository(root, name), recovery)
{
}

WriteSession::WriteSession(common::RootPath const& root, os::FileLock lock, Recovery recovery)
    : root_(root)
    , lock_(std::move(lock))
    , start_(commandStart(root))
    , database_(LocalDatabase::openForChanges(root))
{
    if (recovery == Recovery::skipped) {
        return;
    }
    try {
        recover();
    } catch (Failure const&) {
        if (recovery == Recovery::required) {
            throw;
        }
    }
}

void WriteSession::recover()
{
    PendingOperation const pending = readJournal(database_);
    if (auto const* const commit = std::get_if<PendingCommit>(&pending)) {
        recoveredCommit_ = finishCommit(root_, database_, *commit);
    }
    // Before all its files are written, only the user can say whether they are still wanted.
    auto const* const checkout = std::get_if<PendingCheckout>(&pending);
    if (checkout && checkout->isWritten) {
        finishCheckout(root_, database_, *checkout);
    }
}

void WriteSession::failIfBetweenCommits() const
{
    PendingOperation const pending = readJournal(database_);
    if (auto const* const checkout = std::get_if<PendingCheckout>(&pending)) {
        throw Failure(describe(*checkout, database_), "Run it again to complete it.");
    }
}

} // namespace tav
