#include "host/merge/three_way.h"

#include "host/merge/paired_files.h"
#include "host/merge/places.h"

#include <algorithm>
#include <utility>

namespace tav {

namespace {

bool isRenamed(OdString const& basePath, OdString const& path)
{
    return !path.isEmpty() && path != basePath;
}

/// What is kept when one side has removed the file: nothing, unless the other one has worked on it.
void settleRemoval(MergedFile& file, FileValue const& kept, OdString const& keptPath)
{
    file.result = file.values.mine;
    if (kept != file.values.base || isRenamed(file.basePath, keptPath)) {
        file.conflict = MergeConflict::changedAndRemoved;
    } else {
        file.result = {};
    }
}

void settleContent(MergedFile& file)
{
    auto const& [base, mine, theirs] = file.values;
    if (!mine && !theirs) {
        file.result = {};
    } else if (base && !mine) {
        settleRemoval(file, theirs, file.theirPath);
    } else if (base && !theirs) {
        settleRemoval(file, mine, file.myPath);
    } else if (mine == theirs || theirs == base) {
        file.result = mine;
    } else if (mine == base) {
        file.result = theirs;
    } else {
        file.result = mine;
        file.conflict = base ? MergeConflict::bothChanged : MergeConflict::bothAdded;
    }
}

/// The name that the file has in the result: the new one, if one side has renamed it.
OdString settlePath(MergedFile& file)
{
    if (!file.result && !file.conflict) {
        return {};
    }
    if (file.conflict || file.theirPath.isEmpty() || file.myPath == file.theirPath) {
        return file.myPath;
    }
    if (file.myPath.isEmpty() || file.myPath == file.basePath) {
        return file.theirPath;
    }
    if (file.theirPath != file.basePath) {
        file.conflict = MergeConflict::twoNames;
        file.result = file.values.mine;
    }
    return file.myPath;
}

bool isAsMine(MergedFile const& file)
{
    return !file.conflict && file.path == file.myPath && file.result == file.values.mine;
}

OdString const& orderOf(MergedFile const& file)
{
    return file.myPath.isEmpty() ? file.theirPath : file.myPath;
}

} // namespace

bool operator==(FileValue const& a, FileValue const& b)
{
    return static_cast<bool>(a) == static_cast<bool>(b) && (!a || a.digest == b.digest);
}

std::string nameOf(MergeConflict conflict)
{
    switch (conflict) {
    case MergeConflict::bothChanged: return "both changed";
    case MergeConflict::bothAdded: return "both added";
    case MergeConflict::changedAndRemoved: return "changed and removed";
    case MergeConflict::twoNames: return "two names";
    case MergeConflict::twoFiles: return "two files";
    case MergeConflict::fileAndFolder: return "file and folder";
    case MergeConflict::namesCollide: return "names that collide";
    }
    return {};
}

std::vector<MergedFile> mergeThreeWays(MergeInput const& input)
{
    std::vector<MergedFile> files = pairedFiles(input);
    for (MergedFile& file : files) {
        settleContent(file);
        file.path = settlePath(file);
    }
    givePlaces(files, input.isInBase);
    files.erase(std::remove_if(files.begin(), files.end(), isAsMine), files.end());
    std::stable_sort(
        files.begin(), files.end(), [](MergedFile const& a, MergedFile const& b) { return orderOf(a) < orderOf(b); });
    return files;
}

} // namespace tav
