#include "host/session/write_session.h"

#include "host/changes/index_record.h"
#include "host/checkout/checkout.h"
#include "host/commits/commit.h"
#include "host/errors/failure.h"
#include "host/repository/identity.h"
#include "host/repository/journal.h"
#include "host/storage/local_storage.h"

#include <algorithm>
#include <cstdio>
#include <string>
#include <utility>
#include <variant>

namespace tav {

namespace {

/// Whether the contents of the current commit are here. Those of another repository are not.
bool isOfThisFolder(LocalDatabase const& database, common::RootPath const& root)
{
    Tree const files = database.commits().files(database.currentCommit());
    LocalStorage storage(root);
    return !files.empty() && std::all_of(files.begin(), files.end(), [&](auto const& file) {
        auto const isKept = storage.contains(file.second);
        return isKept.hasValue() && isKept.value();
    });
}

} // namespace

WriteSession::WriteSession(common::RootPath const& root, std::string const& name, Recovery recovery, Note note)
    : WriteSession(root, lockRepository(root, name), recovery, note)
{
}

WriteSession::WriteSession(common::RootPath const& root, os::FileLock lock, Recovery recovery, Note note)
    : root_(root)
    , lock_(std::move(lock))
    , start_(commandStart(root))
    , database_(LocalDatabase::openForChanges(root))
{
    keepIdentity();
    if (recovery == Recovery::skipped) {
        return;
    }
    bool isCommit = false;
    try {
        PendingOperation const pending = readJournal(database_);
        isCommit = std::holds_alternative<PendingCommit>(pending);
        recover(pending);
        if (note == Note::bySession) {
            noteRecovery();
        }
    } catch (Failure const&) {
        if (recovery == Recovery::required) {
            throw;
        }
        if (isCommit && !database_.operations().running()) {
            std::fputs(
                "tav: A commit that was interrupted was abandoned because the server refused it. Its files are "
                "still staged.\n",
                stderr);
        }
    }
}

/// Folders of earlier versions have none. Without it the commands work as well, and some are to free space.
void WriteSession::keepIdentity() const
{
    try {
        if (identities(root_).empty() && isOfThisFolder(database_, root_)) {
            addIdentity(root_, database_.repositoryId());
        }
    } catch (Failure const&) {
        // The next session tries again.
    }
}

void WriteSession::recover(PendingOperation const& pending)
{
    if (auto const* const commit = std::get_if<PendingCommit>(&pending)) {
        recoveredCommit_ = finishCommit(root_, database_, *commit);
    }
    // Before all its files are written, only the user can say whether they are still wanted.
    auto const* const checkout = std::get_if<PendingCheckout>(&pending);
    if (checkout && checkout->isWritten) {
        finishCheckout(root_, database_, *checkout);
    }
}

void WriteSession::noteRecovery() const
{
    if (recoveredCommit_) {
        std::string const name =
            std::to_string(recoveredCommit_->number) + " (" + recoveredCommit_->hash.left(12).ansi_str() + ")";
        std::fputs(("tav: Completed commit " + name + ", which was interrupted.\n").c_str(), stderr);
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
