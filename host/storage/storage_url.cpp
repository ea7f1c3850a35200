#include "host/storage/storage_url.h"

#include "common/mu_common_versions.h"

#include <algorithm>
#include <string_view>

namespace tav {

namespace {

constexpr std::string_view kStore = "tf:";
constexpr std::string_view kObject = "po:";
constexpr std::size_t kLongestName = 100;
constexpr std::size_t kLongestStem = 40;
constexpr std::size_t kDistinction = 16; // digits of the digest in a name

bool isLegible(char c)
{
    return (c >= '0' && c <= '9') || (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || c == '-' || c == '_';
}

/// A URL taken apart; both parts are in its text.
struct Parts {
    std::string_view store;
    Digest digest;
};

std::optional<Parts> partsOf(std::string_view store, std::string_view hex)
{
    std::optional<Digest> const digest = digestFromHex(hex);
    return digest ? std::optional<Parts>({store, *digest}) : std::nullopt;
}

std::optional<Parts> partsOf(std::string_view url)
{
    std::string_view const rest = url.substr(std::min(url.size(), kStore.size()));
    if (url.substr(0, kObject.size()) == kObject) {
        return partsOf({}, rest);
    }
    std::size_t const hash = rest.find('#');
    if (url.substr(0, kStore.size()) != kStore || hash == std::string_view::npos ||
        !isStoreName(rest.substr(0, hash))) {
        return std::nullopt;
    }
    return partsOf(rest.substr(0, hash), rest.substr(hash + 1));
}

std::string stemOf(std::string_view path)
{
    std::string_view const name = path.substr(path.rfind('/') + 1);
    std::string stem;
    for (char const c : name.substr(0, name.rfind('.'))) {
        bool const repeatsGap = !isLegible(c) && !stem.empty() && stem.back() == '_';
        if (!repeatsGap && stem.size() < kLongestStem) {
            stem += isLegible(c) ? c : '_';
        }
    }
    return stem.empty() ? "_" : stem;
}

} // namespace

OdString StorageUrl::text() const
{
    std::string const text = isObject() ? std::string(kObject) : std::string(kStore) + store + "#";
    return OdString((text + hexOf(digest)).c_str(), CP_UTF_8);
}

bool isStoreName(std::string_view name)
{
    if (name.empty() || name.size() > kLongestName || name.front() == '.') {
        return false;
    }
    for (char const c : name) {
        if (!isLegible(c) && c != '.') {
            return false;
        }
    }
    return true;
}

std::optional<StorageUrl> parseUrl(OdString const& url)
{
    std::string const text = url.ansi_str();
    std::optional<Parts> const parts = partsOf(text);
    return parts ? std::optional<StorageUrl>({std::string(parts->store), parts->digest}) : std::nullopt;
}

std::optional<Digest> digestOf(OdString const& url)
{
    return digestOf(std::string_view(url.ansi_str()));
}

std::optional<Digest> digestOf(std::string_view url)
{
    std::optional<Parts> const parts = partsOf(url);
    return parts ? std::optional(parts->digest) : std::nullopt;
}

std::string newStoreName(OdString const& path, Digest const& digest)
{
    std::string const bytes = path.ansi_str();
    std::string const subject = bytes + '\0' + hexOf(digest);
    common::ContentDigest distinction;
    distinction.update(subject.data(), subject.size());
    return stemOf(bytes) + "-" + distinction.finish().ansi_str().substr(0, kDistinction);
}

} // namespace tav
