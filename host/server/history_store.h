/// What a server's store of history has to do. The core knows no other way to it.
///
/// Every operation throws `Failure` when the store cannot be used. One thread, and one snapshot or transaction at a
/// time for each object; other programs may use the same store through objects of their own.
#pragma once

#include "host/history/commit_tables.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

namespace tav {

struct Repository {
    OdString id;
    OdString name; ///< for people; several may have the same
};

/// One repository as it was at one moment, whatever others change meanwhile. They may have to wait, so it is not held
/// for long.
class HistorySnapshot {
public:
    HistorySnapshot() = default;
    HistorySnapshot(HistorySnapshot const&) = delete;
    HistorySnapshot& operator=(HistorySnapshot const&) = delete;
    virtual ~HistorySnapshot() = default;

    virtual std::optional<CommitRecord> find(OdString const& hash) const = 0;
    virtual std::optional<CommitRecord> find(std::int64_t number) const = 0;
    /// All commits with a number above `number`, in ascending order.
    virtual std::vector<CommitRecord> after(std::int64_t number) const = 0;
    /// All commits from the number `first` on, in ascending order.
    virtual std::vector<CommitNumber> numbersFrom(std::int64_t first) const = 0;
    virtual std::int64_t lastNumber() const = 0; ///< 0 when there is no commit

    virtual bool isBefore(OdString const& ancestor, OdString const& hash) const = 0; ///< or the same
    /// The commits that are before `from`, or `from` itself, and not before `to`, in ascending order. An empty `to` is
    /// before the first commit.
    virtual std::vector<CommitNumber> between(OdString const& from, OdString const& to) const = 0;

    /// All files of a commit.
    virtual Tree files(OdString const& hash) const = 0;
    /// What a commit changed against its first parent, in the order of paths.
    virtual std::vector<FileRecord> changes(OdString const& hash) const = 0;

    /// In the order of names.
    virtual std::vector<common::Reference> references() const = 0;
    virtual std::optional<common::Reference> reference(OdString const& name) const = 0;

    /// Up to which number commits have been handed out.
    virtual std::int64_t delivered() const = 0;
};

/// Makes changes one: all of them are kept when `commit` returns, and none when it is not called or a crash comes
/// first. Nobody else changes the repository meanwhile. What has been changed is seen at once by whoever asks this
/// object.
class HistoryTransaction : public HistorySnapshot {
public:
    /// Adds a commit with what it changed against its first parent. Its number is free, and its parents are there.
    virtual void add(CommitRecord const& commit, std::vector<FileRecord> const& changes) = 0;
    /// Makes a reference, or moves the one of that name. Its commit is there.
    virtual void set(common::Reference const& reference) = 0;
    /// Removes the reference of that name, if there is one.
    virtual void removeReference(OdString const& name) = 0;

    virtual void commit() = 0;
};

class HistoryStore {
public:
    HistoryStore() = default;
    HistoryStore(HistoryStore const&) = delete;
    HistoryStore& operator=(HistoryStore const&) = delete;
    virtual ~HistoryStore() = default;

    /// The oldest first.
    virtual std::vector<Repository> repositories() = 0;
    virtual std::optional<Repository> find(OdString const& id) = 0;
    /// Adds an empty repository; false when another one has the identifier.
    virtual bool add(Repository const& repository) = 0;

    /// The repository `id`, which there is.
    virtual std::unique_ptr<HistorySnapshot> read(OdString const& id) = 0;
    virtual std::unique_ptr<HistoryTransaction> write(OdString const& id) = 0;

    /// Notes that commits up to `number` are handed out. It is no error when that cannot be noted.
    virtual void noteDelivered(OdString const& id, std::int64_t number) = 0;
};

} // namespace tav
