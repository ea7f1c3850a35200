/// Whether contents are alike enough to keep one as the difference to the other.
#pragma once

#include "host/storage/content.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string_view>

struct ZSTD_CCtx_s;

namespace tav {

/// Shorter contents win little, longer ones are too much to read for a guess.
constexpr bool canBeCompared(std::uint64_t length)
{
    return length >= std::uint64_t{1} << 12 && length <= std::uint64_t{1} << 24;
}

/// One content, to be compared with several others. Only three samples are tried, so a comparison takes the same time
/// however long the contents are, and ends with the sample that decides.
class Samples {
public:
    /// `content` is in memory and outlives this.
    explicit Samples(Content const& content);

    /// Whether the content would take clearly less room on `candidate`, which is in memory too.
    bool resemble(Content const& candidate);

private:
    std::size_t compressedLength(std::string_view sample, std::string_view prefix);

    std::unique_ptr<ZSTD_CCtx_s, std::size_t (*)(ZSTD_CCtx_s*)> context_;
    Buffer frame_;
    std::array<std::string_view, 3> samples_;
    std::size_t alone_ = 0; // the length of all samples together, compressed
};

} // namespace tav
