#include "host/repository/renames.h"

#include "host/repository/digest.h"
#include "host/storage/local_storage.h"

#include <algorithm>
#include <filesystem>
#include <set>

namespace tav {

namespace {

using Sizes = std::set<std::uintmax_t>;
using PathsByDigest = std::multimap<OdString, OdString>;

Sizes sizesOf(common::RepoChanges const& changes, LocalDatabase const& database)
{
    Sizes sizes;
    for (auto const& file : changes.removed) {
        if (auto const size = database.sizeOf(file.committed.storagePath)) {
            sizes.insert(*size);
        }
    }
    return sizes;
}

PathsByDigest digestsOf(common::RepoChanges const& changes)
{
    PathsByDigest paths;
    for (auto const& file : changes.removed) {
        if (auto digest = digestOf(file.committed.storagePath)) {
            paths.emplace(std::move(*digest), file.committed.path);
        }
    }
    return paths;
}

std::vector<OdString> newFilesOf(Sizes const& sizes, common::RepoChanges const& changes, common::RootPath const& root)
{
    std::vector<OdString> paths;
    for (auto const& file : changes.untracked) {
        std::error_code error;
        auto const size = std::filesystem::file_size(root.pathTo(file.working.path).ansi_str(), error);
        if (!error && sizes.count(size) > 0) {
            paths.push_back(file.working.path);
        }
    }
    std::sort(paths.begin(), paths.end());
    return paths;
}

} // namespace

Renames findRenames(common::RepoChanges const& changes, LocalDatabase const& database, common::RootPath const& root)
{
    Renames renames;
    if (changes.removed.empty()) {
        return renames;
    }
    PathsByDigest removed = digestsOf(changes);
    for (OdString const& path : newFilesOf(sizesOf(changes, database), changes, root)) {
        auto const digest = fileDigest(root.pathTo(path));
        auto const match = digest ? removed.lower_bound(*digest) : removed.end();
        if (match != removed.end() && match->first == *digest) {
            renames.emplace(path, match->second);
            removed.erase(match);
        }
    }
    return renames;
}

} // namespace tav
