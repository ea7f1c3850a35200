/// Files of records: a revision store has many, an object has exactly one (docs/formats/storage.md).
#pragma once

#include "host/storage/content.h"
#include "host/storage/frames.h"
#include "host/storage/record.h"

#include "platform/os/os_open_file.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace tav {

/// A record and its place in the file.
struct Entry {
    Record record;
    std::uint64_t offset = 0; ///< of the header

    std::uint64_t framesOffset() const { return offset + kHeaderLength; }
    std::uint64_t end() const { return framesOffset() + record.framesLength; }
};

/// A content that was read and checked, for others to build on.
struct KnownContent {
    Digest digest{};
    std::shared_ptr<Content const> content;
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
    /// Passes the content of record `index`, which builds on `base` unless that is null, to `sink`; `memory` holds a
    /// segment of it meanwhile, and the last one afterwards. The caller checks the digest.
    void unpack(std::size_t index, Content const* base, Buffer& memory, Sink const& sink) const;
    /// The whole content: in `memory` if it is at most a segment long, otherwise in an unnamed file in `scratch`.
    Content unpack(std::size_t index, Content const* base, std::string const& scratch, Buffer memory) const;
    /// Throws the error of a damaged file.
    [[noreturn]] void failAsDamaged() const;

    /// Appends `content`, as a delta to `base` if that is not null and makes it smaller. A failure leaves the file
    /// unchanged, as far as the disk permits. Throws when the digest of the content is not `digest`.
    void append(
        Content const& content, Digest const& digest, KnownContent const* base, unsigned segmentLog,
        Effort effort = Effort::quick);
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
    void write(std::uint64_t offset, std::string_view bytes) const;
    Record writeRecord(
        Content const& content, Digest const& digest, KnownContent const* base, unsigned segmentLog,
        Effort effort) const;
    template <class Write>
    void appendRecord(Write const& write);

    os::OpenFile file_;
    std::string name_;
    std::vector<Entry> entries_;
    std::uint64_t length_ = 0;
    std::uint64_t end_ = 0;
};

} // namespace tav
