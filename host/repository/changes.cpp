#include "host/repository/changes.h"

#include "host/failure.h"
#include "host/repository/digest.h"
#include "host/repository/index_record.h"
#include "host/storage/local_storage.h"

#include "common/mu_common_file_storage.h"
#include "common/mu_common_file_utils.h"

#include <regex>
#include <set>
#include <utility>

namespace tav {

namespace {

/// The working files, beside what they are compared with.
struct Comparison {
    common::RootPath const& root;
    common::State const& state;
    VerifiedTimes* verified;
    Tree missing; ///< what has not been met in the working folder so far
    common::RepoChanges changes;
};

bool isUnchanged(OdString const& path, OdString const& url, Comparison& comparison)
{
    std::uint64_t const time = common::modifyTime(path, comparison.root);
    auto const record = comparison.state.index.find(path);
    if (record != comparison.state.index.end() && isUntouched(record->second, time)) {
        return true;
    }
    if (hasOtherContent(path, url, comparison.root)) {
        return false;
    }
    if (comparison.verified) {
        comparison.verified->emplace(path, time);
    }
    return true;
}

void sortIn(common::File file, Comparison& comparison)
{
    auto const match = comparison.missing.find(file.path);
    if (match == comparison.missing.end()) {
        comparison.changes.untracked.push_back({nullptr, std::move(file), 0});
        return;
    }
    common::VersionedFile version{file.path, std::move(match->second)};
    comparison.missing.erase(match);
    if (isUnchanged(version.path, version.storagePath, comparison)) {
        comparison.changes.unchanged.push_back(std::move(version));
    } else {
        comparison.changes.modified.push_back({nullptr, std::move(file), std::move(version), 0});
    }
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
compare(common::RootPath const& root, Tree committed, common::State const& state, VerifiedTimes* verified)
{
    Comparison comparison{root, state, verified, std::move(committed), {}};
    for (common::File& file : scan(root)) {
        sortIn(std::move(file), comparison);
    }
    for (auto& [path, url] : comparison.missing) {
        comparison.changes.removed.push_back({nullptr, {path, std::move(url)}, 0});
    }
    return std::move(comparison.changes);
}

void enterVerified(VerifiedTimes const& verified, std::uint64_t start, common::State& state)
{
    for (auto const& [path, time] : verified) {
        state.index.insert_or_assign(path, indexRecord(time, start));
    }
}

bool hasOtherContent(OdString const& path, OdString const& url, common::RootPath const& root)
{
    if (common::urlToType(url) == common::StorageType::Object) {
        return common::isDifferent(path, url, root);
    }
    // For a revision the library answers without a look at the file; its URL carries the digest of the content.
    auto const digest = fileDigest(root.pathTo(path));
    return !digest || digest != digestOf(url);
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
