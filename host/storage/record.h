/// Records, the one form in which contents are kept: a header and zstd frames (docs/formats/storage.md).
#pragma once

#include "host/text/digest.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tav {

/// Contents are compressed in segments of 2^26 bytes; each becomes one frame. Smaller ones are for tests.
inline constexpr unsigned kSegmentLog = 26;
inline constexpr unsigned kSmallestSegmentLog = 12;

/// What the header of a record says.
struct Record {
    Digest digest{};                ///< of the content
    Digest base{};                  ///< of the content that the frames build on; all zeros: on none
    std::uint64_t length = 0;       ///< of the content
    std::uint64_t framesLength = 0; ///< of all frames together
    unsigned segmentLog = kSegmentLog;

    bool isWhole() const { return base == Digest{}; }
    std::uint64_t segmentLength() const { return std::uint64_t{1} << segmentLog; }
};

inline constexpr std::size_t kHeaderLength = 104;

/// What every header begins with.
std::string_view headerMark();

/// The header of `record`.
std::string headerOf(Record const& record);

/// Reads a header. None unless `bytes` are exactly one whose check sum holds and whose numbers can be true.
std::optional<Record> parseHeader(std::string_view bytes);

} // namespace tav
