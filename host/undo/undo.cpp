#include "host/undo/undo.h"

#include "host/checkout/checkout.h"
#include "host/checkout/file_moves.h"
#include "host/client/connection.h"
#include "host/errors/failure.h"
#include "host/history/tracked_path.h"
#include "host/protocol/commit_document.h"
#include "host/repository/conflicts.h"
#include "host/repository/working_state.h"
#include "host/text/characters.h"
#include "host/text/utf8.h"

#include "platform/os/os_files.h"

#include <filesystem>
#include <string>

namespace tav {

namespace {

namespace fs = std::filesystem;

Side otherThan(Side side)
{
    return side == Side::before ? Side::after : Side::before;
}

OdString const& urlOn(Side side, FileContents const& file)
{
    return side == Side::before ? file.before : file.after;
}

Phase phaseOn(Side side)
{
    return side == Side::before ? Phase::undone : Phase::done;
}

bool isAt(Position const& position, LocalDatabase const& database, common::State const& state)
{
    return position.commit == database.currentCommit() && position.branch == state.head;
}

/// What somebody has changed since, apart from files.
std::vector<std::string> faults(Operation const& operation, LocalDatabase const& database, common::State const& state)
{
    std::vector<std::string> faults;
    if (!isAt(operation.before, database, state) && !isAt(operation.after, database, state)) {
        faults.emplace_back("The working folder is at another commit or branch now.");
    }
    if (!isOn(Side::before, operation.staging, state) && !isOn(Side::after, operation.staging, state)) {
        faults.emplace_back("Other files are staged by now.");
    }
    return faults;
}

void failForAny(std::vector<std::string> faults, Operation const& operation, Side to)
{
    if (faults.empty()) {
        return;
    }
    std::string const what = to == Side::before ? " cannot be taken back." : " cannot be done again.";
    Failure failure(quoted(operation.command) + what, "Nothing has changed; see 'tav undo --list':");
    failure.details = std::move(faults);
    throw failure;
}

void bringStagingTo(Side to, Operation const& operation, common::State& state)
{
    if (!isOn(to, operation.staging, state)) {
        bringTo(to, operation.staging, state);
    }
    for (FileContents const& file : operation.files) {
        state.index.erase(file.path);
    }
}

TreeUpdate updateTo(Side to, Operation const& operation)
{
    TreeUpdate update;
    for (FileContents const& file : operation.files) {
        OdString const& wanted = urlOn(to, file);
        OdString const& expected = urlOn(otherThan(to), file);
        (wanted.isEmpty() ? update.removals : update.writes).emplace(file.path, wanted);
        if (!expected.isEmpty()) {
            update.expected.emplace(file.path, expected);
        }
    }
    if (to == Side::before) {
        addPermissions(operation.files, update);
    }
    return update;
}

void end(
    common::RootPath const& root, LocalDatabase& database, Operation const& operation, Side to,
    VerifiedFileList const& verified)
{
    changeState(root, [&](common::Cache& cache) { bringStagingTo(to, operation, cache.write()); });
    WriteTransaction transaction(database.database());
    database.operations().setPhase(operation.id, phaseOn(to));
    database.addVerified(verified);
    transaction.commit();
}

Turned turnFiles(
    common::RootPath const& root, LocalDatabase& database, Operation const& operation, Side to, Discard discard,
    std::uint64_t start)
{
    if (operation.files.empty()) {
        end(root, database, operation, to, {});
        return {};
    }
    TreeUpdate update = updateTo(to, operation);
    LocalStorage storage(root);
    checkUpdate(root, database, storage, {}, discard, update);
    std::vector<FileContents> const discarded = discardedFiles(update, to);
    Updated const updated = carryOut(root, storage, update, start, [&] {
        WriteTransaction transaction(database.database());
        database.operations().setFiles(operation.id, discarded);
        transaction.commit();
    });
    end(root, database, operation, to, updated.verified);
    return {update.writes.size(), update.removals.size(), pathsOf(discarded)};
}

bool isThere(OdString const& path, common::RootPath const& root)
{
    std::error_code error;
    return fs::exists(fs::symlink_status(root.pathTo(path).ansi_str(), error));
}

/// The paths come from a database that anybody may have made, and folders may have become links meanwhile.
void requireSafe(OdString const& path, common::RootPath const& root)
{
    if (auto const fault = whyUnsafe(path)) {
        throw Failure(*fault, "Nothing has been moved.");
    }
    fs::path const folder = fs::path(path.ansi_str()).parent_path();
    auto const link = folder.empty() ? std::nullopt : linkOnTheWay(root.path().ansi_str(), fromUtf8(folder.string()));
    if (link) {
        throw Failure(*link, "Nothing has been moved; move that away first.");
    }
}

Turned turnRename(common::RootPath const& root, LocalDatabase& database, Operation const& operation, Side to)
{
    OdString const& from = to == Side::before ? operation.movedTo : operation.movedFrom;
    OdString const& back = to == Side::before ? operation.movedFrom : operation.movedTo;
    requireSafe(from, root);
    requireSafe(back, root);
    bool const isToMove = isThere(from, root);
    if (isToMove && isThere(back, root)) {
        failForAny({"There is another " + quoted(back) + " by now."}, operation, to);
    }
    if (!isToMove && !isThere(back, root)) {
        failForAny({quoted(from) + " is gone."}, operation, to);
    }
    FileMoves onDisk(root.path().ansi_str());
    if (isToMove) {
        std::string const folder = fs::path(back.ansi_str()).parent_path().string();
        if (auto const error = os::makeFolders(root.path().ansi_str() + "/" + folder, 0777)) {
            throw Failure("The folder '" + folder + "' cannot be made: " + error.message() + ".", "Make it yourself.");
        }
        onDisk.move(from.ansi_str(), back.ansi_str());
    }
    changeState(root, [&](common::Cache& cache) { bringStagingTo(to, operation, cache.write()); });
    onDisk.keep();
    WriteTransaction transaction(database.database());
    database.operations().setPhase(operation.id, phaseOn(to));
    transaction.commit();
    return {};
}

Position const& positionOn(Side side, Operation const& operation)
{
    return side == Side::before ? operation.before : operation.after;
}

/// The branch goes on the server first: when that refuses, nothing has changed.
Turned turnCommit(common::RootPath const& root, LocalDatabase& database, Operation const& operation, Side to)
{
    Position const& wanted = positionOn(to, operation);
    common::Reference const branch(wanted.branch, wanted.commit, common::EType::branch);
    Connection(database).request(
        "references", referenceChanges({{branch, positionOn(otherThan(to), operation).commit}}));
    changeState(root, [&](common::Cache& cache) {
        bringStagingTo(to, operation, cache.write());
        for (OdString const& commit : {operation.before.commit, operation.after.commit}) { // One may replace the other.
            for (FileRecord const& change : database.commits().changes(commit)) {
                cache.write().index.erase(change.path);
            }
        }
    });
    WriteTransaction transaction(database.database());
    if (branch.commitHash.isEmpty()) {
        database.commits().removeReference(branch.name);
    } else {
        database.commits().set(branch);
    }
    database.setCurrentCommit(wanted.commit);
    database.operations().setPhase(operation.id, phaseOn(to));
    transaction.commit();
    return {};
}

} // namespace

std::optional<Operation> nextToTurn(LocalDatabase const& database, Side to)
{
    Operations const& operations = database.operations();
    auto operation = operations.running();
    if (!operation) {
        operation = to == Side::before ? operations.last(Phase::done) : operations.first(Phase::undone);
    }
    if (operation) {
        operations.readDetails(*operation);
    }
    return operation;
}

Turned turn(
    common::RootPath const& root, LocalDatabase& database, Operation const& operation, Side to, Discard discard,
    std::uint64_t start)
{
    requireNoConflicts(root);
    failForAny(faults(operation, database, readState(root)->read()), operation, to);
    switch (operation.kind) {
    case Kind::move: {
        Phase const phase = to == Side::before ? Phase::undoing : Phase::redoing;
        CheckedOut const moved = turnMove(root, database, operation, phase, discard, start);
        return {moved.written, moved.removed, moved.discarded};
    }
    case Kind::rename: return turnRename(root, database, operation, to);
    case Kind::commit: return turnCommit(root, database, operation, to);
    case Kind::files: break;
    }
    return turnFiles(root, database, operation, to, discard, start);
}

} // namespace tav
