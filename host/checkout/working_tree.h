/// Writing files of a commit into the working folder: the check, and the update that puts each file in its place.
#pragma once

#include "host/repository/local_database.h"
#include "host/storage/local_storage.h"

#include "platform/os/os_batch.h"

#include <cstdint>
#include <functional>
#include <map>
#include <set>
#include <vector>

namespace tav {

/// What has to happen to the working folder.
struct TreeUpdate {
    Tree writes;   ///< files that get a different content
    Tree removals; ///< files to remove, with the content that they were committed with
    /// Those of them that only interrupted checkouts may have written: uncommitted work there is kept.
    std::set<OdString> leftovers;
    /// URLs of the contents that files at these paths have unless they were changed.
    std::multimap<OdString, OdString> expected;
    /// Files that `checkUpdate` found to have the wanted content already.
    Tree found;
    /// What was at each of the paths when it was checked.
    std::map<OdString, os::FileMark> marks;
    /// Contents found there that are not expected, as they can be read from the storage.
    Tree others;
    /// Paths at which a content is expected, and no file was found.
    std::set<OdString> missing;
    /// Permissions of files that come back, where they are not those of every new file.
    std::map<OdString, std::uint32_t> permissions;
};

/// The update that turns the files `from` into the files `to`. The files in which a tree of `begun`, the targets of
/// interrupted checkouts, differs from `to` may exist by now: they are written or removed too.
TreeUpdate updateBetween(Tree const& from, std::vector<Tree> const& begun, Tree const& to);

/// Which uncommitted work an update may discard: none, contents that any commit has, or all of it.
enum class Discard { nothing, copies, everything };

/// Checks, before anything is written, that an update can be carried out: no path leads out of the working folder or
/// through a link, no file replaces a folder that has other files, the contents to be written are here, and no work is
/// lost unless `discard` allows it. Work is a file whose content is not an expected one, and whatever is at the paths
/// `staged`, even when a commit, or the one to be written, has that content: staging it was a choice. Only where
/// `discard` is not `nothing`, and so nothing is unstaged, may a staged file have the wanted content already. The files
/// are read: an index record does not justify overwriting them. Files that have the wanted content already are taken
/// out of the update. All contents that will be overwritten or removed, discarded ones included, can be read from
/// `storage` afterwards: they are read there, and stored from the files if necessary. Throws `Failure`, which lists the
/// files in the way.
void checkUpdate(
    common::RootPath const& root, LocalDatabase const& database, LocalStorage& storage,
    std::set<OdString> const& staged, Discard discard, TreeUpdate& update);

/// The same without storing anything, for a command that only shows what it would do. Returns the files whose contents
/// are in no commit and would be overwritten.
std::vector<OdString> planUpdate(
    common::RootPath const& root, LocalDatabase const& database, LocalStorage& storage,
    std::set<OdString> const& staged, Discard discard, TreeUpdate& update);

/// The files of a checked update whose unexpected contents will be overwritten, for the log of an operation that goes
/// to the side `to`: their present contents are those of the other side.
std::vector<FileContents> discardedFiles(TreeUpdate const& update, Side to);
/// Adds the permissions of files that undoing an operation writes again.
void addPermissions(std::vector<FileContents> const& files, TreeUpdate& update);
std::vector<OdString> pathsOf(std::vector<FileContents> const& files);

/// The result of an update.
struct Updated {
    /// Modification times of the files that were written, by path. No two are equal, as far as the file system can
    /// distinguish them, so a file that replaces another one of them is noticed.
    std::map<OdString, std::uint64_t> times;
    /// What may be recorded of the files that now have the wanted content.
    VerifiedFileList verified;
};

/// Carries out an update that has been checked. Every file is complete before it is renamed into place, and when this
/// returns all of them are safe on the disk. Folders that become empty are removed. `begin` is called when all contents
/// are ready and the working folder is still unchanged, and `changed` when each file has been written or removed, and
/// in the end: a failure before its first call leaves the working folder unchanged. A file that was changed after the
/// check is left as it is, and ends the update. Throws `Failure`; what was written until then remains, and repeating
/// the update completes it. The caller has held the lock of the repository since `start`.
Updated carryOut(
    common::RootPath const& root, LocalStorage& storage, TreeUpdate const& update, std::uint64_t start,
    std::function<void()> const& begin = [] {}, std::function<void()> const& changed = [] {});

/// Writes the content of `file` to the path `target`. Throws `Failure`, whose next step depends on whether the content
/// is damaged or the disk is full.
void extract(LocalStorage& storage, Tree::value_type const& file, std::string const& target);

} // namespace tav
