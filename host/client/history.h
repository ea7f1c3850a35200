/// The history that a working folder knows, compared with the one that its server keeps.
///
/// The server numbers commits without a gap. A working folder knows a part of them: all up to one number, which only
/// fetching increases, and perhaps some after a gap, which were made here while others committed too, or left by an
/// older version of tav. Contents are removed only when both histories have been compared and no commit is unknown
/// here.
#pragma once

#include "host/client/connection.h"
#include "host/protocol/history_document.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

namespace tav {

/// How the history that is known here differs from the server's. A commit that has different numbers on the two sides
/// counts on both.
struct HistoryComparison {
    std::size_t unknownHere = 0;
    std::size_t unknownThere = 0;
};

HistoryComparison compareHistory(LocalDatabase const& database, Connection& connection);

/// Passes all commits of the server after the number `known` to `take`, in ascending order, page by page.
void forEachPageThere(
    Connection& connection, std::int64_t known, std::function<void(std::vector<ChangedCommit> const&)> const& take);

/// The branches and tags of the server.
std::vector<common::Reference> referencesThere(Connection& connection);

/// Whether the server is there and has a branch or tag of that name.
bool isNamedThere(OdString const& name, LocalDatabase const& database);

/// Whether the server has the commit, known here or not.
bool isOnServer(OdString const& hash, Connection& connection);

/// The commits that are known here and that the server does not have under any number, in the order of their numbers.
std::vector<OdString> missingThere(LocalDatabase const& database, Connection& connection);

/// How much of the known history is looked up on the server before the server is considered to have all of it.
enum class Compared {
    theEnd,    ///< the last commit before a gap, and those after it: enough if nothing is removed
    everything ///< takes time for each commit
};

struct Fetched {
    std::size_t commits = 0;
    std::size_t references = 0; ///< new or moved
};

/// Enters all commits of the server that are not known here, which closes gaps, and its branches and tags. Throws
/// `Failure` when the server lacks a known commit; nothing is entered then. After any other failure, some commits have
/// been entered completely, and the next call continues after them. The caller holds the lock of the repository.
Fetched fetchHistory(common::RootPath const& root, LocalDatabase& database, Connection& connection, Compared compared);

/// Replaces the known history by that of the server, in one transaction. The server must have every known commit, under
/// any number.
void replaceHistory(common::RootPath const& root, LocalDatabase& database, Connection& connection);

} // namespace tav
