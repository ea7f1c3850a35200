/// What a merge makes of each file, decided from the three values that it has. Looks at no disk and at no database.
#pragma once

#include "host/text/digest.h"

#include "platform/sdk/OdString.h"

#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace tav {

/// What one side has at a path. Contents are equal when their digests are: one content may have several URLs.
struct FileValue {
    OdString url; ///< empty when there is no file
    Digest digest{};

    explicit operator bool() const { return !url.isEmpty(); }
};

bool operator==(FileValue const& a, FileValue const& b);
inline bool operator!=(FileValue const& a, FileValue const& b)
{
    return !(a == b);
}

/// The three values of one path, each looked up in its commit (or in the working folder).
struct PathValues {
    FileValue base;
    FileValue mine;
    FileValue theirs;
};

struct MergeInput {
    /// Every path that either side changed, both names of renames included.
    std::map<OdString, PathValues> paths;
    std::map<OdString, OdString> myRenames;    ///< the new path by the path in base
    std::map<OdString, OdString> theirRenames; ///< the same
    /// Whether base has a file or folder of this path.
    std::function<bool(OdString const& path)> isInBase;
};

enum class MergeConflict : std::uint8_t {
    bothChanged,
    bothAdded,
    changedAndRemoved,
    twoNames,      ///< both renamed it, differently
    twoFiles,      ///< two files want one name
    fileAndFolder, ///< one wants to be a file where the other has a folder
    namesCollide,  ///< new names that differ only in letter case or Unicode form
};

/// The conflict in words, as part of a sentence: "both changed".
std::string nameOf(MergeConflict conflict);

/// One file, followed through renames. A path is empty where the side has no such file.
struct MergedFile {
    OdString basePath;
    OdString myPath;
    OdString theirPath;
    PathValues values;

    /// Where the file is after the merge, empty when it is gone; with a conflict what stays until it is settled, which
    /// is mine.
    OdString path;
    FileValue result;
    std::optional<MergeConflict> conflict;
};

/// The files that the merge changes in mine, and those with a conflict, in the order of the paths that they have in
/// mine, else in theirs. No two of them have one `path`, and none of the paths is a folder of another.
std::vector<MergedFile> mergeThreeWays(MergeInput const& input);

} // namespace tav
