/// How the working folder differs from the last commit.
#pragma once

#include "host/changes/folder_view.h"
#include "host/history/commit_tables.h"
#include "host/repository/local_database.h"

#include "common/mu_common_diff.h"
#include "common/mu_common_state.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace tav {

/// The files that the repository keeps. Throws `Failure` when the ignore rules cannot be used.
std::vector<common::File> scan(common::RootPath const& root);

/// A file of a commit, beside what there is of it in the working folder.
struct CommittedFile {
    OdString path;
    std::string url; ///< as bytes
    Sight sight = {};
    bool isKnown = false; ///< to hold the content of the commit
};

/// A commit beside the working folder; both lists are in the order of paths.
struct FolderMatch {
    std::vector<CommittedFile> committed;
    std::vector<common::File> untracked;
};

/// Finds out what there is of the files `committed`, which of them are `known`, and what else there is. Reads no file.
/// Throws as `scan` does. Asks the disk in two threads, where a second one is to be had.
FolderMatch matchFolder(common::RootPath const& root, FileList committed, VerifiedFileList const& known);

/// The same for files that are `scanned` already, without looking at the committed ones.
FolderMatch matchPaths(std::vector<common::File> scanned, FileList committed);

/// Looks at each of a list of files, which takes longer than finding the files.
class Examination {
public:
    /// Enters what is seen into `files`. The arguments live longer.
    Examination(std::vector<CommittedFile>& files, VerifiedFileList const& known, common::RootPath const& root)
        : files_(files)
        , known_(known)
        , root_(root)
    {
    }

    /// Returns when no file is left to look at. Threads that call this at the same time share the work.
    void run();

private:
    std::vector<CommittedFile>& files_;
    VerifiedFileList const& known_;
    common::RootPath const& root_;
    std::atomic<std::size_t> next_{0};
};

/// How the working folder differs from a commit. All lists are in the order of paths.
struct FolderChanges : common::RepoChanges {
    /// Files of the commit in folders that links have replaced. A link may lead anywhere, and no scan enters it: what
    /// is behind it is not read, and is not taken for removed.
    std::vector<common::VersionedFile> unreachable;
};

/// How the working folder differs from the commit. A file that is known is not read; those that were read and are
/// unchanged are added to `verified`, if it is given.
FolderChanges compare(common::RootPath const& root, FolderMatch match, VerifiedFileList* verified = nullptr);

/// Leaves out the files that are known to be unchanged: `compare` would only list them.
void dropKnown(FolderMatch& match);

/// Enters files that are as the last commit has them into the index, for a command that began at `start`.
void enterVerified(VerifiedFileList const& verified, std::uint64_t start, common::State& state);

/// Records what is known of files, as far as that can be done: without a record they are read again.
void keepVerified(VerifiedFileList const& verified, LocalDatabase& database);

/// Whether the working file `path` holds another content than the one stored at `url`. Reads the file.
bool hasOtherContent(OdString const& path, OdString const& url, common::RootPath const& root);

/// Files that the ignore rules keep out of the repository, hidden ones excepted, in scan order.
std::vector<OdString> ignoredFiles(common::RootPath const& root);

} // namespace tav
