/// What a command has changed, as the log of operations keeps it.
#pragma once

#include "host/repository/staging_change.h"
#include "host/text/digest.h"

#include <cstdint>
#include <map>
#include <optional>
#include <variant>
#include <vector>

namespace tav {

/// Where a working folder stands: on which commit, by its hash, and on which branch.
struct Position {
    OdString commit;
    OdString branch;
};

/// A file that an operation changes: URLs of its contents. Empty: no file.
struct FileContents {
    OdString path;
    OdString before;
    OdString after;
    std::uint32_t permissions = 0; ///< that the file had before it was removed; 0: those of every new file
};

/// The numbers stand in databases.
enum class Kind {
    commit = 0, ///< a commit was made; the branch went to it
    move = 1,   ///< the working folder went to another commit; `files` are those that were not as a commit has them
    files = 2,  ///< files, what is staged, or both
    rename = 3  ///< a file or folder has a new name
};

/// The numbers stand in databases. Only commits and moves are ever under way: the others are seen from what there is.
enum class Phase {
    running = 0,
    done = 1,
    undoing = 2,
    undone = 3,
    redoing = 4,
    superseded = 5 ///< was undone when another operation followed
};

/// A command that has changed something, with all that it takes to take that back and to do it again. What was staged,
/// and each file, is as before or as after it, whenever a crash comes.
struct Operation {
    std::int64_t id = 0;
    Kind kind = Kind::files;
    OdString command;      ///< for people; empty when an earlier version of tav has begun it: it cannot be undone
    std::int64_t date = 0; ///< seconds since 1970-01-01T00:00:00Z
    Phase phase = Phase::done;
    Position before;
    Position after;
    StagingChange staging;
    std::vector<FileContents> files;
    OdString movedFrom; ///< of the kind `rename`: a path in the working folder
    OdString movedTo;
};

/// A content that a commit adds.
struct NewContent {
    OdString url;
    Digest digest{};
    std::uint64_t size = 0;
};

/// Index records of files, by path, that become valid when the operation ends: these files then match the current
/// commit. None: the commit has no such file, or its time is not known.
using IndexUpdates = std::map<OdString, std::optional<common::IndexData>>;

/// A commit whose contents are all stored. Sending the document again is harmless: the server recognises a commit by
/// its hash.
struct PendingCommit {
    OdString document;
    std::vector<NewContent> contents;
    IndexUpdates files; ///< those that it adds or changes and those that it removes
};

/// A checkout of another commit.
struct PendingCheckout {
    OdString target;                  ///< hash of the commit
    OdString branch;                  ///< where HEAD points to afterwards
    bool isWritten;                   ///< whether all files are there already
    std::vector<OdString> begun = {}; ///< targets of checkouts that were interrupted before this one, and not completed
    IndexUpdates files = {};          ///< those that it has written and removed, once that is done
};

/// `std::monostate`: no operation is pending.
using PendingOperation = std::variant<std::monostate, PendingCommit, PendingCheckout>;

} // namespace tav
