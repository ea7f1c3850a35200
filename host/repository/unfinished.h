/// Work that a command has begun, noted where the next command finds it.
#pragma once

#include "host/repository/local_database.h"

#include "common/mu_common_state.h"

#include <map>
#include <optional>
#include <variant>
#include <vector>

namespace tav {

/// A content that a commit brings.
struct NewContent {
    OdString url;
    OdString digest;
    std::uint64_t size = 0;
};

/// A commit whose contents are all stored. Sending the document again does no harm: the server knows a commit by its
/// hash.
struct CommitUnderWay {
    OdString document;
    std::vector<NewContent> contents;
    std::map<OdString, std::optional<common::IndexData>> files; ///< what it takes; none: a file that it removes
};

/// A working folder that is being made to hold another commit.
struct MoveUnderWay {
    OdString target;                  ///< hash of the commit
    OdString branch;                  ///< where HEAD points to afterwards
    bool isWritten;                   ///< whether all files are there already
    std::vector<OdString> begun = {}; ///< targets of moves that were interrupted before this one, and not completed
};

using Unfinished = std::variant<std::monostate, CommitUnderWay, MoveUnderWay>;

/// Throws `Failure` when the note cannot be read.
Unfinished unfinishedOf(LocalDatabase const& database);

/// Notes what has begun; on its own, or as a part of a `Change` of the caller.
void note(Unfinished const& work, LocalDatabase& database);

} // namespace tav
