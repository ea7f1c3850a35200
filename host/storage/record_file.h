/// Files of records: a revision store has many, an object has exactly one (docs/formats/storage.md).
#pragma once

#include "host/storage/content.h"
#include "host/storage/frames.h"
#include "host/storage/record.h"

#include "platform/os/os_open_file.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace tav {

/// A delta can build on another delta. At most this many lead from a whole content to any other one.
inline constexpr std::size_t kLongestChain = 32;
/// The same for contents longer than a segment: each step on the way goes through a file.
inline constexpr std::size_t kLongestLargeChain = 8;

/// A record and its place in the file.
struct Entry {
    Record record;
    std::uint64_t offset = 0; ///< of the header

    std::uint64_t framesOffset() const { return offset + kHeaderLength; }
    std::uint64_t end() const { return framesOffset() + record.framesLength; }
};

/// A content that was read and checked, kept for reuse.
struct KnownContent {
    Digest digest{};
    Content content;
};

/// An open file of records, and the list of them. Everything throws `StorageError`. One thread at a time. Only the
/// holder of the repository's lock may append; readers need no lock, and an append does not disturb them.
///
/// Damage is skipped: after an invalid header, the next valid one is searched for. Readers ignore the bytes after the
/// last record. The next append overwrites them if they are a torn tail, which an interrupted append has left.
/// Otherwise they may be a record with a damaged header, so they are kept, and the append goes after them.
class RecordFile {
public:
    /// Opens the file `path`. Messages call it `name`.
    static RecordFile openForReading(std::string const& path, std::string name);
    static RecordFile openForChanging(std::string const& path, std::string name);
    /// Makes the file, which must not exist.
    static RecordFile create(std::string const& path, std::string name);

    /// In the order of the file, oldest first.
    std::vector<Entry> const& entries() const { return entries_; }
    /// Where the next record goes.
    std::uint64_t end() const { return end_; }
    /// Length of the file, any torn tail included.
    std::uint64_t length() const { return length_; }
    /// Whether the file consists of its records and nothing else.
    bool isClean() const;

    /// The newest record of the content `digest`: its index.
    std::optional<std::size_t> find(Digest const& digest) const;
    /// Whether there is a record of the content `digest`, or one that builds on it.
    bool isNamed(Digest const& digest) const;
    /// The records that lead to the content of record `index`, from the whole one to that record, with the newest
    /// record of each base. Throws when one is missing or there are too many.
    std::vector<std::size_t> chainOf(std::size_t index) const;

    /// Passes the content of record `index` to `sink`, and throws if its digest is wrong: do not trust anything that
    /// `sink` received before this has returned. Large intermediate contents are in unnamed files in `scratch`. If the
    /// record builds on `known`, which may be null, its base is not read.
    void read(std::size_t index, std::string const& scratch, KnownContent const* known, Sink const& sink) const;
    /// The content of record `index`, checked.
    Content load(std::size_t index, std::string const& scratch) const;

    /// Appends `content`, as a delta to `base` if that is not null and makes it smaller; `base` is a content of this
    /// file. A failure leaves the file unchanged, as far as the disk permits. Throws when the digest of the content is
    /// not `digest`.
    void append(Content const& content, Digest const& digest, KnownContent const* base, unsigned segmentLog);
    /// Appends the record `index` of `other` unchanged.
    void appendFrom(RecordFile const& other, std::size_t index);
    /// Waits until the file is safe on the disk.
    void flush() const;

private:
    RecordFile(os::OpenFile file, std::string name) : file_(std::move(file)), name_(std::move(name)) {}

    void list();
    std::optional<Entry> entryAt(std::uint64_t offset) const;
    std::optional<Entry> nextEntry(std::uint64_t offset) const;
    bool isTorn(std::uint64_t offset) const;
    bool isZero(std::uint64_t offset) const;
    std::size_t readUpTo(std::uint64_t offset, char* buffer, std::size_t count) const;
    std::optional<Content> loadBase(std::size_t index, std::string const& scratch, Buffer& spare) const;
    Content unpack(std::size_t index, Content const* base, std::string const& scratch, Buffer memory) const;
    void unpack(std::size_t index, Content const* base, Buffer& memory, Sink const& sink) const;
    void requireDigest(std::size_t index, Digest const& digest) const;
    void write(std::uint64_t offset, std::string_view bytes) const;
    Record
    writeRecord(Content const& content, Digest const& digest, KnownContent const* base, unsigned segmentLog) const;
    template <class Write>
    void appendRecord(Write const& write);

    os::OpenFile file_;
    std::string name_;
    std::vector<Entry> entries_;
    std::uint64_t length_ = 0;
    std::uint64_t end_ = 0;
};

} // namespace tav
