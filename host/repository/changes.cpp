#include "host/repository/changes.h"

#include "host/failure.h"

#include "common/mu_common_file_utils.h"

#include <map>
#include <regex>
#include <set>
#include <utility>

namespace tav {

namespace {

using Committed = std::map<OdString, common::VersionedFile const*>;

bool isUntouched(OdString const& path, common::RootPath const& root, common::State const& state)
{
    auto const record = state.index.find(path);
    return record != state.index.end() && !record->second.modified &&
           record->second.lastChecked == common::modifyTime(path, root);
}

/// Sorts one working file in. A committed one is taken out of `committed`, which keeps what is missing in the folder.
void sortIn(
    common::File file, Committed& committed, common::RootPath const& root, common::State const& state,
    common::RepoChanges& changes)
{
    auto const match = committed.find(file.path);
    if (match == committed.end()) {
        changes.untracked.push_back({nullptr, std::move(file), 0});
        return;
    }
    common::VersionedFile const& version = *match->second;
    if (isUntouched(file.path, root, state) || !common::isDifferent(file.path, version.storagePath, root)) {
        changes.unchanged.push_back(version);
    } else {
        changes.modified.push_back({nullptr, std::move(file), version, 0});
    }
    committed.erase(match);
}

} // namespace

std::vector<common::File> scan(common::RootPath const& root)
{
    try {
        return valueOrFail(common::collectRepoFiles(root), "Check the path of the repository.");
    } catch (std::regex_error const&) {
        throw Failure(
            "The ignore file has a rule that is no regular expression that can be used.",
            "Mend '.tav/properties/ignore'.");
    }
}

common::RepoChanges
compare(common::RootPath const& root, std::vector<common::VersionedFile> const& committed, common::State const& state)
{
    Committed missing;
    for (common::VersionedFile const& file : committed) {
        missing.emplace(file.path, &file);
    }
    common::RepoChanges changes;
    for (common::File& file : scan(root)) {
        sortIn(std::move(file), missing, root, state, changes);
    }
    for (common::VersionedFile const& file : committed) {
        if (missing.count(file.path) > 0) {
            changes.removed.push_back({nullptr, file, 0});
        }
    }
    return changes;
}

std::vector<OdString> ignoredFiles(common::RootPath const& root)
{
    std::set<OdString> kept;
    for (common::File& file : scan(root)) {
        kept.insert(std::move(file.path));
    }
    common::CollectOptions const everything(true, false, false, {});
    std::vector<OdString> ignored;
    for (OdString& path : common::collectDirContents(root.path(), everything).files) {
        if (kept.count(path) == 0) {
            ignored.push_back(std::move(path));
        }
    }
    return ignored;
}

} // namespace tav
