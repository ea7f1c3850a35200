#include "host/storage/record_file.h"

#include "host/storage/storage_error.h"

#include <algorithm>
#include <array>
#include <string_view>
#include <utility>

namespace tav {

namespace {

constexpr std::size_t kPiece = std::size_t{1} << 20;
constexpr std::string_view kFrameMark("\x28\xb5\x2f\xfd"); // of zstd

} // namespace

RecordFile RecordFile::openForReading(std::string const& path, std::string name)
{
    os::OpenFile file;
    check(file.openForReading(path), name + " cannot be opened");
    RecordFile records(std::move(file), std::move(name));
    records.list();
    return records;
}

RecordFile RecordFile::openForChanging(std::string const& path, std::string name)
{
    os::OpenFile file;
    std::error_code const error = file.openForChanging(path);
    if (error == std::errc::too_many_links || error == std::errc::too_many_symbolic_link_levels) {
        throw StorageError(
            name + " has another name, and what is written would show there too: put a copy in its place.");
    }
    check(error, name + " cannot be opened");
    RecordFile records(std::move(file), std::move(name));
    records.list();
    return records;
}

RecordFile RecordFile::create(std::string const& path, std::string name)
{
    os::OpenFile file;
    check(file.create(path, 0666), name + " cannot be made");
    return {std::move(file), std::move(name)};
}

void RecordFile::list()
{
    check(file_.length(length_), name_ + " cannot be read");
    std::uint64_t offset = 0;
    while (offset < length_) {
        std::optional<Entry> entry = entryAt(offset);
        if (!entry) {
            entry = nextEntry(offset + 1);
        }
        if (!entry) {
            break;
        }
        entries_.push_back(*entry);
        offset = entry->end();
    }
    end_ = isTorn(offset) ? offset : length_;
}

// A killed append leaves zeros in place of the header, followed by frames; a power failure may leave nothing but zeros.
// A damaged header is neither, and the content after it may be whole.
bool RecordFile::isTorn(std::uint64_t offset) const
{
    std::array<char, kHeaderLength + kFrameMark.size()> bytes;
    std::string_view const head(bytes.data(), readUpTo(offset, bytes.data(), bytes.size()));
    if (head.size() < kHeaderLength || parseHeader(head.substr(0, kHeaderLength))) { // The frames are cut off.
        return true;
    }
    if (head.find_first_not_of('\0') < kHeaderLength) {
        return false;
    }
    std::string_view const frame = head.substr(kHeaderLength);
    return frame == kFrameMark.substr(0, frame.size()) || isZero(offset);
}

bool RecordFile::isZero(std::uint64_t offset) const
{
    std::string piece(kPiece, '\0');
    while (offset < length_) {
        std::size_t const done = readUpTo(offset, piece.data(), piece.size());
        if (std::string_view(piece.data(), done).find_first_not_of('\0') != std::string_view::npos) {
            return false;
        }
        if (done < piece.size()) {
            return true;
        }
        offset += done;
    }
    return true;
}

std::size_t RecordFile::readUpTo(std::uint64_t offset, char* buffer, std::size_t count) const
{
    std::size_t done = 0;
    check(file_.readAt(offset, buffer, count, done), name_ + " cannot be read");
    return done;
}

std::optional<Entry> RecordFile::entryAt(std::uint64_t offset) const
{
    std::array<char, kHeaderLength> bytes;
    std::size_t const done = readUpTo(offset, bytes.data(), bytes.size());
    std::optional<Record> const record = parseHeader({bytes.data(), done});
    if (!record || record->framesLength > length_ - offset - kHeaderLength) {
        return std::nullopt;
    }
    return Entry{*record, offset};
}

std::optional<Entry> RecordFile::nextEntry(std::uint64_t offset) const
{
    std::string piece(std::min<std::uint64_t>(kPiece, length_ - offset), '\0');
    while (offset + kHeaderLength <= length_) {
        std::size_t const done = readUpTo(offset, piece.data(), piece.size());
        std::string_view const text(piece.data(), done);
        for (std::size_t mark = text.find(headerMark()); mark < text.size(); mark = text.find(headerMark(), mark + 1)) {
            if (auto const entry = entryAt(offset + mark)) {
                return entry;
            }
        }
        if (done < piece.size() || done < kHeaderLength) {
            return std::nullopt;
        }
        offset += done - headerMark().size() + 1; // A mark may cross the border.
    }
    return std::nullopt;
}

bool RecordFile::isClean() const
{
    std::uint64_t offset = 0;
    for (Entry const& entry : entries_) {
        if (entry.offset != offset) {
            return false;
        }
        offset = entry.end();
    }
    return offset == length_;
}

std::optional<std::size_t> RecordFile::find(Digest const& digest) const
{
    for (std::size_t index = entries_.size(); index-- > 0;) {
        if (entries_[index].record.digest == digest) {
            return index;
        }
    }
    return std::nullopt;
}

bool RecordFile::isNamed(Digest const& digest) const
{
    return std::any_of(entries_.begin(), entries_.end(), [&](Entry const& entry) {
        return entry.record.digest == digest || entry.record.base == digest;
    });
}

void RecordFile::unpack(std::size_t index, Content const* base, Buffer& memory, Sink const& sink) const
{
    Entry const& entry = entries_[index];
    decompress(entry.record, {file_, entry.framesOffset()}, base, name_, memory, sink);
}

Content RecordFile::unpack(std::size_t index, Content const* base, std::string const& scratch, Buffer memory) const
{
    Record const& record = entries_[index].record;
    if (record.length <= record.segmentLength()) {
        unpack(index, base, memory, [](std::string_view) {});
        return {std::move(memory), static_cast<std::size_t>(record.length)};
    }
    os::OpenFile file;
    check(file.createUnnamed(scratch), "A temporary file in '" + scratch + "' cannot be made");
    std::uint64_t offset = 0;
    unpack(index, base, memory, [&](std::string_view piece) {
        check(file.writeAt(offset, piece), "A temporary file in '" + scratch + "' cannot be written");
        offset += piece.size();
    });
    return {std::move(file), record.length, "A temporary file"};
}

void RecordFile::failAsDamaged() const
{
    throw StorageError(name_ + " is damaged.");
}

void RecordFile::write(std::uint64_t offset, std::string_view bytes) const
{
    check(file_.writeAt(offset, bytes), name_ + " cannot be written");
}

// The header last: without it, the frames are not a record.
Record RecordFile::writeRecord(
    Content const& content, Digest const& digest, KnownContent const* base, unsigned segmentLog, Effort effort) const
{
    std::uint64_t offset = end() + kHeaderLength;
    Content const* const baseContent = base != nullptr ? base->content.get() : nullptr;
    Compressed const compressed =
        compress(content, digest, baseContent, segmentLog, effort, [&](std::string_view frame) {
            write(offset, frame);
            offset += frame.size();
        });
    Record const record{
        digest, compressed.usesBase ? base->digest : Digest{}, content.length(), compressed.framesLength, segmentLog};
    write(end(), headerOf(record));
    return record;
}

template <class Write>
void RecordFile::appendRecord(Write const& write)
{
    std::uint64_t const before = end();
    if (length_ > before) {
        check(file_.truncate(before), name_ + " cannot be written");
    }
    try {
        entries_.push_back({write(), before});
        length_ = end_ = entries_.back().end();
    } catch (...) {
        // What is left if this fails is a torn tail.
        [[maybe_unused]] std::error_code const ignored = file_.truncate(before);
        length_ = before;
        throw;
    }
}

void RecordFile::append(
    Content const& content, Digest const& digest, KnownContent const* base, unsigned segmentLog, Effort effort)
{
    appendRecord([&] { return writeRecord(content, digest, base, segmentLog, effort); });
}

void RecordFile::appendFrom(RecordFile const& other, std::size_t index)
{
    Entry const& entry = other.entries_[index];
    std::string piece(std::min<std::uint64_t>(kPiece, entry.end() - entry.offset), '\0');
    appendRecord([&] {
        for (std::uint64_t offset = entry.offset; offset < entry.end();) {
            std::size_t const wanted = std::min<std::uint64_t>(piece.size(), entry.end() - offset);
            std::size_t const done = other.readUpTo(offset, piece.data(), wanted);
            if (done < wanted) {
                other.failAsDamaged();
            }
            write(end() + offset - entry.offset, {piece.data(), done});
            offset += done;
        }
        return entry.record;
    });
}

void RecordFile::flush() const
{
    check(file_.flush(), name_ + " cannot be written");
}

} // namespace tav
