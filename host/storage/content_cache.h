/// Contents that were read or stored, kept for those that build on them.
#pragma once

#include "host/storage/content.h"
#include "host/text/digest.h"

#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>

namespace tav {

/// The contents used last, as many as there is room for. Each is in memory and has its digest.
class ContentCache {
public:
    /// Null when it is not here. What was found counts as used.
    std::shared_ptr<Content const> find(Digest const& digest);
    bool has(Digest const& digest) const;
    /// Keeps `content` unless it is in a file.
    void add(Digest const& digest, std::shared_ptr<Content const> content);

private:
    struct Known {
        Digest digest{};
        std::shared_ptr<Content const> content;
    };

    void dropOldest();

    std::deque<Known> known_; // the last one used first
    std::uint64_t length_ = 0;
};

} // namespace tav
