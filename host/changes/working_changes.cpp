#include "host/changes/working_changes.h"

#include "host/changes/renames.h"
#include "host/repository/working_state.h"

#include <map>
#include <utility>

namespace tav {

namespace {

using ByPath = std::map<OdString, WorkingChange>;

ByPath plainChanges(common::RepoChanges const& changes)
{
    ByPath all;
    for (auto const& file : changes.modified) {
        OdString const& path = file.working.path;
        all[path] = {path, common::FileChange::modified, OdString(), file.committed.storagePath};
    }
    for (auto const& file : changes.untracked) {
        OdString const& path = file.working.path;
        all[path] = {path, common::FileChange::added, OdString(), OdString()};
    }
    for (auto const& file : changes.removed) {
        OdString const& path = file.committed.path;
        all[path] = {path, common::FileChange::removed, OdString(), file.committed.storagePath};
    }
    return all;
}

void joinRenamed(Renames const& renames, ByPath& all)
{
    for (auto const& [path, previous] : renames) {
        auto const renamed = all.find(path);
        auto const gone = all.find(previous);
        bool const isPair =
            renamed != all.end() && gone != all.end() && gone->second.change == common::FileChange::removed;
        if (isPair) {
            renamed->second.previousPath = previous;
            renamed->second.oldUrl = gone->second.oldUrl;
            all.erase(gone);
        }
    }
}

} // namespace

WorkingChanges workingChanges(common::RootPath const& root, LocalDatabase const& database, OdString const& commit)
{
    auto const cache = readState(root);
    FolderChanges const changes =
        compare(root, matchFolder(root, database.commits().fileList(commit), database.verifiedFiles()));
    ByPath all = plainChanges(changes);
    joinRenamed(cache->read().renames, all);
    joinRenamed(findRenames(changes, cache->read(), database, root), all);
    WorkingChanges found{{}, changes.unreadable};
    for (auto& [path, change] : all) {
        found.files.push_back(std::move(change));
    }
    return found;
}

} // namespace tav
