#include "host/changes/renames.h"

#include "host/changes/digest.h"
#include "host/changes/folder_view.h"
#include "host/changes/staging.h"
#include "host/history/tracked_path.h"
#include "host/storage/local_storage.h"

#include <algorithm>
#include <filesystem>
#include <set>
#include <string>

namespace tav {

namespace {

using Sizes = std::set<std::uintmax_t>;
using Paths = std::set<OdString>;
using PathsByDigest = std::multimap<Digest, OdString>;

/// Removed files that nobody told of.
std::vector<common::VersionedFile>
openRemovals(common::RepoChanges const& changes, common::State const& state, Paths told)
{
    for (auto const& [path, previous] : state.renames) {
        told.insert(previous);
    }
    std::vector<common::VersionedFile> removals;
    for (auto const& file : changes.removed) {
        if (told.count(file.committed.path) == 0) {
            removals.push_back(file.committed);
        }
    }
    return removals;
}

Sizes sizesOf(std::vector<common::VersionedFile> const& removals, LocalDatabase const& database)
{
    Sizes sizes;
    for (common::VersionedFile const& file : removals) {
        if (auto const size = database.sizeOf(file.storagePath)) {
            sizes.insert(*size);
        }
    }
    sizes.erase(0);
    return sizes;
}

PathsByDigest digestsOf(std::vector<common::VersionedFile> const& removals)
{
    PathsByDigest paths;
    for (common::VersionedFile const& file : removals) {
        if (auto const digest = digestOf(file.storagePath)) {
            paths.emplace(*digest, file.path);
        }
    }
    return paths;
}

bool isCandidate(OdString const& path, Sizes const& sizes, common::State const& state, common::RootPath const& root)
{
    std::error_code error;
    auto const size = std::filesystem::file_size(root.pathTo(path).ansi_str(), error);
    return !error && sizes.count(size) > 0 && state.renames.count(path) == 0 && !whyUnsafe(path);
}

/// New files that may be renamed ones, those that are staged first.
std::vector<OdString> candidatesIn(
    common::RepoChanges const& changes, Sizes const& sizes, common::State const& state, Paths const& staged,
    common::RootPath const& root)
{
    std::vector<OdString> candidates;
    for (auto const& file : changes.untracked) {
        if (isCandidate(file.working.path, sizes, state, root)) {
            candidates.push_back(file.working.path);
        }
    }
    auto const isStaged = [&](OdString const& path) { return staged.count(path) > 0; };
    std::stable_partition(candidates.begin(), candidates.end(), isStaged);
    return candidates;
}

} // namespace

Renames findRenames(
    common::RepoChanges const& changes, common::State const& state, LocalDatabase const& database,
    common::RootPath const& root)
{
    Renames renames;
    Paths const staged = stagedPaths(state);
    std::vector<common::VersionedFile> const removals = openRemovals(changes, state, staged);
    if (removals.empty()) {
        return renames;
    }
    PathsByDigest removed = digestsOf(removals);
    for (OdString const& path : candidatesIn(changes, sizesOf(removals, database), state, staged, root)) {
        auto const digest = fileDigest(root.pathTo(path));
        auto const match = digest ? removed.find(*digest) : removed.end();
        if (match != removed.end()) {
            renames.emplace(path, match->second);
            removed.erase(match);
        }
    }
    return renames;
}

std::set<OdString>
formerPathsOfMoves(Renames const& renames, LocalDatabase const& database, common::RootPath const& root)
{
    std::map<std::string, std::uint64_t> inodes;
    if (!renames.empty()) {
        for (VerifiedFile const& file : database.verifiedFiles()) {
            inodes.emplace(file.path, file.stamp.inode);
        }
    }
    Paths moved;
    FolderView view(root);
    for (auto const& [path, previous] : renames) {
        auto const inode = inodes.find(previous.ansi_str());
        auto const stamp = view.look(path.ansi_str()).stamp;
        if (stamp && inode != inodes.end() && stamp->inode == inode->second) {
            moved.insert(previous);
        }
    }
    return moved;
}

} // namespace tav
