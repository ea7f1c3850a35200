#include "host/checkout/checkout.h"

#include "host/changes/changes.h"
#include "host/changes/index_record.h"
#include "host/changes/staging.h"
#include "host/checkout/permissions.h"
#include "host/repository/conflicts.h"
#include "host/repository/working_state.h"

#include <algorithm>
#include <iterator>
#include <set>
#include <utility>

namespace tav {

namespace {

/// The targets of moves whose files may be in the working folder beside those of the last commit.
std::vector<OdString> begunCheckouts(LocalDatabase const& database)
{
    PendingOperation const pending = readJournal(database);
    auto const* const move = std::get_if<PendingCheckout>(&pending);
    if (!move) {
        return {};
    }
    std::vector<OdString> targets = move->begun;
    if (std::find(targets.begin(), targets.end(), move->target) == targets.end()) {
        targets.push_back(move->target);
    }
    return targets;
}

std::vector<Tree> filesOf(std::vector<OdString> const& commits, LocalDatabase const& database)
{
    std::vector<Tree> files;
    for (OdString const& commit : commits) {
        files.push_back(database.commits().files(commit));
    }
    return files;
}

/// The files of the current commit that have another content in the working folder, or are gone.
struct Changed {
    Tree modified;
    Tree removed;
};

/// Files that were read and are unchanged are added to `verified`.
Changed changedFiles(common::RootPath const& root, LocalDatabase const& database, VerifiedFileList& verified)
{
    FolderMatch match = matchPaths({}, database.commits().fileList(database.currentCommit()));
    VerifiedFileList const known = database.verifiedFiles();
    Examination(match.committed, known, root).run();
    dropKnown(match);
    FolderChanges const changes = compare(root, std::move(match), &verified);
    Changed changed;
    for (auto const& file : changes.modified) {
        changed.modified.emplace(file.committed.path, file.committed.storagePath);
    }
    for (common::VersionedFile const& file : changes.unread) {
        changed.modified.emplace(file.path, file.storagePath);
    }
    for (auto const& file : changes.removed) {
        changed.removed.emplace(file.committed.path, file.committed.storagePath);
    }
    return changed;
}

/// Adds to `update` the changed files that both commits have alike. What the update touches anyway stands first.
void addChanged(Changed const& changed, TreeUpdate& update)
{
    for (Tree const* const files : {&changed.modified, &changed.removed}) {
        for (auto const& file : *files) {
            if (update.removals.count(file.first) == 0 && update.writes.insert(file).second) {
                update.expected.insert(file);
            }
        }
    }
}

/// How many changed files the move leaves alone, and nobody has staged.
std::size_t countKept(Changed const& changed, TreeUpdate const& update, std::set<OdString> const& staged)
{
    return static_cast<std::size_t>(
        std::count_if(changed.modified.begin(), changed.modified.end(), [&](auto const& file) {
            OdString const& path = file.first;
            return update.writes.count(path) == 0 && update.removals.count(path) == 0 && staged.count(path) == 0;
        }));
}

/// A file that is back at its first path has not been renamed.
void dropRenamesOf(IndexUpdates const& files, common::State& state)
{
    for (auto rename = state.renames.begin(); rename != state.renames.end();) {
        auto const file = files.find(rename->second);
        bool const isBack = file != files.end() && file->second;
        rename = isBack ? state.renames.erase(rename) : std::next(rename);
    }
}

/// `whole` is the update before the check: also a file that was found as it shall be is no change any more. What stays
/// of an interrupted move may be no file of the commit.
IndexUpdates settledBy(TreeUpdate const& whole, TreeUpdate const& update, Updated const& updated, std::uint64_t start)
{
    IndexUpdates files;
    for (auto const& [path, url] : whole.removals) {
        files.emplace(path, std::nullopt);
    }
    for (auto const& [path, url] : whole.writes) {
        auto const time = updated.times.find(path);
        if (time != updated.times.end()) {
            files[path] = common::IndexData{time->second, false};
        } else if (update.leftovers.count(path) == 0) {
            files[path] = indexRecord(static_cast<std::uint64_t>(update.marks.at(path).modified), start);
        } else {
            files[path] = std::nullopt;
        }
    }
    return files;
}

/// A move between two sets of files.
struct Course {
    TreeUpdate whole; ///< before the check
    TreeUpdate update;
    PendingCheckout move;
    std::vector<FileContents> uncommitted = {}; ///< files that get contents which are not those of the commit
};

/// Moves the files. `begin` notes in the journal what begins, as a part of a `WriteTransaction`.
template <class Begin>
CheckedOut carryOutMove(
    common::RootPath const& root, LocalDatabase& database, LocalStorage& storage, Course& course, std::uint64_t start,
    Begin const& begin)
{
    Updated const updated = carryOut(root, storage, course.update, start, [&] {
        WriteTransaction transaction(database.database());
        begin();
        transaction.commit();
    });
    WriteTransaction transaction(database.database());
    database.setCurrentCommit(course.move.target);
    course.move.isWritten = true;
    course.move.files = settledBy(course.whole, course.update, updated, start);
    for (FileContents const& file : course.uncommitted) {
        course.move.files[file.path] = std::nullopt;
    }
    database.operations().setPending(course.move);
    database.addVerified(updated.verified);
    transaction.commit();
    finishCheckout(root, database, course.move);
    return {course.update.writes.size(), course.update.removals.size()};
}

/// What stood in the folder and is in none of the commits `from`, between which it is.
std::vector<FileContents> exceptions(TreeUpdate const& update, std::vector<Tree> const& from, Tree const& to)
{
    Tree before = update.others;
    for (OdString const& path : update.missing) {
        bool const isInAll =
            std::all_of(from.begin(), from.end(), [&](Tree const& files) { return files.count(path) > 0; });
        if (isInAll) {
            before.emplace(path, OdString());
        }
    }
    std::vector<FileContents> files;
    for (auto const& [path, url] : before) {
        auto const after = to.find(path);
        files.push_back({path, url, after == to.end() ? OdString() : after->second});
    }
    return files;
}

/// Notes the permissions of files that go, which may make exceptions of them.
void notePermissions(common::RootPath const& root, TreeUpdate const& update, std::vector<FileContents>& files)
{
    std::set<OdString> known;
    for (FileContents& file : files) {
        known.insert(file.path);
        file.permissions = file.after.isEmpty() ? ownPermissions(root.pathTo(file.path).ansi_str()) : 0;
    }
    for (auto const& [path, url] : update.removals) {
        std::uint32_t const permissions =
            known.count(path) == 0 ? ownPermissions(root.pathTo(path).ansi_str()) : std::uint32_t{0};
        if (permissions != 0) {
            files.push_back({path, url, OdString(), permissions});
        }
    }
}

/// What the move does to the staged files: those that equal the files of the commit stop being changes.
StagingChange settling(TreeUpdate const& whole, common::State const& state)
{
    IndexUpdates files;
    for (auto const& [path, url] : whole.writes) {
        files.emplace(path, common::IndexData());
    }
    for (auto const& [path, url] : whole.removals) {
        files.emplace(path, std::nullopt);
    }
    common::State after = stagedPart(state);
    applyIndexUpdates(files, after);
    dropRenamesOf(files, after);
    return stagingChange(state, after);
}

/// The files of a commit, and over them what a move has found or left there besides.
Tree filesAround(OdString const& commit, Operation const& move, Side side, LocalDatabase const& database)
{
    Tree files = database.commits().files(commit);
    for (FileContents const& file : move.files) {
        OdString const& url = side == Side::before ? file.before : file.after;
        if (url.isEmpty()) {
            files.erase(file.path);
        } else {
            files[file.path] = url;
        }
    }
    return files;
}

} // namespace

CheckedOut checkOutCommit(
    common::RootPath const& root, LocalDatabase& database, Position const& destination, OdString const& command,
    Discard discard, std::uint64_t start)
{
    requireNoConflicts(root);
    auto const cache = readState(root);
    common::State const& state = cache->read();
    Position const here = {database.currentCommit(), state.head};
    std::vector<OdString> const begun = begunCheckouts(database);
    std::vector<Tree> from = filesOf(begun, database);
    Tree const to = database.commits().files(destination.commit);
    Tree current = database.commits().files(here.commit);
    Course course{updateBetween(current, from, to), {}, {destination.commit, destination.branch, false, begun}};
    VerifiedFileList verified;
    Changed const changed = changedFiles(root, database, verified);
    keepVerified(settledFiles(std::move(verified), start), database);
    if (discard == Discard::everything) {
        addChanged(changed, course.whole);
    }
    std::set<OdString> const staged = claimedPaths(state);
    std::size_t const unsaved = countKept(changed, course.whole, staged);
    course.update = course.whole;
    LocalStorage storage(root);
    checkUpdate(root, database, storage, staged, discard, course.update);
    bool const stays = here.commit == destination.commit && here.branch == destination.branch;
    if (stays && begun.empty() && course.update.writes.empty() && course.update.removals.empty()) {
        return {0, 0, unsaved}; // There is nothing to take back.
    }
    from.push_back(std::move(current));
    Operation operation;
    operation.kind = Kind::move;
    operation.command = command;
    operation.phase = Phase::running;
    operation.before = here;
    operation.after = destination;
    operation.files = exceptions(course.update, from, to);
    notePermissions(root, course.update, operation.files);
    operation.staging = settling(course.whole, state);
    CheckedOut moved = carryOutMove(
        root, database, storage, course, start, [&] { beginMove(std::move(operation), course.move, database); });
    moved.kept = unsaved;
    return moved;
}

PlannedCheckout
planCheckout(common::RootPath const& root, LocalDatabase const& database, OdString const& target, Discard discard)
{
    requireNoConflicts(root);
    TreeUpdate update = updateBetween(
        database.commits().files(database.currentCommit()), filesOf(begunCheckouts(database), database),
        database.commits().files(target));
    if (discard == Discard::everything) {
        VerifiedFileList verified;
        addChanged(changedFiles(root, database, verified), update);
    }
    LocalStorage storage(root);
    std::vector<OdString> discarded =
        planUpdate(root, database, storage, claimedPaths(readState(root)->read()), discard, update);
    return {std::move(update), std::move(discarded)};
}

CheckedOut turnMove(
    common::RootPath const& root, LocalDatabase& database, Operation const& move, Phase phase, Discard discard,
    std::uint64_t start)
{
    requireNoConflicts(root);
    Side const to = phase == Phase::undoing ? Side::before : Side::after;
    Position const& destination = to == Side::before ? move.before : move.after;
    Position const& here = to == Side::before ? move.after : move.before;
    std::vector<OdString> const begun = begunCheckouts(database);
    std::vector<Tree> from = filesOf(begun, database);
    from.push_back(filesAround(here.commit, move, to == Side::before ? Side::after : Side::before, database));
    Tree const wanted = filesAround(destination.commit, move, to, database);
    Course course{
        updateBetween(database.commits().files(database.currentCommit()), from, wanted),
        {},
        {destination.commit, destination.branch, false, begun},
        move.files};
    course.update = course.whole;
    if (to == Side::before) {
        addPermissions(move.files, course.update);
    }
    LocalStorage storage(root);
    checkUpdate(root, database, storage, {}, discard, course.update); // What is staged is as it was.
    std::vector<FileContents> const discarded = discardedFiles(course.update, to);
    CheckedOut moved = carryOutMove(root, database, storage, course, start, [&] {
        database.operations().setPhase(move.id, phase);
        database.operations().setFiles(move.id, discarded);
        database.operations().setPending(course.move);
    });
    moved.discarded = pathsOf(discarded);
    return moved;
}

/// A move that is undone brings back what was staged.
void finishCheckout(common::RootPath const& root, LocalDatabase& database, PendingCheckout const& move)
{
    auto operation = database.operations().running();
    bool const isUndone = operation && operation->phase == Phase::undoing;
    if (isUndone) {
        database.operations().readDetails(*operation);
    }
    changeState(root, [&](common::Cache& cache) {
        common::State& state = cache.write();
        state.head = move.branch;
        if (!isUndone) {
            applyIndexUpdates(move.files, state);
            dropRenamesOf(move.files, state);
            return;
        }
        enterRecords(move.files, state);
        if (!isOn(Side::before, operation->staging, state) && isOn(Side::after, operation->staging, state)) {
            bringTo(Side::before, operation->staging, state);
        }
    });
    endOperation(database);
}

} // namespace tav
