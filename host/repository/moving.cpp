#include "host/repository/moving.h"

#include "host/repository/index_record.h"
#include "host/repository/staging.h"
#include "host/repository/unfinished.h"
#include "host/repository/working_state.h"

namespace tav {

namespace {

void enterFiles(TreeUpdate const& update, WrittenTimes const& times, common::State& state)
{
    std::vector<common::StagedFile> replaced;
    for (auto const& [path, time] : times) {
        state.index.insert_or_assign(path, common::IndexData{time, false});
        replaced.emplace_back(path, common::FileChange::modified);
    }
    for (auto const& [path, url] : update.removals) {
        state.index.erase(path);
        replaced.emplace_back(path, common::FileChange::removed);
    }
    unstage(replaced, state);
}

} // namespace

Moved moveTo(
    common::RootPath const& root, LocalDatabase& database, Destination const& destination, Unsaved unsaved,
    std::uint64_t start)
{
    Tree const from = database.commits().files(database.base());
    TreeUpdate update = updateBetween(from, database.commits().files(destination.commit));
    checkUpdate(root, database, from, unsaved, update);
    LocalStorage storage;
    note(MoveUnderWay{destination.commit, destination.branch, false}, database);
    WrittenTimes const times = carryOut(root, storage, update, start);
    Change change(database.database());
    database.setBase(destination.commit);
    note(MoveUnderWay{destination.commit, destination.branch, true}, database);
    change.commit();
    changeState(root, [&](common::Cache& cache) {
        cache.write().head = destination.branch;
        enterFiles(update, times, cache.write());
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
