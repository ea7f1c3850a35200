#include "host/commits/opposite.h"

#include "host/errors/failure.h"
#include "host/storage/storage_url.h"

#include <algorithm>
#include <string>

namespace tav {

namespace {

OdString urlIn(Tree const& files, OdString const& path)
{
    auto const file = files.find(path);
    return file == files.end() ? OdString() : file->second;
}

bool isSameContent(OdString const& a, OdString const& b)
{
    return a.isEmpty() || b.isEmpty() ? a.isEmpty() == b.isEmpty() : digestOf(a) == digestOf(b);
}

void requireAsLeft(CommitRecord const& commit, std::vector<FileRecord> const& changes, Tree const& current)
{
    std::vector<std::string> others;
    for (FileRecord const& change : changes) {
        if (!isSameContent(urlIn(current, change.path), change.url)) {
            others.push_back(change.path.ansi_str());
        }
    }
    if (!others.empty()) {
        Failure failure(
            "These files are not as commit " + std::to_string(commit.number) + " left them.",
            "Nothing has changed; bring back single files with 'tav restore NAME --from COMMIT', and commit that:");
        failure.details = std::move(others);
        throw failure;
    }
}

/// A file that took the place of another one was not renamed back by moving it.
std::map<OdString, OdString>
renamesBack(std::vector<FileRecord> const& changes, Tree const& before, Tree const& current)
{
    std::map<OdString, OdString> renames;
    for (FileRecord const& change : changes) {
        OdString const& previous = change.previousPath;
        if (!previous.isEmpty() && before.count(change.path) == 0 && current.count(previous) == 0) {
            renames.emplace(previous, change.path);
        }
    }
    return renames;
}

common::FileChange changeTo(OdString const& wanted, OdString const& present)
{
    return wanted.isEmpty()    ? common::FileChange::removed
           : present.isEmpty() ? common::FileChange::added
                               : common::FileChange::modified;
}

} // namespace

std::set<OdString> Opposite::paths() const
{
    std::set<OdString> paths;
    for (Tree const* const files : {&writes, &removals}) {
        for (auto const& [path, url] : *files) {
            paths.insert(path);
        }
    }
    return paths;
}

Opposite oppositeOf(CommitRecord const& commit, CommitTables const& commits, Tree const& current)
{
    if (commit.parents.size() > 1) {
        throw Failure(
            "Commit " + std::to_string(commit.number) + " joins two lines of history, and has no opposite.",
            "Bring back single files with 'tav restore NAME --from COMMIT'.");
    }
    std::vector<FileRecord> const changes = commits.changes(commit.hash);
    requireAsLeft(commit, changes, current);
    Tree const before = commit.parents.empty() ? Tree() : commits.files(commit.parents.front());
    Opposite opposite;
    opposite.renames = renamesBack(changes, before, current);
    std::set<OdString> left; // by renaming, which says that they go
    for (auto const& [path, previous] : opposite.renames) {
        left.insert(previous);
    }
    for (FileRecord const& change : changes) {
        OdString const wanted = urlIn(before, change.path);
        OdString const present = urlIn(current, change.path);
        (wanted.isEmpty() ? opposite.removals : opposite.writes)
            .emplace(change.path, wanted.isEmpty() ? present : wanted);
        if (!present.isEmpty()) {
            opposite.expected.emplace(change.path, present);
        }
        if (left.count(change.path) == 0) {
            opposite.staged.emplace_back(change.path, changeTo(wanted, present));
        }
    }
    return opposite;
}

} // namespace tav
