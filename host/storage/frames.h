/// Converting contents to zstd frames and back.
///
/// A content is cut into segments of equal length, each compressed into one frame. If there is a base, the frame may
/// refer to the bytes of the base at the offset of the segment, plus half a segment's length before and after it. So
/// any content is processed with at most about six segments' lengths of memory, including the tables of zstd.
#pragma once

#include "host/storage/content.h"
#include "host/storage/record.h"

#include "platform/os/os_open_file.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace tav {

/// Receives bytes piece by piece.
using Sink = std::function<void(std::string_view)>;

/// The result of compressing a content.
struct Compressed {
    std::uint64_t framesLength = 0;
    bool usesBase = false; ///< whether any of the frames needs the base
};

/// How hard `compress` tries: `thorough` takes a quarter off what text takes otherwise, in forty times the time.
enum class Effort { quick, thorough };

/// Compresses `content` in segments of 2^`segmentLog` bytes, on `base` unless it is null; `sink` receives the frames.
/// Each segment is compressed with and without the base, and the smaller result is used; the second is not tried when
/// the first has at most a sixteenth of the segment's length, because no more than that could be saved.
/// Throws `StorageError` when the compressed bytes do not have the digest `digest`, which happens only when a file
/// changes during the call (contents in memory are not digested again), and what `sink` throws.
Compressed compress(
    Content const& content, Digest const& digest, Content const* base, unsigned segmentLog, Effort effort,
    Sink const& sink);

/// The digest of `content`.
Digest digestOf(Content const& content);

/// Where the frames of a record are.
struct Frames {
    os::OpenFile const& file;
    std::uint64_t offset; ///< of the first
};

/// Unpacks the frames of `record`, on `base` unless it is whole, and passes the content to `sink`, a segment at a time;
/// `segment` is the buffer, which has the last segment afterwards. No number in the file is trusted: throws
/// `StorageError` ("`name` is damaged.") when the frames do not match the header, and what `sink` throws. The caller
/// must check the digest of the content.
void decompress(
    Record const& record, Frames const& frames, Content const* base, std::string const& name, Buffer& segment,
    Sink const& sink);

} // namespace tav
