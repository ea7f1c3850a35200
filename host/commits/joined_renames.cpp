#include "host/commits/joined_renames.h"

#include <set>

namespace tav {

namespace {

using Previous = std::map<OdString, OdString>;

Previous renamesOf(CommitRecord const& commit, CommitTables const& commits)
{
    Previous renames;
    for (FileRecord const& change : commits.changes(commit.hash)) {
        if (!change.previousPath.isEmpty()) {
            renames.emplace(change.path, change.previousPath);
        }
    }
    return renames;
}

std::set<OdString> pathsLeft(Previous const& renames)
{
    std::set<OdString> left;
    for (auto const& [path, previous] : renames) {
        left.insert(previous);
    }
    return left;
}

OdString const& former(OdString const& path, Previous const& renames)
{
    auto const rename = renames.find(path);
    return rename == renames.end() ? path : rename->second;
}

} // namespace

std::map<OdString, OdString> joinedRenames(
    std::map<OdString, OdString> const& since, Tree const& files, CommitTables const& commits,
    CommitRecord const& replaced)
{
    Tree const before = replaced.parents.empty() ? Tree() : commits.files(replaced.parents.front());
    Previous const first = renamesOf(replaced, commits);
    std::set<OdString> const left = pathsLeft(since);
    Previous joined;
    for (auto const& [path, url] : files) {
        bool const isAnother = since.count(path) == 0 && left.count(path) > 0; // at a path that has become free
        OdString const& origin = former(former(path, since), first);
        if (!isAnother && origin != path && before.count(origin) > 0) {
            joined.emplace(path, origin);
        }
    }
    return joined;
}

} // namespace tav
