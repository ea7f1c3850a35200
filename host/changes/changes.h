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
#include <set>
#include <string>
#include <vector>

namespace tav {

/// Folders relative to the working folder, which is the empty path.
using Folders = std::set<OdString>;

/// Whether `path` is below one of `folders`.
bool isBelow(Folders const& folders, OdString const& path);

/// What a scan has found.
struct Scanned {
    std::vector<common::File> files; ///< those that the repository keeps
    Folders unreadable;              ///< the folders whose files are not known
};

/// Throws `Failure` when the ignore rules cannot be used.
Scanned scan(common::RootPath const& root);

/// A file of a commit, and what is known of the working file at the same path.
struct CommittedFile {
    OdString path;
    std::string url; ///< as bytes
    Sight sight = {};
    bool isKnown = false; ///< whether the working file is known to have the content of the commit
};

/// A commit compared with the working folder by path; both lists are in the order of paths.
struct FolderMatch {
    std::vector<CommittedFile> committed;
    std::vector<common::File> untracked;
    Folders unreadable; ///< the folders whose files are not known
};

/// Finds out which of the files `committed` are in the working folder, which of them are `known`, and which other files
/// there are. Reads no file. Throws as `scan` does. Queries the disk in two threads if a second one can be started.
FolderMatch matchFolder(common::RootPath const& root, FileList committed, VerifiedFileList const& known);

/// The same for files that have been `scanned` already; does not examine the committed ones.
FolderMatch matchPaths(Scanned scanned, FileList committed);

/// Examines each file of a list, which takes longer than finding the files.
class Examination {
public:
    /// Enters the results into `files`. The arguments must outlive this object.
    Examination(std::vector<CommittedFile>& files, VerifiedFileList const& known, common::RootPath const& root)
        : files_(files)
        , known_(known)
        , root_(root)
    {
    }

    /// Returns when no file is left to examine. Threads that call this at the same time share the work.
    void run();

private:
    std::vector<CommittedFile>& files_;
    VerifiedFileList const& known_;
    common::RootPath const& root_;
    std::atomic<std::size_t> next_{0};
};

/// How the working folder differs from a commit. All lists are in the order of paths.
struct FolderChanges : common::RepoChanges {
    /// Files of the commit in folders that links have replaced. A link may lead anywhere, so a scan does not follow it:
    /// files behind it are neither read nor treated as removed.
    std::vector<common::VersionedFile> unreachable;
    /// Files of the commit that cannot be examined, or are missing in a folder that cannot be read. They do not count
    /// as removed either.
    std::vector<common::VersionedFile> unread;
    Folders unreadable; ///< the folders of these files, and all others that cannot be read
};

/// Whether a file is one of the `unread`.
bool isUnread(Presence presence, OdString const& path, Folders const& unreadable);

/// How the working folder differs from the commit. A file that is known is not read. Files that were read and are
/// unchanged are added to `verified`, unless it is null.
FolderChanges compare(common::RootPath const& root, FolderMatch match, VerifiedFileList* verified = nullptr);

/// Leaves out the files that are known to be unchanged: `compare` would only list them.
void dropKnown(FolderMatch& match);

/// Enters files that match the last commit into the index, for a command that began at `start`.
void enterVerified(VerifiedFileList const& verified, std::uint64_t start, common::State& state);

/// Records what is known of files. A failure is ignored: files without a record are read again.
void keepVerified(VerifiedFileList const& verified, LocalDatabase& database);

/// Whether the content of the working file `path` differs from the one stored at `url`. Reads the file.
bool hasOtherContent(OdString const& path, OdString const& url, common::RootPath const& root);

/// Files that the ignore rules keep out of the repository, except hidden ones, in scan order.
std::vector<OdString> ignoredFiles(common::RootPath const& root);

} // namespace tav
