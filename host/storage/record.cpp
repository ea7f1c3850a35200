#include "host/storage/record.h"

#include "common/mu_common_versions.h"

#include <algorithm>

namespace tav {

namespace {

// A skippable frame of zstd, so that a record of a whole content is an archive that every zstd program unpacks.
constexpr std::string_view kMark("\x54\x2a\x4d\x18\x60\0\0\0tavrev1", 15);
constexpr std::size_t kCheckLength = 8;
constexpr std::size_t kCheckedLength = kHeaderLength - kCheckLength;

void append(std::string& bytes, std::uint64_t number)
{
    for (unsigned shift = 0; shift < 64; shift += 8) {
        bytes += static_cast<char>(number >> shift & 0xffU);
    }
}

void append(std::string& bytes, Digest const& digest)
{
    bytes.append(digest.begin(), digest.end());
}

std::uint64_t numberAt(std::string_view bytes, std::size_t place)
{
    std::uint64_t number = 0;
    for (std::size_t i = 8; i-- > 0;) {
        number = number << 8U | static_cast<unsigned char>(bytes[place + i]);
    }
    return number;
}

Digest digestAt(std::string_view bytes, std::size_t place)
{
    Digest digest;
    std::copy_n(bytes.begin() + static_cast<std::ptrdiff_t>(place), digest.size(), digest.begin());
    return digest;
}

std::string checkOf(std::string_view bytes)
{
    std::string const hex = generateSha(bytes.data(), static_cast<int>(bytes.size())).ansi_str();
    Digest const digest = digestFromHex(hex).value_or(Digest{});
    return {digest.begin(), digest.begin() + kCheckLength};
}

bool canBeTrue(Record const& record)
{
    return record.segmentLog >= kSmallestSegmentLog && record.segmentLog <= kSegmentLog &&
           (record.length == 0) == (record.framesLength == 0) && (record.length > 0 || record.isWhole());
}

} // namespace

std::string_view headerMark()
{
    return kMark;
}

std::string headerOf(Record const& record)
{
    std::string bytes(kMark);
    bytes += static_cast<char>(record.segmentLog);
    append(bytes, record.length);
    append(bytes, record.framesLength);
    append(bytes, record.digest);
    append(bytes, record.base);
    return bytes + checkOf(bytes);
}

std::optional<Record> parseHeader(std::string_view bytes)
{
    if (bytes.size() != kHeaderLength || bytes.substr(0, kMark.size()) != kMark ||
        bytes.substr(kCheckedLength) != checkOf(bytes.substr(0, kCheckedLength))) {
        return std::nullopt;
    }
    Record record;
    record.segmentLog = static_cast<unsigned char>(bytes[15]);
    record.length = numberAt(bytes, 16);
    record.framesLength = numberAt(bytes, 24);
    record.digest = digestAt(bytes, 32);
    record.base = digestAt(bytes, 64);
    return canBeTrue(record) ? std::optional<Record>(record) : std::nullopt;
}

} // namespace tav
