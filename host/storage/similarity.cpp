#include "host/storage/similarity.h"

#include <algorithm>
#include <memory>
#include <new>
#include <string_view>
#include <zstd.h>

namespace tav {

namespace {

constexpr int kLevel = 1;
constexpr std::size_t kSampleLength = std::size_t{32} << 10;
constexpr std::size_t kAround = std::size_t{48} << 10; // What precedes the sample may be longer or shorter there.
constexpr int kSamples = 3;

std::string_view whole(Content const& content)
{
    Buffer unused;
    return content.at(0, static_cast<std::size_t>(content.length()), unused);
}

/// Compresses samples one after the other.
class Sampler {
public:
    Sampler() : context_(ZSTD_createCCtx(), ZSTD_freeCCtx)
    {
        if (!context_) {
            throw std::bad_alloc();
        }
    }

    std::size_t compressedLength(std::string_view sample, std::string_view prefix)
    {
        std::size_t const room = ZSTD_compressBound(sample.size());
        ZSTD_CCtx_reset(context_.get(), ZSTD_reset_session_and_parameters);
        ZSTD_CCtx_setParameter(context_.get(), ZSTD_c_compressionLevel, kLevel);
        ZSTD_CCtx_refPrefix(context_.get(), prefix.data(), prefix.size());
        std::size_t const length =
            ZSTD_compress2(context_.get(), frame_.reserve(room), room, sample.data(), sample.size());
        if (ZSTD_isError(length) != 0) {
            throw std::bad_alloc(); // There is room for the result, so only memory can be short.
        }
        return length;
    }

private:
    std::unique_ptr<ZSTD_CCtx, std::size_t (*)(ZSTD_CCtx*)> context_;
    Buffer frame_;
};

/// The part of `bytes` around the place that is `part` of their length.
std::string_view around(std::string_view bytes, double part)
{
    auto const middle = static_cast<std::size_t>(static_cast<double>(bytes.size()) * part);
    return bytes.substr(middle < kAround ? 0 : middle - kAround, kSampleLength + 2 * kAround);
}

} // namespace

bool resembles(Content const& content, Content const& candidate)
{
    std::string_view const bytes = whole(content);
    std::string_view const others = whole(candidate);
    std::size_t const sampleLength = std::min(kSampleLength, bytes.size() / (kSamples + 1));
    Sampler sampler;
    std::size_t alone = 0;
    std::size_t together = 0;
    for (int i = 1; i <= kSamples; ++i) {
        double const part = static_cast<double>(i) / (kSamples + 1);
        auto const place = static_cast<std::size_t>(static_cast<double>(bytes.size()) * part);
        std::string_view const sample = bytes.substr(place, sampleLength);
        alone += sampler.compressedLength(sample, {});
        together += sampler.compressedLength(sample, around(others, part));
    }
    return together * 3 < alone * 2;
}

} // namespace tav
