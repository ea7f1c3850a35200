/// What clients send: how it is written, and how it is read and checked as far as that can be done without knowing the
/// repository. Any thread.
///
/// The readers throw `Failure` for a document that is refused; the text names the member. Nothing is copied but what
/// is kept, and no check takes longer than sorting the paths.
#pragma once

#include "host/history/commit_tables.h"

#include "common/mu_common_serialization.h"

#include <optional>
#include <string>
#include <vector>

namespace tav {

/// A reference that is to be made or moved; without a commit, removed.
struct ReferenceChange {
    common::Reference reference;
    /// Hash of the commit that it is expected to name now, empty where it is expected not to exist; none: anything.
    std::optional<OdString> expected = std::nullopt;
};

/// A commit on its way into the repository, with everything in it clean. It has no number yet.
struct NewCommit {
    CommitRecord commit;
    std::vector<FileRecord> files; ///< no path twice, and none that is the folder of another
    std::vector<ReferenceChange> references;
};

/// A commit-info document, and how it is read.
OdString commitInfoDocument(NewCommit const& commit);
NewCommit readCommitInfo(OdString const& document);

/// Throws `Failure` unless the hash of the commit is the one that follows from what is in it.
void requireHash(NewCommit const& commit);

/// A references document, and how it is read; no name stands in it twice.
OdString referenceChanges(std::vector<ReferenceChange> const& changes);
std::vector<ReferenceChange> readReferences(OdString const& document);

/// The highest number in a commit-numbers document, which is what the client knows; 0 for an empty one.
std::int64_t readLastNumber(OdString const& document);

/// The pairs of a commit-numbers document, in their order.
std::vector<CommitNumber> readNumbers(OdString const& document);

/// A repository that a client asks for.
struct NewRepository {
    OdString name;
    OdString id; ///< empty when the server shall choose one
};

NewRepository readNewRepository(OdString const& document);

} // namespace tav
