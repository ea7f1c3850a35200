/// Watching and refusing memory.
#pragma once

#include <cstddef>

namespace server {

/// Counts the bytes that the process asks for with `new` while it lives. One at a time.
class CountedAllocations {
public:
    CountedAllocations();
    CountedAllocations(CountedAllocations const&) = delete;
    CountedAllocations& operator=(CountedAllocations const&) = delete;
    ~CountedAllocations();

    std::size_t bytes() const;
};

/// While it lives, `new` throws `std::bad_alloc` for `limit` bytes and more. One at a time.
class RefusedAllocations {
public:
    explicit RefusedAllocations(std::size_t limit);
    RefusedAllocations(RefusedAllocations const&) = delete;
    RefusedAllocations& operator=(RefusedAllocations const&) = delete;
    ~RefusedAllocations();
};

} // namespace server
