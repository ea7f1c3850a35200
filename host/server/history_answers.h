/// History as clients get it.
#pragma once

#include "host/server/history_store.h"

#include <cstddef>

namespace tav {

/// The text of a fetch document with all commits behind the number `known`, each with all its files. It is written
/// commit by commit: as values it would take many times the room.
OdString fetchAnswer(Repository const& repository, HistorySnapshot const& history, std::int64_t known);

/// The text of a history page: the commits behind the number `known`, in ascending order, as many as `mostChanges` lets
/// in and at least one; none when there are no more.
OdString historyPage(HistorySnapshot const& history, std::int64_t known, std::size_t mostChanges);

} // namespace tav
