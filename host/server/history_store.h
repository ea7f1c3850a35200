/// What a server's store of history has to do. The core knows no other way to it.
///
/// Every operation throws `Failure` when the store cannot be used. One thread, and one snapshot or transaction at a
/// time for each object; other programs may use the same store through objects of their own.
#pragma once

#include "host/history/commit_tables.h"
#include "host/text/digest.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

namespace tav {

struct Repository {
    OdString id;
    OdString name; ///< for people; several may have the same
};

/// A content that a repository has. Its bytes are a record file of the content store.
struct StoredContent {
    Digest digest{};
    std::int64_t id = 0;      ///< of its file
    Digest record{};          ///< of the bytes of the file
    Digest base{};            ///< of the content that the record builds on; all zeros: on none
    std::int64_t chain = 0;   ///< at most so many differences lead to it
    std::uint64_t length = 0; ///< of the content
    std::uint64_t recordLength = 0;
    bool isNamed = false;    ///< by a commit: then it is kept for ever
    bool isDamaged = false;  ///< its file could not be read
    std::int64_t leased = 0; ///< kept until then in any case, in seconds since 1970-01-01T00:00:00Z

    bool isWhole() const { return base == Digest{}; }
};

/// A record on its way from a working folder.
struct Upload {
    std::int64_t id = 0; ///< which no other upload has, nor will have; and of the file that it becomes
    OdString folder;     ///< that sends it
    Digest record{};
    Digest digest{};
    Digest base{};
    std::uint64_t recordLength = 0;
    std::int64_t touched = 0; ///< when some of it came last, or up to a day earlier
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

    virtual std::optional<StoredContent> content(Digest const& digest) const = 0;
    virtual std::optional<StoredContent> contentOfRecord(Digest const& record) const = 0;
    /// Contents that no commit names, that no other one builds on, and whose lease has ended at `now`; `most` at most.
    virtual std::vector<StoredContent> unneeded(std::int64_t now, std::size_t most) const = 0;
    /// Whether commits name the content and no working folder has sent it yet.
    virtual bool isAwaited(Digest const& digest) const = 0;

    virtual std::optional<Upload> upload(std::int64_t id) const = 0;
    virtual std::optional<Upload> upload(OdString const& folder, Digest const& record) const = 0;
    /// The uploads of which nothing has come since `time`.
    virtual std::vector<Upload> uploadsBefore(std::int64_t time) const = 0;
    /// Whether a content or an upload has the number `id`.
    virtual bool isUsed(std::int64_t id) const = 0;
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

    /// Adds a content, or replaces what is known of it.
    virtual void set(StoredContent const& content) = 0;
    virtual void removeContent(Digest const& digest) = 0;
    /// Keeps those of the contents that are there until `time`.
    virtual void lease(std::vector<Digest> const& contents, std::int64_t time) = 0;
    /// Keeps those of the contents that are there for ever, and returns the others, each once.
    virtual std::vector<Digest> name(std::vector<Digest> const& contents) = 0;
    virtual void await(std::vector<Digest> const& contents) = 0;
    virtual void removeAwaited(Digest const& digest) = 0;

    /// Adds an upload and returns its new number.
    virtual std::int64_t add(Upload const& upload) = 0;
    virtual void touch(std::int64_t upload, std::int64_t now) = 0;
    virtual void removeUpload(std::int64_t id) = 0;

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

    /// Whether any repository has an upload of that number.
    virtual bool hasUpload(std::int64_t id) = 0;

    /// Notes that commits up to `number` are handed out. It is no error when that cannot be noted.
    virtual void noteDelivered(OdString const& id, std::int64_t number) = 0;
};

} // namespace tav
