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

/// What the state shall know of files, by path: they are as the last commit has them. None: it has no such file, or its
/// time is not known.
using SettledFiles = std::map<OdString, std::optional<common::IndexData>>;

/// A commit whose contents are all stored. Sending the document again does no harm: the server knows a commit by its
/// hash.
struct CommitUnderWay {
    OdString document;
    std::vector<NewContent> contents;
    SettledFiles files; ///< what it takes and what it removes
};

/// A working folder that is being made to hold another commit.
struct CheckoutUnderWay {
    OdString target;                  ///< hash of the commit
    OdString branch;                  ///< where HEAD points to afterwards
    bool isWritten;                   ///< whether all files are there already
    std::vector<OdString> begun = {}; ///< targets of moves that were interrupted before this one, and not completed
    SettledFiles files = {};          ///< what it has written and removed, once that is done
};

using Unfinished = std::variant<std::monostate, CommitUnderWay, CheckoutUnderWay>;

/// Throws `Failure` when the note cannot be read.
Unfinished unfinishedOf(LocalDatabase const& database);

/// Takes the files out of what is staged, and enters their index records.
void settle(SettledFiles const& files, common::State& state);

/// Notes what has begun; on its own, or as a part of a `Change` of the caller.
void note(Unfinished const& work, LocalDatabase& database);

} // namespace tav
