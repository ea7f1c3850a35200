/// Making the working folder hold the files of a commit.
#pragma once

#include "host/repository/local_database.h"
#include "host/storage/local_storage.h"

#include <cstdint>

namespace tav {

/// What has to happen to the working folder.
struct TreeUpdate {
    Tree writes;   ///< files that get another content
    Tree removals; ///< files that are in no later commit, with the content that they have been committed with
};

/// What turns the files `from` into the files `to`.
TreeUpdate updateBetween(Tree const& from, Tree const& to);

/// Whether content that is in no commit may be lost.
enum class Unsaved { isKept, mayGo };

/// Checks that an update can be carried out, before a byte is written: no path leads out of the working folder or
/// through a link, and, unless `unsaved` lets them go, no file holds a content that is in no commit. `from` are the
/// files of the commit that the working folder stands on. Files that are as they shall be are taken out of the update.
/// Throws `Failure`, which lists the files in the way.
void checkUpdate(
    common::RootPath const& root, LocalDatabase const& database, Tree const& from, Unsaved unsaved, TreeUpdate& update);

/// Modification times of the files that were written, by path.
using WrittenTimes = std::map<OdString, std::uint64_t>;

/// Carries out an update that has been checked. Every file is whole before it takes its name, and when this returns all
/// of it is safe on the disk. Folders that become empty are removed. Throws `Failure`; what was written until then
/// stays, and doing the same again completes it. The caller holds the lock of the repository since `start`.
WrittenTimes
carryOut(common::RootPath const& root, LocalStorage& storage, TreeUpdate const& update, std::uint64_t start);

} // namespace tav
