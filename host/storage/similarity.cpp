#include "host/storage/similarity.h"

#include <algorithm>
#include <new>
#include <string_view>
#include <zstd.h>

namespace tav {

namespace {

constexpr int kLevel = 1;
constexpr std::size_t kSampleLength = std::size_t{32} << 10;
constexpr std::size_t kAround = std::size_t{48} << 10; // What precedes the sample may be longer or shorter there.

std::string_view whole(Content const& content)
{
    Buffer unused;
    return content.at(0, static_cast<std::size_t>(content.length()), unused);
}

/// Where sample `i` is, as a part of the length.
double placeOf(std::size_t i, std::size_t samples)
{
    return static_cast<double>(i + 1) / static_cast<double>(samples + 1);
}

/// The part of `bytes` around the place that is `part` of their length.
std::string_view around(std::string_view bytes, double part)
{
    auto const middle = static_cast<std::size_t>(static_cast<double>(bytes.size()) * part);
    return bytes.substr(middle < kAround ? 0 : middle - kAround, kSampleLength + 2 * kAround);
}

} // namespace

Samples::Samples(Content const& content) : context_(ZSTD_createCCtx(), ZSTD_freeCCtx)
{
    if (!context_) {
        throw std::bad_alloc();
    }
    std::string_view const bytes = whole(content);
    std::size_t const length = std::min(kSampleLength, bytes.size() / (samples_.size() + 1));
    for (std::size_t i = 0; i < samples_.size(); ++i) {
        double const place = static_cast<double>(bytes.size()) * placeOf(i, samples_.size());
        samples_[i] = bytes.substr(static_cast<std::size_t>(place), length);
        alone_ += compressedLength(samples_[i], {});
    }
}

bool Samples::resemble(Content const& candidate)
{
    std::string_view const others = whole(candidate);
    std::size_t together = 0;
    for (std::size_t i = 0; i < samples_.size() && together * 3 < alone_ * 2; ++i) {
        together += compressedLength(samples_[i], around(others, placeOf(i, samples_.size())));
    }
    return together * 3 < alone_ * 2;
}

std::size_t Samples::compressedLength(std::string_view sample, std::string_view prefix)
{
    std::size_t const room = ZSTD_compressBound(sample.size());
    ZSTD_CCtx_reset(context_.get(), ZSTD_reset_session_and_parameters);
    ZSTD_CCtx_setParameter(context_.get(), ZSTD_c_compressionLevel, kLevel);
    ZSTD_CCtx_refPrefix(context_.get(), prefix.data(), prefix.size());
    std::size_t const length = ZSTD_compress2(context_.get(), frame_.reserve(room), room, sample.data(), sample.size());
    if (ZSTD_isError(length) != 0) {
        throw std::bad_alloc(); // There is room for the result, so only memory can be short.
    }
    return length;
}

} // namespace tav
