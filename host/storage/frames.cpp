#include "host/storage/frames.h"

#include "host/storage/storage_error.h"

#include "common/mu_common_versions.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <new>
#include <zstd.h>

namespace tav {

namespace {

constexpr int kQuickLevel = 3;
constexpr int kThoroughLevel = 19;
constexpr int kSmallestWindowLog = 10;    // that zstd accepts
constexpr std::size_t kClearlySmall = 16; // a frame of at most this fraction of its segment
constexpr std::size_t kDescriptor = 4;    // offset of the frame header descriptor; zstd ignores one of its bits
constexpr unsigned kUnusedBit = 0x10;
constexpr std::uint64_t kPiece = std::uint64_t{1} << 20;

using Compressor = std::unique_ptr<ZSTD_CCtx, std::size_t (*)(ZSTD_CCtx*)>;
using Decompressor = std::unique_ptr<ZSTD_DCtx, std::size_t (*)(ZSTD_DCtx*)>;

/// A part of a content.
struct Range {
    std::uint64_t offset;
    std::size_t count;
};

/// The part at `offset` of a content of `length` bytes that is worked on in parts of `partLength` bytes.
Range partAt(std::uint64_t offset, std::uint64_t length, std::uint64_t partLength)
{
    return {offset, static_cast<std::size_t>(std::min(partLength, length - offset))};
}

/// What the segment at `offset` may refer to: the same place of the base and half a segment's length around it.
Range prefixRange(std::uint64_t baseLength, std::uint64_t segmentLength, std::uint64_t offset)
{
    std::uint64_t const around = segmentLength / 2;
    std::uint64_t const begin = offset < around ? 0 : offset - around;
    if (begin >= baseLength) {
        return {0, 0};
    }
    std::uint64_t const end = std::min(baseLength - begin, offset - begin + segmentLength + around) + begin;
    return {begin, static_cast<std::size_t>(end - begin)};
}

std::string_view prefixFor(std::uint64_t offset, std::uint64_t segmentLength, Content const* base, Buffer& buffer)
{
    if (base == nullptr) {
        return {};
    }
    Range const range = prefixRange(base->length(), segmentLength, offset);
    return base->at(range.offset, range.count, buffer);
}

int windowLogFor(std::size_t length)
{
    int log = kSmallestWindowLog;
    while (std::size_t{1} << static_cast<unsigned>(log) < length) {
        ++log;
    }
    return log;
}

void requireWorked(std::size_t result)
{
    if (ZSTD_isError(result) != 0) {
        throw std::bad_alloc(); // There is room for the result, so only memory can be short.
    }
}

/// Compresses segments one after the other, with memory that serves for all.
class SegmentCompressor {
public:
    explicit SegmentCompressor(Effort effort)
        : level_(effort == Effort::quick ? kQuickLevel : kThoroughLevel)
        , context_(ZSTD_createCCtx(), ZSTD_freeCCtx)
    {
        if (!context_) {
            throw std::bad_alloc();
        }
    }

    /// The frame of `segment`, valid until the next call, and whether it needs the prefix.
    std::string_view compress(std::string_view segment, std::string_view prefix, bool& usesPrefix)
    {
        usesPrefix = !prefix.empty();
        std::string_view const frame = compressOnce(segment, prefix, first_);
        if (!usesPrefix || frame.size() <= segment.size() / kClearlySmall) {
            return frame;
        }
        std::string_view const alone = compressOnce(segment, {}, second_);
        usesPrefix = frame.size() < alone.size();
        return usesPrefix ? frame : alone;
    }

private:
    std::string_view compressOnce(std::string_view segment, std::string_view prefix, Buffer& buffer)
    {
        std::size_t const room = ZSTD_compressBound(segment.size());
        char* const frame = buffer.reserve(room);
        requireWorked(ZSTD_CCtx_reset(context_.get(), ZSTD_reset_session_and_parameters));
        set(ZSTD_c_compressionLevel, level_);
        if (!prefix.empty()) {
            set(ZSTD_c_windowLog, windowLogFor(prefix.size() + segment.size()));
            set(ZSTD_c_enableLongDistanceMatching, 1);
            requireWorked(ZSTD_CCtx_refPrefix(context_.get(), prefix.data(), prefix.size()));
        }
        std::size_t const length = ZSTD_compress2(context_.get(), frame, room, segment.data(), segment.size());
        requireWorked(length);
        return {frame, length};
    }

    void set(ZSTD_cParameter parameter, int value)
    {
        requireWorked(ZSTD_CCtx_setParameter(context_.get(), parameter, value));
    }

    int level_;
    Compressor context_;
    Buffer first_;
    Buffer second_;
};

/// Reads the frames of a record one by one.
class FrameReader {
public:
    FrameReader(Frames const& frames, std::uint64_t length, std::string const& name)
        : frames_(frames)
        , rest_(length)
        , name_(name)
    {
    }

    /// The next frame, of a segment of `segmentLength` bytes.
    std::string_view next(std::size_t segmentLength)
    {
        fill(ZSTD_compressBound(segmentLength));
        std::size_t const length = ZSTD_findFrameCompressedSize(held_.data(), held_.size());
        if (ZSTD_isError(length) != 0 || ZSTD_getFrameContentSize(held_.data(), length) != segmentLength) {
            damaged();
        }
        std::string_view const frame = held_.substr(0, length);
        if ((static_cast<unsigned char>(frame[kDescriptor]) & kUnusedBit) != 0) {
            damaged();
        }
        held_.remove_prefix(length);
        return frame;
    }

    void requireEnd() const
    {
        if (rest_ > 0 || !held_.empty()) {
            damaged();
        }
    }

    [[noreturn]] void damaged() const { throw StorageError(name_ + " is damaged."); }

private:
    /// A frame of a segment is never longer than `wanted`.
    void fill(std::size_t wanted)
    {
        if (held_.size() >= wanted || rest_ == 0) {
            return;
        }
        auto const missing = static_cast<std::size_t>(std::min<std::uint64_t>(wanted - held_.size(), rest_));
        Buffer& other = usesFirst_ ? second_ : first_;
        char* const bytes = other.reserve(held_.size() + missing);
        std::copy(held_.begin(), held_.end(), bytes);
        std::size_t done = 0;
        check(frames_.file.readAt(frames_.offset, bytes + held_.size(), missing, done), name_ + " cannot be read");
        if (done < missing) {
            damaged();
        }
        frames_.offset += missing;
        rest_ -= missing;
        held_ = {bytes, held_.size() + missing};
        usesFirst_ = !usesFirst_;
    }

    Frames frames_;
    std::uint64_t rest_; // bytes that are not read yet
    std::string const& name_;
    Buffer first_;
    Buffer second_;
    bool usesFirst_ = false;
    std::string_view held_;
};

/// Unpacks segments one after the other.
class SegmentDecompressor {
public:
    SegmentDecompressor() : context_(ZSTD_createDCtx(), ZSTD_freeDCtx)
    {
        if (!context_) {
            throw std::bad_alloc();
        }
    }

    /// Fills `segment`; false when `frame` is damaged.
    bool decompress(std::string_view frame, std::string_view prefix, char* segment, std::size_t length)
    {
        requireWorked(ZSTD_DCtx_reset(context_.get(), ZSTD_reset_session_and_parameters));
        requireWorked(ZSTD_DCtx_refPrefix(context_.get(), prefix.data(), prefix.size()));
        return ZSTD_decompressDCtx(context_.get(), segment, length, frame.data(), frame.size()) == length;
    }

private:
    Decompressor context_;
};

} // namespace

Digest digestOf(Content const& content)
{
    std::uint64_t const pieceLength = content.isInMemory() ? content.length() : kPiece;
    common::ContentDigest digest;
    Buffer buffer;
    for (std::uint64_t offset = 0; offset < content.length(); offset += pieceLength) {
        std::string_view const piece = content.at(offset, partAt(offset, content.length(), pieceLength).count, buffer);
        digest.update(piece.data(), piece.size());
    }
    return finish(digest);
}

Compressed compress(
    Content const& content, Digest const& digest, Content const* base, unsigned segmentLog, Effort effort,
    Sink const& sink)
{
    std::uint64_t const segmentLength = std::uint64_t{1} << segmentLog;
    SegmentCompressor compressor(effort);
    common::ContentDigest seen;
    Buffer segmentBuffer;
    Buffer prefixBuffer;
    Compressed result;
    for (std::uint64_t offset = 0; offset < content.length(); offset += segmentLength) {
        Range const range = partAt(offset, content.length(), segmentLength);
        std::string_view const segment = content.at(range.offset, range.count, segmentBuffer);
        bool usesPrefix = false;
        std::string_view const frame =
            compressor.compress(segment, prefixFor(offset, segmentLength, base, prefixBuffer), usesPrefix);
        sink(frame);
        result.framesLength += frame.size();
        result.usesBase = result.usesBase || usesPrefix;
        if (!content.isInMemory()) {
            seen.update(segment.data(), segment.size());
        }
    }
    if (!content.isInMemory() && finish(seen) != digest) {
        throw StorageError("The file has changed while it was being stored.");
    }
    return result;
}

void decompress(
    Record const& record, Frames const& frames, Content const* base, std::string const& name, Buffer& segment,
    Sink const& sink)
{
    FrameReader reader(frames, record.framesLength, name);
    SegmentDecompressor decompressor;
    Buffer prefixBuffer;
    for (std::uint64_t offset = 0; offset < record.length; offset += record.segmentLength()) {
        std::size_t const length = partAt(offset, record.length, record.segmentLength()).count;
        std::string_view const frame = reader.next(length);
        std::string_view const prefix = prefixFor(offset, record.segmentLength(), base, prefixBuffer);
        char* const bytes = segment.reserve(length);
        if (!decompressor.decompress(frame, prefix, bytes, length)) {
            reader.damaged();
        }
        sink({bytes, length});
    }
    reader.requireEnd();
}

} // namespace tav
