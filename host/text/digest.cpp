#include "host/text/digest.h"

#include "common/mu_common_versions.h"

#include <cstddef>
#include <cstdint>

namespace tav {

namespace {

constexpr std::string_view kDigits = "0123456789abcdef";
constexpr std::uint8_t kNoDigit = 0xff;

using Values = std::array<std::uint8_t, 256>;

constexpr Values valuesOfDigits()
{
    Values values{};
    for (std::uint8_t& value : values) {
        value = kNoDigit;
    }
    for (std::size_t i = 0; i < kDigits.size(); ++i) {
        values[static_cast<unsigned char>(kDigits[i])] = static_cast<std::uint8_t>(i);
    }
    return values;
}

// A table, since 'tav status' reads two digests for each file.
constexpr Values kValues = valuesOfDigits();

std::uint8_t valueOf(char digit)
{
    return kValues[static_cast<unsigned char>(digit)];
}

} // namespace

std::string hexOf(Digest const& digest)
{
    std::string hex;
    hex.reserve(2 * digest.size());
    for (unsigned char const byte : digest) {
        hex += kDigits[byte >> 4U];
        hex += kDigits[byte & 15U];
    }
    return hex;
}

std::optional<Digest> digestFromHex(std::string_view hex)
{
    Digest digest;
    if (hex.size() != 2 * digest.size()) {
        return std::nullopt;
    }
    for (std::size_t i = 0; i < digest.size(); ++i) {
        std::uint8_t const high = valueOf(hex[2 * i]);
        std::uint8_t const low = valueOf(hex[2 * i + 1]);
        if (high == kNoDigit || low == kNoDigit) {
            return std::nullopt;
        }
        digest[i] = static_cast<unsigned char>(high << 4U | low);
    }
    return digest;
}

Digest finish(common::ContentDigest& content)
{
    return digestFromHex(content.finish().ansi_str()).value_or(Digest{});
}

} // namespace tav
