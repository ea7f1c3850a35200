#include "host/repository/working_tree.h"

#include "host/failure.h"
#include "host/paths/recorded_path.h"
#include "host/progress.h"
#include "host/repository/digest.h"
#include "host/repository/index_record.h"
#include "host/repository/working_state.h"

#include "platform/os/os_batch.h"
#include "platform/os/os_files.h"

#include <filesystem>
#include <string>

namespace tav {

namespace {

namespace fs = std::filesystem;

constexpr char const* kAgain = "What has been written is whole; mend that and run the command again.";

/// The part of `path` that is there to be looked at: a file that goes may stand where a folder is to be.
OdString partThatStays(OdString const& path, Tree const& removals)
{
    for (std::size_t i = 0; i < path.getLength(); ++i) {
        if (path.getAt(i) == L'/' && removals.count(path.left(i)) > 0) {
            return path.left(i);
        }
    }
    return path;
}

void checkPath(common::RootPath const& root, OdString const& path, Tree const& removals)
{
    if (auto const fault = whyUnsafe(path)) {
        throw Failure(*fault, "Nothing has been written.");
    }
    if (auto const link = linkOnTheWay(root.path().ansi_str(), partThatStays(path, removals))) {
        throw Failure(*link, "Nothing has been written; move that away first.");
    }
}

/// Whether `tree` has files in the folder `path`.
bool hasFilesIn(OdString const& path, Tree const& tree)
{
    auto const first = tree.lower_bound(path + L"/");
    return first != tree.end() && first->first.left(path.getLength() + 1) == path + L"/";
}

fs::file_type typeOf(OdString const& path, common::RootPath const& root)
{
    std::error_code error;
    return fs::symlink_status(root.pathTo(path).ansi_str(), error).type();
}

/// What is known of a working file.
struct Versions {
    OdString const* before; ///< URL of the content that the commit has which the folder stands on; null for none
    OdString const* after;  ///< URL of the content that it shall have; null when it goes
    bool isFolderBefore;    ///< it stands where a folder is whose files all go
};

enum class Finding { isFree, isAsWanted, holdsUnsaved };

Finding
lookInto(OdString const& path, Versions const& versions, common::RootPath const& root, LocalDatabase const& database)
{
    auto const digest = fileDigest(root.pathTo(path));
    if (digest && versions.after && digest == digestOf(*versions.after)) {
        return Finding::isAsWanted;
    }
    return digest && database.keeps(*digest) ? Finding::isFree : Finding::holdsUnsaved;
}

class Check {
public:
    Check(
        common::RootPath const& root, LocalDatabase const& database, Tree const& from, Tree const& removals,
        Unsaved unsaved)
        : root_(root)
        , database_(database)
        , from_(from)
        , removals_(removals)
        , cache_(readState(root))
        , unsaved_(unsaved)
    {
    }

    /// Takes out of `files` what is as it shall be.
    void sift(Tree& files, bool areWritten)
    {
        for (auto file = files.begin(); file != files.end();) {
            checkPath(root_, file->first, removals_);
            Finding const finding = look(file->first, versionsOf(*file, areWritten));
            if (finding == Finding::holdsUnsaved && unsaved_ == Unsaved::isKept) {
                inTheWay_.push_back(file->first.ansi_str());
            }
            file = finding == Finding::isAsWanted ? files.erase(file) : std::next(file);
        }
    }

    void failIfAnyIsInTheWay()
    {
        if (inTheWay_.empty()) {
            return;
        }
        Failure failure(
            "These files hold changes that are in no commit, which would be lost.",
            "Commit them first, or let them go with --force:");
        failure.details = std::move(inTheWay_);
        throw failure;
    }

private:
    Versions versionsOf(Tree::value_type const& file, bool isWritten) const
    {
        auto const before = from_.find(file.first);
        return {
            before == from_.end() ? nullptr : &before->second, isWritten ? &file.second : nullptr,
            isWritten && hasFilesIn(file.first, removals_)};
    }

    Finding look(OdString const& path, Versions const& versions) const
    {
        fs::file_type const type = typeOf(path, root_);
        if (type == fs::file_type::not_found || versions.isFolderBefore) {
            return versions.after ? Finding::isFree : Finding::isAsWanted;
        }
        if (type != fs::file_type::regular) {
            throw Failure(
                "'" + path.ansi_str() + "' is a folder, or no ordinary file.",
                "Nothing has been written; move it away first.");
        }
        auto const& index = cache_->read().index;
        auto const record = index.find(path);
        bool const isCommitted =
            versions.before && record != index.end() && isUntouched(record->second, common::modifyTime(path, root_));
        if (!isCommitted) {
            return lookInto(path, versions, root_, database_);
        }
        return versions.after && *versions.after == *versions.before ? Finding::isAsWanted : Finding::isFree;
    }

    common::RootPath const& root_;
    LocalDatabase const& database_;
    Tree const& from_;
    Tree const removals_; ///< as they were at first
    std::shared_ptr<common::Cache const> cache_;
    Unsaved unsaved_;
    std::vector<std::string> inTheWay_;
};

OdString const kRestoring = L".tav/restoring";

/// Files on their way to their names.
class Restored {
public:
    explicit Restored(common::RootPath const& root) : folder_(root.pathTo(kRestoring).ansi_str())
    {
        if (std::error_code const error = os::makeFolders(folder_, 0777)) {
            throw Failure("'" + folder_ + "' cannot be made: " + error.message() + ".", kAgain);
        }
        removeAll(); // A command that was killed may have left some.
    }
    Restored(Restored const&) = delete;
    Restored& operator=(Restored const&) = delete;
    ~Restored() { removeAll(); }

    std::string pathOf(std::size_t number) const { return folder_ + "/" + std::to_string(number); }

private:
    void removeAll() const
    {
        os::Batch batch(folder_);
        std::error_code error;
        for (fs::directory_iterator entry(folder_, error), end; !error && entry != end; entry.increment(error)) {
            [[maybe_unused]] std::error_code const ignored = batch.remove(entry->path().filename().string());
        }
    }

    std::string folder_;
};

void requireDone(std::error_code const& error, OdString const& path)
{
    if (error) {
        throw Failure("'" + path.ansi_str() + "' cannot be written: " + error.message() + ".", kAgain);
    }
}

WrittenTimes extractAll(
    common::RootPath const& root, LocalStorage& storage, Tree const& files, std::uint64_t time,
    Restored const& restored)
{
    WrittenTimes times;
    Progress progress("files", files.size());
    std::size_t number = 0;
    for (auto const& [path, url] : files) {
        std::string const file = restored.pathOf(number);
        if (auto const done = storage.extract(root, url, file); !done.hasValue()) {
            throw Failure(
                "'" + path.ansi_str() + "' cannot be brought back: " + done.error().message.ansi_str(),
                "Run 'tav verify' to see what is damaged.");
        }
        requireDone(os::setModificationTime(file, time), path);
        times.emplace(path, common::modifyTime(kRestoring + L"/" + std::to_wstring(number).c_str(), root));
        ++number;
        progress.advance();
    }
    return times;
}

void placeAll(os::Batch& batch, TreeUpdate const& update, Restored const& restored)
{
    for (auto const& [path, url] : update.removals) {
        requireDone(batch.remove(path.ansi_str()), path);
        batch.removeEmptyFoldersOf(path.ansi_str());
    }
    std::size_t number = 0;
    for (auto const& [path, url] : update.writes) {
        requireDone(batch.place(restored.pathOf(number++), path.ansi_str()), path);
    }
}

} // namespace

TreeUpdate updateBetween(Tree const& from, Tree const& to)
{
    TreeUpdate update;
    for (auto const& [path, url] : to) {
        auto const before = from.find(path);
        if (before == from.end() || before->second != url) {
            update.writes.emplace(path, url);
        }
    }
    for (auto const& [path, url] : from) {
        if (to.count(path) == 0) {
            update.removals.emplace(path, url);
        }
    }
    return update;
}

void checkUpdate(
    common::RootPath const& root, LocalDatabase const& database, Tree const& from, Unsaved unsaved, TreeUpdate& update)
{
    Check check(root, database, from, update.removals, unsaved);
    check.sift(update.removals, false);
    check.sift(update.writes, true);
    check.failIfAnyIsInTheWay();
}

WrittenTimes
carryOut(common::RootPath const& root, LocalStorage& storage, TreeUpdate const& update, std::uint64_t start)
{
    os::Batch batch(root.path().ansi_str());
    Restored const restored(root);
    WrittenTimes times = extractAll(root, storage, update.writes, timeForWrittenFiles(start), restored);
    requireDone(batch.flush(), kRestoring);
    placeAll(batch, update, restored);
    requireDone(batch.flush(), root.path());
    return times;
}

} // namespace tav
