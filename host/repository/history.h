/// The history that a working folder knows beside the one that its server keeps.
///
/// The server numbers commits without a gap. Known here is a part of them: all up to one number, which only learning
/// moves on, commit by commit, and perhaps some behind a gap, made here while others committed too or left by an older
/// version of tav. Which contents may go is decided when the two have been compared and nothing is unknown here.
#pragma once

#include "host/repository/server_of.h"

#include <cstddef>

namespace tav {

/// How the history that is known here differs from the server's. A commit under another number counts on both sides.
struct HistoryComparison {
    std::size_t unknownHere = 0;
    std::size_t unknownThere = 0;
};

HistoryComparison compareHistory(LocalDatabase const& database, Connection& connection);

/// Whether the server has the commit, known here or not.
bool isOnServer(OdString const& hash, Connection& connection);

/// How much of what is known here is looked up at the server before it is believed to have all of it.
enum class Compared {
    theEnd,    ///< the last commit before a gap, and those behind it: enough where nothing is removed
    everything ///< takes time for each commit
};

struct Learned {
    std::size_t commits = 0;
    std::size_t references = 0; ///< new or moved
};

/// Enters all commits of the server that are not known here, which closes gaps, and what its branches and tags name.
/// Throws `Failure` when the server lacks what is known here; nothing is entered then. After any other failure whole
/// commits have been entered, and the next call goes on behind them. The caller holds the lock of the repository.
Learned learnHistory(common::RootPath const& root, LocalDatabase& database, Connection& connection, Compared compared);

} // namespace tav
