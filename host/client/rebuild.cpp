#include "host/client/rebuild.h"

#include "host/client/history.h"
#include "host/errors/failure.h"
#include "host/repository/identity.h"
#include "host/repository/working_state.h"
#include "host/storage/local_storage.h"
#include "host/user/projects.h"

#include "common/mu_common_serialization.h"
#include "platform/os/os_files.h"

#include <algorithm>
#include <filesystem>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace tav {

namespace {

using Urls = std::set<OdString>;

/// A repository of the server, and what it says of the versions that are kept here.
struct Candidate {
    OdString repository;
    std::size_t known = 0; ///< versions of its files
    std::size_t unknown = 0;
};

/// Every repository begins with the same ignore rules: having those in common says nothing.
bool isProperty(OdString const& path)
{
    return path.left(5) == OdString(L".tav/");
}

Candidate candidateOf(OdString const& server, OdString const& repository, Urls unknown)
{
    Candidate candidate{repository};
    Connection connection(server, repository);
    forEachPageThere(connection, 0, [&](std::vector<ChangedCommit> const& page) {
        for (ChangedCommit const& commit : page) {
            for (FileRecord const& change : commit.changes) {
                bool const isHere = unknown.erase(change.url) > 0;
                candidate.known += isHere && !isProperty(change.path) ? 1 : 0;
            }
        }
    });
    candidate.unknown = unknown.size();
    return candidate;
}

/// The repository that the list of projects names for `folder`; empty when it knows none.
OdString listedRepository(OdString const& folder)
{
    common::ConfigData const data = readProjects();
    auto const listed = data.projects.find(folder);
    return listed == data.projects.end() ? OdString() : listed->second.cloud;
}

/// The repository that is noted for `folder`, here or in the list of projects; empty when none is.
OdString ownRepository(common::RootPath const& root, OdString const& folder)
{
    std::vector<OdString> const noted = identities(root);
    return noted.empty() ? listedRepository(folder) : noted.back();
}

/// The repositories that `here` may belong to, the best first: `listed`, or, where no list knows the folder, those
/// that have any of it.
std::vector<Candidate> candidatesOn(OdString const& server, OdString const& listed, Urls const& here)
{
    std::vector<Candidate> candidates;
    for (OdString const& repository : repositoriesIn(server)) {
        if (!listed.isEmpty() && repository != listed) {
            continue;
        }
        Candidate const candidate = candidateOf(server, repository, here);
        if (candidate.known > 0 || (candidate.unknown == 0 && !listed.isEmpty())) {
            candidates.push_back(candidate);
        }
    }
    auto const isBetter = [](Candidate const& a, Candidate const& b) { return a.unknown < b.unknown; };
    std::stable_sort(candidates.begin(), candidates.end(), isBetter);
    return candidates;
}

/// The repository to which all versions here belong: 'tav gc' removes those that its repository does not know. Some may
/// be left of an interrupted command, so the word of the user counts together with the list of projects.
Candidate findRepository(common::RootPath const& root, OdString const& folder, RebuildSource const& source)
{
    constexpr char const* kNameIt = "Name the folder of the right one with --server.";
    Urls const here = valueOrFail(LocalStorage(root).contents(), "Check the disk and your rights in '.tav'.");
    OdString const listed = ownRepository(root, folder);
    std::vector<Candidate> const candidates = candidatesOn(source.server, listed, here);
    std::string const server = "The server in '" + source.server.ansi_str() + "'";
    if (candidates.empty()) {
        throw Failure(server + " has no repository to which the versions here belong.", kNameIt);
    }
    Candidate const& best = candidates.front();
    bool const isTrusted = source.isNamed && !listed.isEmpty();
    if (best.unknown > 0 && !isTrusted) {
        throw Failure(
            server + " does not know " + std::to_string(best.unknown) + " of the " +
                std::to_string(best.known + best.unknown) + " versions that are here.",
            kNameIt);
    }
    if (candidates.size() > 1 && candidates[1].unknown == best.unknown) {
        throw Failure(
            "Several repositories of the server in '" + source.server.ansi_str() + "' have the versions that are here.",
            "Put a copy of '" + root.dbPath().ansi_str() + "' from a backup in its place.");
    }
    return best;
}

/// A journal would be carried out on the new file.
void removeWithJournal(std::string const& path)
{
    for (std::string const& file : {path, path + "-journal"}) {
        std::error_code error;
        std::filesystem::remove(file, error);
        if (error) {
            throw Failure(
                "'" + file + "' cannot be removed: " + error.message() + ".", "Check your permissions there.");
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

Rebuilt rebuildDatabase(common::RootPath const& root, OdString const& folder, RebuildSource const& source)
{
    Candidate const found = findRepository(root, folder, source);
    std::string const path = root.dbPath().ansi_str();
    std::string const newPath = path + ".new";
    removeWithJournal(newPath);
    Rebuilt rebuilt;
    {
        LocalDatabase database = LocalDatabase::makeAt(newPath);
        database.setServer(source.server, found.repository);
        rebuilt = fill(root, database, readState(root)->read().head);
        rebuilt.unknown = found.unknown;
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
