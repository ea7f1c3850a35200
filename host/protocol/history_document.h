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

/// A commit of a history page.
OdString changedCommitText(ChangedCommit const& commit);

/// Reads a page. Throws `Failure` for one in which a path, hash or URL is not clean, or whose numbers do not ascend.
std::vector<ChangedCommit> readHistoryPage(OdString const& document);

} // namespace tav
