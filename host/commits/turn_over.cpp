#include "host/commits/turn_over.h"

#include "host/commits/similar_files.h"
#include "host/storage/local_storage.h"
#include "host/terminal/progress.h"

#include <map>
#include <utility>
#include <vector>

namespace tav {

namespace {

/// The files as the commits left them so far, taken one after the other by their numbers. Beside branches this is not
/// the tree of any commit, but near enough: it only says what a content may build on.
class Walk {
public:
    Walk(common::RootPath const& root, Tree files)
        : files_(std::move(files))
        , storage_(
              root, {[this](OdString const& path) { return previousUrl(path); },
                     {},
                     [this](OdString const& path) { return similarFiles(files_, path); }})
    {
    }

    /// False after an error.
    bool apply(std::vector<FileRecord> const& changes, TurnedOver& result)
    {
        renamed_.clear();
        for (FileRecord const& change : changes) {
            if (!change.previousPath.isEmpty()) {
                renamed_[change.path] = change.previousPath;
            }
        }
        for (FileRecord const& change : changes) {
            if (!change.url.isEmpty() && !turnOver(change, result)) {
                return false;
            }
        }
        for (FileRecord const& change : changes) {
            if (change.url.isEmpty()) {
                files_.erase(change.path);
            }
        }
        return true;
    }

    WriteOutcome flush() { return storage_.flush(); }

private:
    bool turnOver(FileRecord const& change, TurnedOver& result)
    {
        auto const freed = storage_.turnOver(change.url, change.path);
        if (!freed.hasValue()) {
            result.error = freed.error();
            return false;
        }
        result.freed += freed.value();
        files_[change.path] = change.url;
        return true;
    }

    OdString previousUrl(OdString const& path) const
    {
        auto const renamed = renamed_.find(path);
        auto const file = files_.find(renamed == renamed_.end() ? path : renamed->second);
        return file == files_.end() ? OdString() : file->second;
    }

    Tree files_;
    std::map<OdString, OdString> renamed_; // by the commit, to the former path
    LocalStorage storage_;
};

Tree filesAt(std::int64_t number, CommitTables const& commits)
{
    std::optional<CommitRecord> const commit = commits.find(number);
    return commit ? commits.files(commit->hash) : Tree();
}

} // namespace

TurnedOver turnOverObjects(common::RootPath const& root, LocalDatabase& database)
{
    TurnedOver result;
    std::int64_t const first = database.turnedOver();
    std::vector<CommitRecord> const commits = database.commits().after(first);
    if (commits.empty()) {
        return result;
    }
    Walk walk(root, filesAt(first, database.commits()));
    Progress progress("commits", commits.size());
    for (CommitRecord const& commit : commits) {
        if (!walk.apply(database.commits().changes(commit.hash), result)) {
            break;
        }
        progress.advance();
    }
    WriteOutcome const flushed = walk.flush();
    if (!result.error && !flushed.hasValue()) {
        result.error = flushed.error();
    }
    if (!result.error) {
        database.setTurnedOver(commits.back().number);
    }
    return result;
}

} // namespace tav
