/// The history that a working folder knows beside the one that its server keeps.
///
/// The server numbers commits without a gap. Known here is a part of them: all up to one number, which only learning
/// moves on, commit by commit, and perhaps some behind a gap, made here while others committed too or left by an older
/// version of tav. Which contents may go is decided when the two have been compared and nothing is unknown here.
#pragma once

#include "host/client/connection.h"
#include "host/protocol/history_document.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <vector>

namespace tav {

/// How the history that is known here differs from the server's. A commit under another number counts on both sides.
struct HistoryComparison {
    std::size_t unknownHere = 0;
    std::size_t unknownThere = 0;
};

HistoryComparison compareHistory(LocalDatabase const& database, Connection& connection);

/// Gives all commits that the server has behind the number `known` to `take`, in ascending order, page by page.
void forEachPageThere(
    Connection& connection, std::int64_t known, std::function<void(std::vector<ChangedCommit> const&)> const& take);

/// What the branches and tags of the server name.
std::vector<common::Reference> referencesThere(Connection& connection);

/// Whether the server has the commit, known here or not.
bool isOnServer(OdString const& hash, Connection& connection);

/// The commits that are known here and not there under any number, in the order of their numbers.
std::vector<OdString> missingThere(LocalDatabase const& database, Connection& connection);

/// How much of what is known here is looked up at the server before it is believed to have all of it.
enum class Compared {
    theEnd,    ///< the last commit before a gap, and those behind it: enough where nothing is removed
    everything ///< takes time for each commit
};

struct Fetched {
    std::size_t commits = 0;
    std::size_t references = 0; ///< new or moved
};

/// Enters all commits of the server that are not known here, which closes gaps, and what its branches and tags name.
/// Throws `Failure` when the server lacks what is known here; nothing is entered then. After any other failure whole
/// commits have been entered, and the next call goes on behind them. The caller holds the lock of the repository.
Fetched fetchHistory(common::RootPath const& root, LocalDatabase& database, Connection& connection, Compared compared);

/// Puts the history of the server in the place of the one that is known here, in one change. The server has all that is
/// known here, under whatever numbers.
void replaceHistory(common::RootPath const& root, LocalDatabase& database, Connection& connection);

} // namespace tav
