/// The session in which every command that changes a repository runs.
#pragma once

#include "host/repository/journal.h"
#include "host/repository/local_database.h"
#include "host/repository/lock.h"

#include <cstdint>
#include <optional>
#include <string>

namespace tav {

/// What a session does about an operation that an interrupted command has left in the journal.
enum class Recovery {
    required,  ///< completes it, or fails
    attempted, ///< completes it if possible: the command works without, for example while the server is missing
    skipped    ///< leaves it pending: the command changes the location of the server
};

/// Who says that the recovery has completed a commit.
enum class Note {
    bySession, ///< the session, on the error stream
    byCommand  ///< the command, which may be the interrupted one repeated
};

/// Holds the lock of a repository, so that nobody else changes it, and has completed interrupted operations.
class WriteSession {
public:
    /// Takes the lock for the command `name`, and recovers. Throws `Failure`.
    WriteSession(
        common::RootPath const& root, std::string const& name, Recovery recovery = Recovery::required,
        Note note = Note::bySession);
    /// The same for a command that has the lock already because it had to create files of the repository first.
    WriteSession(common::RootPath const& root, os::FileLock lock, Recovery recovery, Note note = Note::bySession);

    common::RootPath const& root() const { return root_; }
    LocalDatabase& database() { return database_; }
    /// When the session began, by the clock of the file system that the working folder is on.
    std::uint64_t start() const { return start_; }

    /// The commit that the recovery has completed, if any.
    std::optional<CommitRecord> const& recoveredCommit() const { return recoveredCommit_; }

    /// Says on the error stream that the recovery has completed a commit, if it has.
    void noteRecovery() const;

    /// Throws `Failure` when an interrupted command has left files of two commits in the working folder.
    void failIfBetweenCommits() const;

private:
    void keepIdentity() const;
    void recover(PendingOperation const& pending);

    common::RootPath root_;
    os::FileLock lock_;
    std::uint64_t start_;
    LocalDatabase database_;
    std::optional<CommitRecord> recoveredCommit_;
};

} // namespace tav
