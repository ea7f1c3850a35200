/// How the working folder differs from the last commit.
#pragma once

#include "host/database/commit_tables.h"

#include "common/mu_common_diff.h"
#include "common/mu_common_state.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace tav {

/// The files that the repository keeps. Throws `Failure` when the ignore rules cannot be used.
std::vector<common::File> scan(common::RootPath const& root);

/// A file of a commit, beside what lies in the working folder.
struct CommittedFile {
    OdString path;
    std::string url;        ///< as bytes
    bool isThere = false;   ///< the ignore rules may leave it out of the scan all the same
    std::uint64_t time = 0; ///< its modification time now
};

/// A commit beside the working folder; both lists are in the order of paths.
struct FolderMatch {
    std::vector<CommittedFile> committed;
    std::vector<common::File> untracked;
};

/// Finds out what there is of the files `committed`, and what else. Reads no file. Throws as `scan` does. Asks the disk
/// in two threads, where a second one is to be had.
FolderMatch matchFolder(common::RootPath const& root, FileList committed);

/// The same for files that are `scanned` already, but for the modification times.
FolderMatch matchPaths(common::RootPath const& root, std::vector<common::File> scanned, FileList committed);

/// Asks the disk for the modification times of a list of files, which takes longer than finding the files.
class TimeReading {
public:
    /// Enters the times into `files`. Both arguments live longer.
    TimeReading(std::vector<CommittedFile>& files, common::RootPath const& root) : files_(files), root_(root) {}

    /// Returns when no file is left to ask for. Threads that call this at the same time share the work.
    void run();

private:
    std::vector<CommittedFile>& files_;
    common::RootPath const& root_;
    std::atomic<std::size_t> next_{0};
};

/// Modification times of files that were read and found to be as the last commit has them, by path.
using VerifiedTimes = std::map<OdString, std::uint64_t>;

/// How the working folder differs from the commit. A file whose modification time is the one in the index is taken for
/// unchanged without being read; those that were read and are unchanged are added to `verified`, if it is given. All
/// lists of the result are in the order of paths.
common::RepoChanges
compare(common::RootPath const& root, FolderMatch match, common::State const& state, VerifiedTimes* verified = nullptr);

/// Leaves out the files that are unchanged by the index alone: `compare` would only list them.
void dropUntouched(FolderMatch& match, common::State const& state);

/// Enters the files that were read into the index, for a command that began at `start`.
void enterVerified(VerifiedTimes const& verified, std::uint64_t start, common::State& state);

/// Whether the working file `path` holds another content than the one stored at `url`. Reads the file.
bool hasOtherContent(OdString const& path, OdString const& url, common::RootPath const& root);

/// Files that the ignore rules keep out of the repository, hidden ones excepted, in scan order.
std::vector<OdString> ignoredFiles(common::RootPath const& root);

} // namespace tav
