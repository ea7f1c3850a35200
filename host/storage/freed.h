/// What cleaning has freed.
#pragma once

#include <cstddef>
#include <cstdint>

namespace tav {

/// What was removed from the storage.
struct Freed {
    std::size_t contents = 0; ///< objects and revisions
    std::uint64_t bytes = 0;

    Freed& operator+=(Freed const& other)
    {
        contents += other.contents;
        bytes += other.bytes;
        return *this;
    }
};

} // namespace tav
