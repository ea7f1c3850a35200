#include "host/storage/content_cache.h"

#include <algorithm>
#include <utility>

namespace tav {

namespace {

constexpr std::uint64_t kRoom = std::uint64_t{1} << 26;
constexpr std::size_t kMostContents = 64; // They are searched one by one.

} // namespace

std::shared_ptr<Content const> ContentCache::find(Digest const& digest)
{
    auto const found =
        std::find_if(known_.begin(), known_.end(), [&](Known const& known) { return known.digest == digest; });
    if (found == known_.end()) {
        return nullptr;
    }
    std::rotate(known_.begin(), found, found + 1);
    return known_.front().content;
}

bool ContentCache::has(Digest const& digest) const
{
    return std::any_of(known_.begin(), known_.end(), [&](Known const& known) { return known.digest == digest; });
}

void ContentCache::add(Digest const& digest, std::shared_ptr<Content const> content)
{
    if (!content->isInMemory() || content->length() > kRoom || has(digest)) {
        return;
    }
    length_ += content->length();
    known_.push_front({digest, std::move(content)});
    while (length_ > kRoom || known_.size() > kMostContents) {
        dropOldest();
    }
}

void ContentCache::dropOldest()
{
    length_ -= known_.back().content->length();
    known_.pop_back();
}

} // namespace tav
