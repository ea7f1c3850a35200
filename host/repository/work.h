/// Where every command that changes a repository begins.
#pragma once

#include "host/repository/local_database.h"
#include "host/repository/lock.h"

#include <cstdint>
#include <optional>
#include <string>

namespace tav {

/// A repository that nobody else changes meanwhile, and in which nothing is left half done.
class Work {
public:
    /// Whether a command can do without what an interrupted one has left to finish, as long as the server is away.
    enum class Unfinished {
        mustEnd,
        mayStay,
        isLeft ///< not even tried: the command changes where the server is
    };

    /// Takes the lock for the command `name` and finishes the commit or move that an interrupted command has left.
    /// Throws `Failure`.
    Work(common::RootPath const& root, std::string const& name, Unfinished unfinished = Unfinished::mustEnd);

    common::RootPath const& root() const { return root_; }
    LocalDatabase& database() { return database_; }
    std::uint64_t start() const { return start_; }

    /// The commit that has been finished, if any.
    std::optional<CommitRecord> const& finished() const { return finished_; }

    /// Throws `Failure` when an interrupted command has left the files of two commits in the working folder.
    void failIfBetweenCommits() const;

private:
    void finish();

    common::RootPath root_;
    os::FileLock lock_;
    std::uint64_t start_;
    LocalDatabase database_;
    std::optional<CommitRecord> finished_;
};

/// What a reader of the repository should know of work that has not been finished, by an interrupted command or by one
/// that is still running; empty when there is none.
std::string noteOnUnfinished(common::RootPath const& root, LocalDatabase const& database);

} // namespace tav
