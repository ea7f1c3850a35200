#include "host/repository/moving.h"

#include "host/repository/index_record.h"
#include "host/repository/staging.h"
#include "host/repository/unfinished.h"
#include "host/repository/working_state.h"

#include <algorithm>

namespace tav {

namespace {

/// The targets of moves whose files may be in the working folder beside those of the last commit.
std::vector<OdString> begunMoves(LocalDatabase const& database)
{
    Unfinished const unfinished = unfinishedOf(database);
    auto const* const move = std::get_if<MoveUnderWay>(&unfinished);
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

/// `update` as it was before the check: also a file that was found as it shall be is no change any more.
void enterFiles(TreeUpdate const& update, WrittenTimes const& times, common::State& state)
{
    std::vector<common::StagedFile> settled;
    for (Tree const* const files : {&update.writes, &update.removals}) {
        for (auto const& [path, url] : *files) {
            state.index.erase(path);
            settled.emplace_back(path, common::FileChange::modified);
        }
    }
    for (auto const& [path, time] : times) {
        state.index.insert_or_assign(path, common::IndexData{time, false});
    }
    unstage(settled, state);
}

} // namespace

Moved moveTo(
    common::RootPath const& root, LocalDatabase& database, Destination const& destination, Unsaved unsaved,
    std::uint64_t start)
{
    std::vector<OdString> const begun = begunMoves(database);
    TreeUpdate const whole = updateBetween(
        database.commits().files(database.base()), filesOf(begun, database),
        database.commits().files(destination.commit));
    TreeUpdate update = whole;
    checkUpdate(root, database, unsaved, update);
    LocalStorage storage;
    MoveUnderWay move{destination.commit, destination.branch, false, begun};
    WrittenTimes const times = carryOut(root, storage, update, start, [&] { note(move, database); });
    Change change(database.database());
    database.setBase(destination.commit);
    move.isWritten = true;
    note(move, database);
    change.commit();
    changeState(root, [&](common::Cache& cache) {
        cache.write().head = destination.branch;
        enterFiles(whole, times, cache.write());
    });
    note(std::monostate(), database);
    return {update.writes.size(), update.removals.size()};
}

void finishMove(common::RootPath const& root, LocalDatabase& database, Destination const& destination)
{
    changeState(root, [&](common::Cache& cache) { cache.write().head = destination.branch; });
    note(std::monostate(), database);
}

} // namespace tav
