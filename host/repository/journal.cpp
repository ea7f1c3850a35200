#include "host/repository/journal.h"

#include "host/repository/lock.h"

#include <algorithm>
#include <string>

namespace tav {

namespace {

std::string commandOf(PendingCheckout const& checkout, LocalDatabase const& database)
{
    auto const operation = database.hasOperations() ? database.operations().running() : std::nullopt;
    if (operation && operation->phase != Phase::running) {
        return operation->phase == Phase::undoing ? "tav undo" : "tav redo";
    }
    auto const branch = database.commits().reference(checkout.branch);
    bool const isBranch = branch && branch->commitHash == checkout.target;
    auto const commit = database.commits().find(checkout.target);
    return isBranch ? "tav switch " + checkout.branch.ansi_str()
                    : "tav checkout " + (commit ? std::to_string(commit->number) : checkout.target.ansi_str());
}

/// Of a file that both have changed the interrupted move has seen what was there first.
void takeOver(Operation const& begun, Operation& move)
{
    auto const isKnown = [&](FileContents const& file) {
        auto const isIt = [&](FileContents const& other) { return other.path == file.path; };
        return std::any_of(begun.files.begin(), begun.files.end(), isIt);
    };
    move.before = begun.before;
    move.files.erase(std::remove_if(move.files.begin(), move.files.end(), isKnown), move.files.end());
    move.files.insert(move.files.end(), begun.files.begin(), begun.files.end());
}

/// What becomes of an operation that ends.
Phase phaseAfter(Phase phase)
{
    return phase == Phase::undoing ? Phase::undone : Phase::done;
}

} // namespace

PendingOperation readJournal(LocalDatabase const& database)
{
    return database.pendingOperation();
}

void beginCommit(Operation const& operation, PendingCommit const& commit, LocalDatabase& database)
{
    database.operations().add(operation);
    database.operations().setPending(commit);
}

void beginMove(Operation operation, PendingCheckout const& checkout, LocalDatabase& database)
{
    Operations& operations = database.operations();
    auto begun = operations.running();
    if (begun && begun->phase == Phase::running) {
        operations.readDetails(*begun);
        takeOver(*begun, operation);
        operations.remove(begun->id);
    } else if (begun) { // It is given up half way, and the move begins from there.
        operations.setPhase(begun->id, begun->phase == Phase::undoing ? Phase::done : Phase::undone);
    }
    operations.add(operation);
    operations.setPending(checkout);
}

void endOperation(LocalDatabase& database)
{
    WriteTransaction transaction(database.database());
    auto const operation = database.operations().running();
    if (!operation) {
        return;
    }
    database.operations().clearPending();
    if (operation->command.isEmpty()) {
        database.operations().remove(operation->id);
    } else {
        database.operations().setPhase(operation->id, phaseAfter(operation->phase));
    }
    transaction.commit();
}

void giveUpOperation(LocalDatabase& database)
{
    WriteTransaction transaction(database.database());
    if (auto const operation = database.operations().running()) {
        database.operations().clearPending();
        database.operations().remove(operation->id);
    }
    transaction.commit();
}

std::string describe(PendingCheckout const& checkout, LocalDatabase const& database)
{
    return "'" + commandOf(checkout, database) + "' was interrupted: the working folder holds files of two commits.";
}

std::string pendingNotice(common::RootPath const& root, LocalDatabase const& database)
{
    PendingOperation pending = readJournal(database);
    if (std::holds_alternative<std::monostate>(pending)) {
        return {};
    }
    if (std::string const holder = lockHolder(root); !holder.empty()) {
        return holder + ", is changing the repository.";
    }
    pending = readJournal(database); // It may have ended meanwhile.
    if (std::holds_alternative<PendingCommit>(pending)) {
        return "A commit was interrupted. The next command that changes something completes it.";
    }
    auto const* const checkout = std::get_if<PendingCheckout>(&pending);
    return checkout && !checkout->isWritten ? describe(*checkout, database) + " Run it again to complete it."
                                            : std::string();
}

} // namespace tav
