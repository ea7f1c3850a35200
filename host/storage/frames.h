/// Contents to zstd frames and back.
///
/// A content is cut into segments of one length, each compressed into one frame. Where there is a base, the frame may
/// refer to what the base holds at the place of the segment and half a segment's length around it. So any content is
/// worked on with at most about six segments' lengths of memory, tables of zstd included.
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

/// Takes the bytes of something piece by piece.
using Sink = std::function<void(std::string_view)>;

/// What became of a content.
struct Compressed {
    std::uint64_t framesLength = 0;
    bool usesBase = false; ///< whether any of the frames needs the base
};

/// Compresses `content` in segments of 2^`segmentLog` bytes, on `base` unless it is null; `sink` gets the frames.
/// Of the two forms of a segment, with the base and without, the smaller is taken; the second is not tried when the
/// first has at most a sixteenth of the segment's length, since no more than that could be saved.
/// Throws `StorageError` when the bytes that were compressed do not have the digest `digest`, which happens only when a
/// file changes meanwhile (contents in memory are not digested again), and what `sink` throws.
Compressed
compress(Content const& content, Digest const& digest, Content const* base, unsigned segmentLog, Sink const& sink);

/// The digest of `content`.
Digest digestOf(Content const& content);

/// Where the frames of a record are.
struct Frames {
    os::OpenFile const& file;
    std::uint64_t offset; ///< of the first
};

/// Unpacks the frames of `record`, on `base` unless it is whole, and gives `sink` the content, a segment at a time;
/// `segment` holds it meanwhile, and the last one afterwards. No number in the file is trusted: throws `StorageError`
/// when the frames are not what the header says, "... is damaged." said of `name`; and what `sink` throws. Whether it
/// is the right content is for the caller to find out.
void decompress(
    Record const& record, Frames const& frames, Content const* base, std::string const& name, Buffer& segment,
    Sink const& sink);

} // namespace tav
