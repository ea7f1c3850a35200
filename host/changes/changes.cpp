#include "host/changes/changes.h"

#include "host/changes/digest.h"
#include "host/changes/index_record.h"
#include "host/changes/scan_order.h"
#include "host/errors/failure.h"
#include "host/repository/ignore_file.h"
#include "host/storage/storage_url.h"
#include "host/text/utf8.h"

#include "common/mu_common_file_utils.h"

#include <algorithm>
#include <filesystem>
#include <future>
#include <iterator>
#include <regex>
#include <set>
#include <string>
#include <string_view>
#include <utility>

namespace tav {

namespace {

/// Finds records of files that are asked for in about the order of the list: mostly it is the next one.
class VerifiedFinder {
public:
    explicit VerifiedFinder(VerifiedFileList const& files) : files_(files), next_(files.begin()) {}

    /// Whether the file `path`, which has the stamp `stamp`, has the content at `url`.
    bool isKnown(std::string const& path, FileStamp const& stamp, std::string_view url)
    {
        if (!isNext(path)) {
            auto const isBefore = [](VerifiedFile const& file, std::string const& other) { return file.path < other; };
            next_ = std::lower_bound(files_.begin(), files_.end(), path, isBefore);
        }
        if (!isNext(path)) {
            return false;
        }
        VerifiedFile const& file = *next_++;
        return file.stamp == stamp && file.digest == digestOf(url);
    }

private:
    bool isNext(std::string const& path) const { return next_ != files_.end() && next_->path == path; }

    VerifiedFileList const& files_;
    VerifiedFileList::const_iterator next_;
};

/// Whether a file that has been read is the one that was looked at before. The way to it is gone anew: a folder may
/// have been replaced as well.
bool isStill(CommittedFile const& file, common::RootPath const& root)
{
    return file.sight.stamp && FolderView(root).look(file.path).stamp == file.sight.stamp;
}

/// A folder that cannot be examined is taken for there.
bool exists(OdString const& folder, common::RootPath const& root)
{
    std::error_code error;
    std::string const path = folder.isEmpty() ? root.path().ansi_str() : root.pathTo(folder).ansi_str();
    return std::filesystem::symlink_status(path, error).type() != std::filesystem::file_type::not_found;
}

OdString folderOf(OdString const& path)
{
    return fromUtf8(std::filesystem::path(path.ansi_str()).parent_path().string());
}

} // namespace

bool isBelow(Folders const& folders, OdString const& path)
{
    if (folders.count(OdString()) > 0) {
        return true;
    }
    for (std::size_t i = 0; !folders.empty() && i < path.getLength(); ++i) {
        if (path.getAt(i) == L'/' && folders.count(path.left(i)) > 0) {
            return true;
        }
    }
    return false;
}

bool isUnread(Presence presence, OdString const& path, Folders const& unreadable)
{
    return presence == Presence::isUnknown || (presence == Presence::isGone && isBelow(unreadable, path));
}

Scanned scan(common::RootPath const& root)
{
    requireRules(root);
    try {
        std::vector<OdString> unread;
        Scanned scanned{valueOrFail(common::collectRepoFiles(root, unread), "Check the path of the repository."), {}};
        for (OdString const& folder : unread) {
            if (exists(folder, root)) {
                scanned.unreadable.insert(folder);
            }
        }
        return scanned;
    } catch (std::regex_error const&) {
        throw Failure(
            "The ignore file has a rule that is not a valid regular expression.", "Correct '.tav/properties/ignore'.");
    }
}

FolderMatch matchFolder(common::RootPath const& root, FileList committed, VerifiedFileList const& known)
{
    FolderMatch match = matchPaths(scan(root), std::move(committed));
    Examination examination(match.committed, known, root);
    auto other = std::async([&] { examination.run(); }); // Or later, where no thread is to be had.
    examination.run();
    other.get();
    return match;
}

FolderMatch matchPaths(Scanned found, FileList committed)
{
    std::vector<common::File>& scanned = found.files;
    auto const byPath = [](common::File const& a, common::File const& b) { return a.path < b.path; };
    sortScanned(scanned, byPath);
    FolderMatch match;
    match.unreadable = std::move(found.unreadable);
    match.committed.reserve(committed.size());
    auto file = scanned.begin();
    for (ListedFile& listed : committed) {
        for (; file != scanned.end() && file->path < listed.path; ++file) {
            match.untracked.push_back(std::move(*file));
        }
        bool const isScanned = file != scanned.end() && file->path == listed.path;
        match.committed.push_back({std::move(listed.path), std::move(listed.url)});
        file += isScanned ? 1 : 0;
    }
    std::move(file, scanned.end(), std::back_inserter(match.untracked));
    return match;
}

void Examination::run()
{
    FolderView view(root_);
    VerifiedFinder finder(known_);
    constexpr std::size_t kBatch = 500;
    for (std::size_t begin = next_.fetch_add(kBatch); begin < files_.size(); begin = next_.fetch_add(kBatch)) {
        std::size_t const end = std::min(begin + kBatch, files_.size());
        for (std::size_t i = begin; i < end; ++i) {
            CommittedFile& file = files_[i];
            std::string const path = file.path.ansi_str();
            file.sight = view.look(path);
            file.isKnown = file.sight.stamp && finder.isKnown(path, *file.sight.stamp, file.url);
        }
    }
}

FolderChanges compare(common::RootPath const& root, FolderMatch match, VerifiedFileList* verified)
{
    FolderChanges changes;
    changes.unreadable = std::move(match.unreadable);
    for (CommittedFile& file : match.committed) {
        bool const isThere = file.sight.presence == Presence::isThere;
        OdString url = fromUtf8(file.url);
        bool const isUnchanged = file.isKnown || (isThere && !hasOtherContent(file.path, url, root));
        if (isUnchanged && !file.isKnown && verified && isStill(file, root)) {
            verified->push_back({file.path.ansi_str(), *digestOf(std::string_view(file.url)), *file.sight.stamp});
        }
        common::VersionedFile version{std::move(file.path), std::move(url)};
        if (isUnchanged) {
            changes.unchanged.push_back(std::move(version));
        } else if (isThere) {
            changes.modified.push_back({nullptr, {version.path}, version, 0});
        } else if (isUnread(file.sight.presence, version.path, changes.unreadable)) {
            changes.unread.push_back(std::move(version));
        } else if (file.sight.presence == Presence::isBehindLink) {
            changes.unreachable.push_back(std::move(version));
        } else {
            changes.removed.push_back({nullptr, std::move(version), 0});
        }
    }
    for (common::VersionedFile const& file : changes.unread) {
        if (!isBelow(changes.unreadable, file.path)) {
            changes.unreadable.insert(folderOf(file.path));
        }
    }
    for (common::File& file : match.untracked) {
        changes.untracked.push_back({nullptr, std::move(file), 0});
    }
    return changes;
}

void dropKnown(FolderMatch& match)
{
    auto const isKnown = [](CommittedFile const& file) { return file.isKnown; };
    auto const kept = std::remove_if(match.committed.begin(), match.committed.end(), isKnown);
    match.committed.erase(kept, match.committed.end());
}

void enterVerified(VerifiedFileList const& verified, std::uint64_t start, common::State& state)
{
    for (VerifiedFile const& file : verified) {
        state.index.insert_or_assign(
            fromUtf8(file.path), indexRecord(static_cast<std::uint64_t>(file.stamp.modified), start));
    }
}

void keepVerified(VerifiedFileList const& verified, LocalDatabase& database)
{
    if (verified.empty()) {
        return;
    }
    try {
        WriteTransaction transaction(database.database());
        database.addVerified(verified);
        transaction.commit();
    } catch (Failure const&) {
        // What is needed for the work itself fails with a message of its own.
    }
}

bool hasOtherContent(OdString const& path, OdString const& url, common::RootPath const& root)
{
    // Not by the library's own comparison: to that one a file that cannot be read is as good as an empty one.
    auto const digest = fileDigest(root.pathTo(path));
    return !digest || digest != digestOf(url);
}

std::vector<OdString> ignoredFiles(common::RootPath const& root)
{
    std::set<OdString> kept;
    Scanned scanned = scan(root);
    for (common::File& file : scanned.files) {
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
