/// Records, the format in which contents are stored: a header and zstd frames (docs/formats/storage.md).
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

/// The values in the header of a record.
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

/// The beginning of every header.
std::string_view headerMark();

/// The header of `record`.
std::string headerOf(Record const& record);

/// Reads a header. None unless `bytes` is exactly one header with a correct checksum and possible numbers.
std::optional<Record> parseHeader(std::string_view bytes);

} // namespace tav
