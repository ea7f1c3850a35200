/// Making the working folder hold the files of a commit.
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
    Tree writes;   ///< files that get another content
    Tree removals; ///< files that are in no later commit, with the content that they have been committed with
    /// Those of them that only interrupted moves may have touched: what is unsaved there stays.
    std::set<OdString> leftovers;
    /// URLs of the contents that files have there unless somebody has changed them.
    std::multimap<OdString, OdString> expected;
    /// Files that were found as wanted, once that has been checked.
    Tree found;
    /// What stood at each of the paths when it was checked.
    std::map<OdString, os::FileMark> marks;
};

/// What turns the files `from` into the files `to`. Files that differ only in `begun`, the files of interrupted moves
/// to elsewhere, may be there by now: they go too.
TreeUpdate updateBetween(Tree const& from, std::vector<Tree> const& begun, Tree const& to);

/// Which uncommitted work an update may discard: none, contents that some commit has, wherever, or all of it.
enum class Discard { nothing, copies, everything };

/// Checks that an update can be carried out, before a byte is written: no path leads out of the working folder or
/// through a link, no file takes the place of a folder that has other files, and no work is lost unless `discard` says
/// so. Work is a file with another content than an expected one, and whatever is at the paths `staged`: being in some
/// commit, or in the one that is to be written, does not make a choice unimportant. Only where `discard` is not
/// `nothing`, and so nothing is unstaged, a staged file may be as wanted already. The files are read: what an index
/// says of them does not justify overwriting them. Files that are as wanted are taken out of the update. Committed
/// contents that go can be read from `storage` afterwards: they are read there, and stored again from the files where
/// that is needed. Throws `Failure`, which lists the files in the way.
void checkUpdate(
    common::RootPath const& root, LocalDatabase const& database, LocalStorage& storage,
    std::set<OdString> const& staged, Discard discard, TreeUpdate& update);

/// What an update has brought about.
struct Updated {
    /// Modification times of the files that were written, by path. As far as the file system tells them apart, no two
    /// are equal: a file that is moved over another of them shows.
    std::map<OdString, std::uint64_t> times;
    /// What may be recorded of the files that are as wanted now.
    VerifiedFileList verified;
};

/// Carries out an update that has been checked. Every file is whole before it takes its name, and when this returns all
/// of it is safe on the disk. Folders that become empty are removed. `begin` is called when all contents lie ready and
/// the working folder is still what it was. A file that somebody has changed since it was checked stays as it is, and
/// ends it. Throws `Failure`; what was written until then stays, and doing the same again completes it. The caller
/// holds the lock of the repository since `start`.
Updated carryOut(
    common::RootPath const& root, LocalStorage& storage, TreeUpdate const& update, std::uint64_t start,
    std::function<void()> const& begin = [] {});

/// Writes the content of `file` to the path `target`. Throws `Failure`, whose advice tells damage from a full disk.
void extract(LocalStorage& storage, Tree::value_type const& file, std::string const& target);

} // namespace tav
