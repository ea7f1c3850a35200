#include "host/client/rebuild.h"

#include "host/client/history.h"
#include "host/errors/failure.h"
#include "host/repository/working_state.h"
#include "host/storage/local_storage.h"
#include "host/user/projects.h"

#include "common/mu_common_serialization.h"
#include "platform/os/os_files.h"

#include <algorithm>
#include <filesystem>
#include <utility>
#include <vector>

namespace tav {

namespace {

struct Candidate {
    OdString repository;
    std::size_t contents = 0; ///< of its history that are kept here
};

std::size_t contentsHere(LocalStorage& storage, std::vector<FileRecord> const& changes)
{
    auto const isHere = [&](FileRecord const& change) {
        auto const kept = storage.contains(change.url); // An error for a file that is gone, which has no URL.
        return kept.hasValue() && kept.value();
    };
    return static_cast<std::size_t>(std::count_if(changes.begin(), changes.end(), isHere));
}

std::size_t contentsHere(common::RootPath const& root, Connection& connection)
{
    std::size_t count = 0;
    LocalStorage storage(root);
    forEachPageThere(connection, 0, [&](std::vector<ChangedCommit> const& page) {
        for (ChangedCommit const& commit : page) {
            count += contentsHere(storage, commit.changes);
        }
    });
    return count;
}

/// Of two copies of one project each has the contents, but the list of projects knows which is this one.
bool isListed(OdString const& folder, OdString const& repository)
{
    common::ConfigData const data = readProjects();
    auto const listed = data.projects.find(folder);
    return listed != data.projects.end() && listed->second.cloud == repository;
}

/// The repository of the server that most of the contents here belong to.
OdString findRepository(common::RootPath const& root, OdString const& folder, OdString const& server)
{
    std::vector<Candidate> candidates;
    for (OdString const& repository : repositoriesIn(server)) {
        Connection connection(server, repository);
        if (std::size_t const contents = contentsHere(root, connection); contents > 0) {
            candidates.push_back({repository, contents});
        }
    }
    if (candidates.empty()) {
        throw Failure(
            "The server in '" + server.ansi_str() + "' has no repository to which the versions here belong.",
            "Name the folder of the right one with --server.");
    }
    auto const isBetter = [&](Candidate const& a, Candidate const& b) {
        return a.contents != b.contents ? a.contents > b.contents
                                        : isListed(folder, a.repository) && !isListed(folder, b.repository);
    };
    std::sort(candidates.begin(), candidates.end(), isBetter);
    if (candidates.size() > 1 && !isBetter(candidates[0], candidates[1])) {
        throw Failure(
            "Several repositories of the server in '" + server.ansi_str() + "' have the versions that are here.",
            "Put a copy of '" + root.dbPath().ansi_str() + "' from a backup in its place.");
    }
    return candidates.front().repository;
}

/// A journal would be carried out on the new file.
void removeWithJournal(std::string const& path)
{
    for (std::string const& file : {path, path + "-journal"}) {
        std::error_code error;
        std::filesystem::remove(file, error);
        if (error) {
            throw Failure("'" + file + "' cannot be removed: " + error.message() + ".", "Check your rights there.");
        }
    }
}

Rebuilt fill(common::RootPath const& root, LocalDatabase& database, OdString const& branch)
{
    Connection connection(database);
    fetchHistory(root, database, connection, Compared::everything);
    Rebuilt rebuilt{database.commits().lastWithoutGap()};
    auto const end = database.commits().reference(branch);
    if (auto const base = end ? database.commits().find(end->commitHash) : std::nullopt) {
        database.setCurrentCommit(base->hash);
        rebuilt.base = base->number;
    }
    return rebuilt;
}

} // namespace

Rebuilt rebuildDatabase(common::RootPath const& root, OdString const& folder, OdString const& server)
{
    OdString const repository = findRepository(root, folder, server);
    std::string const path = root.dbPath().ansi_str();
    std::string const newPath = path + ".new";
    removeWithJournal(newPath);
    Rebuilt rebuilt;
    {
        LocalDatabase database = LocalDatabase::makeAt(newPath);
        database.setServer(server, repository);
        rebuilt = fill(root, database, readState(root)->read().head);
    }
    // What the state knows of files, it knows against the commit of the lost database, which may have been another.
    changeState(root, [](common::Cache& cache) { cache.write().index.clear(); });
    removeWithJournal(path);
    if (auto const error = os::replaceFileBy(path, newPath)) {
        throw Failure("'" + path + "' cannot be made: " + error.message() + ".", "Check your rights in its folder.");
    }
    return rebuilt;
}

} // namespace tav
