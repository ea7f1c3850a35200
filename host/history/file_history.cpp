#include "host/history/file_history.h"

#include "host/history/ancestry.h"
#include "host/text/utf8.h"

#include <algorithm>
#include <functional>
#include <map>
#include <set>
#include <string>
#include <unordered_map>
#include <unordered_set>
#include <utility>

namespace tav {

namespace {

/// The changes of the paths that are followed. They are read when a path is first asked for.
class Changes {
public:
    explicit Changes(CommitTables const& commits) : commits_(commits) {}

    void readFile(std::string const& path)
    {
        if (byPath_.count(path) == 0) {
            byPath_[path]; // Of a path without changes too, so that nobody asks again.
            enter(commits_.changesOf(path));
        }
    }

    void readFolder(std::string const& folder) { enter(commits_.changesBelow(folder)); }

    /// In ascending order of commits.
    std::vector<PathChange> const& of(std::string const& path)
    {
        readFile(path);
        return byPath_.at(path);
    }

    std::set<std::string> const& pathsOf(std::int64_t commit) const
    {
        static std::set<std::string> const none;
        auto const found = byCommit_.find(commit);
        return found == byCommit_.end() ? none : found->second;
    }

    /// What the commit did to the path; null when nothing.
    PathChange const* find(std::int64_t commit, std::string const& path)
    {
        std::vector<PathChange> const& all = of(path);
        auto const isOlder = [](PathChange const& change, std::int64_t number) { return change.commit < number; };
        auto const found = std::lower_bound(all.begin(), all.end(), commit, isOlder);
        return found == all.end() || found->commit != commit ? nullptr : &*found;
    }

private:
    void enter(std::vector<PathChange> changes)
    {
        for (PathChange& change : changes) {
            std::set<std::string>& paths = byCommit_[change.commit];
            if (paths.insert(change.path).second) {
                byPath_[change.path].push_back(std::move(change));
            }
        }
    }

    CommitTables const& commits_;
    std::unordered_map<std::string, std::vector<PathChange>> byPath_;
    std::unordered_map<std::int64_t, std::set<std::string>> byCommit_;
};

/// What is followed at one commit.
struct Followed {
    std::set<std::string> files;
    std::vector<std::string> folders; ///< with a slash at the end; empty for the whole repository

    bool has(std::string const& path) const
    {
        auto const isInside = [&](std::string const& folder) { return path.compare(0, folder.size(), folder) == 0; };
        return files.count(path) > 0 || std::any_of(folders.begin(), folders.end(), isInside);
    }
};

class Walk {
public:
    Walk(CommitTables const& commits, std::vector<std::int64_t> const& starts)
        : commits_(commits)
        , ancestry_(commits)
        , changes_(commits)
    {
        std::int64_t commit = starts.empty() ? 0 : *std::max_element(starts.begin(), starts.end());
        for (; commit != 0; commit = ancestry_.firstParent(commit)) {
            mainLine_.insert(commit);
        }
    }

    std::vector<FileHistoryEntry> run(std::vector<std::int64_t> const& starts, std::vector<OdString> const& paths)
    {
        Followed const wanted = followed(paths);
        for (std::int64_t const start : starts) {
            waiting_[start] = wanted;
        }
        while (!waiting_.empty()) {
            auto next = waiting_.extract(waiting_.begin());
            visit(next.key(), std::move(next.mapped()));
        }
        return std::move(entries_);
    }

private:
    Followed followed(std::vector<OdString> const& paths)
    {
        Followed wanted;
        for (OdString const& path : paths) {
            std::string const bytes = path.ansi_str();
            wanted.files.insert(bytes);
            wanted.folders.push_back(bytes.empty() ? bytes : bytes + "/");
            changes_.readFolder(wanted.folders.back());
            changes_.readFile(bytes);
        }
        return wanted;
    }

    void visit(std::int64_t commit, Followed followed)
    {
        FileHistoryEntry entry{commit, {}};
        std::vector<PathChange> found;
        for (std::string const& path : changes_.pathsOf(commit)) {
            if (followed.has(path)) {
                found.push_back(*changes_.find(commit, path));
            }
        }
        for (PathChange const& change : found) {
            if (!isTaken(change)) {
                addEvent(change, followed, entry.events);
            }
        }
        if (!entry.events.empty()) {
            entries_.push_back(std::move(entry));
        }
        followFormerNames(found, followed);
        goOn(commit, std::move(followed), !found.empty());
    }

    void followFormerNames(std::vector<PathChange> const& found, Followed& followed)
    {
        for (PathChange const& change : found) {
            if (!change.previousPath.empty()) {
                followed.files.erase(change.path);
            }
        }
        for (PathChange const& change : found) {
            if (!change.previousPath.empty()) {
                changes_.readFile(change.previousPath);
                followed.files.insert(change.previousPath);
            }
        }
    }

    /// To the first parent, and from a merge that differs from it to the others too.
    void goOn(std::int64_t commit, Followed followed, bool isDifferent)
    {
        std::vector<std::int64_t> const& parents = ancestry_.parents(commit);
        for (std::size_t i = 1; isDifferent && i < parents.size(); ++i) {
            join(parents[i], followed);
        }
        if (!parents.empty()) {
            join(parents.front(), std::move(followed));
        }
    }

    void join(std::int64_t commit, Followed followed)
    {
        auto const [place, isNew] = waiting_.try_emplace(commit);
        if (isNew) {
            place->second = std::move(followed);
        } else {
            place->second.files.merge(followed.files); // The folders are the same everywhere.
        }
    }

    /// Whether a merge has the file as one of its other parents has it.
    bool isTaken(PathChange const& change)
    {
        std::vector<std::int64_t> const& parents = ancestry_.parents(change.commit);
        for (std::size_t i = 1; i < parents.size(); ++i) {
            if (urlAt(parents[i], change.path) == change.url) {
                return true;
            }
        }
        return false;
    }

    void addEvent(PathChange const& change, Followed const& followed, std::vector<FileEvent>& events)
    {
        if (!change.url.empty()) {
            bool const isChanged = urlAt(ancestry_.firstParent(change.commit), change.path) != "";
            events.push_back(eventOf(change, isChanged ? common::FileChange::modified : common::FileChange::added));
            return;
        }
        auto const renamed = commits_.renameFrom(change.commit, change.path);
        if (!renamed) {
            events.push_back(eventOf(change, common::FileChange::removed));
        } else if (!followed.has(renamed->path)) { // Else that is the event.
            events.push_back(eventOf(*renamed, common::FileChange::added));
        }
    }

    static FileEvent eventOf(PathChange const& change, common::FileChange kind)
    {
        return {fromUtf8(change.path), kind, fromUtf8(change.previousPath), fromUtf8(change.url)};
    }

    /// The content of the file at a commit, by its URL; empty when there is no such file.
    std::string urlAt(std::int64_t commit, std::string const& path)
    {
        std::vector<PathChange> const& changes = changes_.of(path);
        for (; commit != 0 && mainLine_.count(commit) == 0; commit = ancestry_.firstParent(commit)) {
            if (PathChange const* const change = changes_.find(commit, path)) {
                return change->url;
            }
        }
        // On the line that most commits are on, only those with changes have to be looked at.
        auto const isNewer = [](std::int64_t number, PathChange const& change) { return number < change.commit; };
        auto change = std::upper_bound(changes.begin(), changes.end(), commit, isNewer);
        while (change != changes.begin()) {
            --change;
            if (mainLine_.count(change->commit) > 0) {
                return change->url;
            }
        }
        return "";
    }

    CommitTables const& commits_;
    Ancestry ancestry_;
    Changes changes_;
    std::unordered_set<std::int64_t> mainLine_;
    std::map<std::int64_t, Followed, std::greater<>> waiting_;
    std::vector<FileHistoryEntry> entries_;
};

} // namespace

std::vector<FileHistoryEntry>
fileHistory(CommitTables const& commits, std::vector<std::int64_t> const& starts, std::vector<OdString> const& paths)
{
    return Walk(commits, starts).run(starts, paths);
}

} // namespace tav
