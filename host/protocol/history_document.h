/// The history as changes, in pages: what the server sends, and what a client reads of it.
#pragma once

#include "host/history/commit_tables.h"

#include <vector>

namespace tav {

/// A commit with what it changed against its first parent.
struct ChangedCommit {
    CommitRecord commit;
    std::vector<FileRecord> changes;
};

/// The text of a history page: the commits behind the number `known`, in ascending order, as many as `mostChanges` lets
/// in and at least one; none when there are no more.
OdString historyPage(CommitTables const& tables, std::int64_t known, std::size_t mostChanges);

/// Reads a page. Throws `Failure` for one in which a path, hash or URL is not clean, or whose numbers do not ascend.
std::vector<ChangedCommit> readHistoryPage(OdString const& document);

} // namespace tav
