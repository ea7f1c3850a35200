#include "host/changes/changes.h"

#include "host/changes/digest.h"
#include "host/changes/index_record.h"
#include "host/changes/scan_order.h"
#include "host/failure.h"
#include "host/repository/ignore_file.h"
#include "host/storage/local_storage.h"
#include "host/text/wide.h"

#include "common/mu_common_file_storage.h"
#include "common/mu_common_file_utils.h"

#include <algorithm>
#include <filesystem>
#include <future>
#include <iterator>
#include <regex>
#include <set>
#include <utility>

namespace tav {

namespace {

/// A file that cannot be looked at is not taken for removed.
bool isThere(OdString const& path, common::RootPath const& root)
{
    std::error_code error;
    auto const type = std::filesystem::symlink_status(root.pathTo(path).ansi_str(), error).type();
    return type != std::filesystem::file_type::not_found && type != std::filesystem::file_type::directory;
}

using Index = std::map<OdString, common::IndexData>;

/// Goes through the index beside a list of paths that is in the same order, which saves looking each path up.
class IndexCursor {
public:
    explicit IndexCursor(Index const& index) : next_(index.begin()), end_(index.end()) {}

    /// Whether the index says that `file`, which comes behind the ones asked for before, is as it was committed.
    bool isUntouched(CommittedFile const& file)
    {
        while (next_ != end_ && next_->first < file.path) {
            ++next_;
        }
        return next_ != end_ && next_->first == file.path && tav::isUntouched(next_->second, file.time);
    }

private:
    Index::const_iterator next_;
    Index::const_iterator end_;
};

} // namespace

std::vector<common::File> scan(common::RootPath const& root)
{
    requireRules(root);
    try {
        return valueOrFail(common::collectRepoFiles(root), "Check the path of the repository.");
    } catch (std::regex_error const&) {
        throw Failure(
            "The ignore file has a rule that is no regular expression that can be used.",
            "Mend '.tav/properties/ignore'.");
    }
}

FolderMatch matchFolder(common::RootPath const& root, FileList committed)
{
    FolderMatch match = matchPaths(root, scan(root), std::move(committed));
    TimeReading times(match.committed, root);
    auto other = std::async([&] { times.run(); }); // Or later, where no thread is to be had.
    times.run();
    other.get();
    return match;
}

FolderMatch matchPaths(common::RootPath const& root, std::vector<common::File> scanned, FileList committed)
{
    auto const byPath = [](common::File const& a, common::File const& b) { return a.path < b.path; };
    sortScanned(scanned, byPath);
    FolderMatch match;
    match.committed.reserve(committed.size());
    auto file = scanned.begin();
    for (auto& [path, url] : committed) {
        for (; file != scanned.end() && file->path < path; ++file) {
            match.untracked.push_back(std::move(*file));
        }
        bool const isScanned = file != scanned.end() && file->path == path;
        bool const isThere = isScanned || tav::isThere(path, root);
        match.committed.push_back({std::move(path), std::move(url), isThere, 0});
        file += isScanned ? 1 : 0;
    }
    std::move(file, scanned.end(), std::back_inserter(match.untracked));
    return match;
}

void TimeReading::run()
{
    constexpr std::size_t kBatch = 500;
    for (std::size_t begin = next_.fetch_add(kBatch); begin < files_.size(); begin = next_.fetch_add(kBatch)) {
        std::size_t const end = std::min(begin + kBatch, files_.size());
        for (std::size_t i = begin; i < end; ++i) {
            if (files_[i].isThere) {
                files_[i].time = common::modifyTime(files_[i].path, root_);
            }
        }
    }
}

common::RepoChanges
compare(common::RootPath const& root, FolderMatch match, common::State const& state, VerifiedTimes* verified)
{
    common::RepoChanges changes;
    IndexCursor index(state.index);
    for (CommittedFile& file : match.committed) {
        bool const isUntouched = file.isThere && index.isUntouched(file);
        OdString url = wide(file.url);
        bool const isUnchanged = isUntouched || (file.isThere && !hasOtherContent(file.path, url, root));
        if (isUnchanged && !isUntouched && verified) {
            verified->emplace(file.path, file.time);
        }
        common::VersionedFile version{std::move(file.path), std::move(url)};
        if (isUnchanged) {
            changes.unchanged.push_back(std::move(version));
        } else if (file.isThere) {
            changes.modified.push_back({nullptr, {version.path}, version, 0});
        } else {
            changes.removed.push_back({nullptr, std::move(version), 0});
        }
    }
    for (common::File& file : match.untracked) {
        changes.untracked.push_back({nullptr, std::move(file), 0});
    }
    return changes;
}

void dropUntouched(FolderMatch& match, common::State const& state)
{
    IndexCursor index(state.index);
    auto const isUntouched = [&](CommittedFile const& file) { return file.isThere && index.isUntouched(file); };
    auto const kept = std::remove_if(match.committed.begin(), match.committed.end(), isUntouched);
    match.committed.erase(kept, match.committed.end());
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
