#include "host/changes/digest.h"

#include "common/mu_common_versions.h"

#include "platform/ut/File.h"

#include <cstdint>
#include <vector>

namespace tav {

std::optional<Digest> fileDigest(OdString const& path)
{
    ut::File file;
    if (!file.open(path, ut::File::kRead)) {
        return std::nullopt;
    }
    common::ContentDigest digest;
    std::vector<char> buffer(std::size_t{1} << 18);
    std::uint64_t const length = file.length();
    std::uint64_t total = 0;
    while (std::size_t const got = file.read(buffer.data(), buffer.size())) {
        digest.update(buffer.data(), got);
        total += got;
    }
    // A file that has become longer meanwhile was read up to its new end.
    if (total < length) {
        return std::nullopt;
    }
    return finish(digest);
}

} // namespace tav
