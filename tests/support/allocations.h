/// The memory that `new` gives out, watched and refused. A program that links this has an `operator new` of its own.
#pragma once

#include <cstddef>
#include <new>

namespace support {

/// What the process does with `new` while this lives. One at a time.
class WatchedMemory {
public:
    WatchedMemory();
    WatchedMemory(WatchedMemory const&) = delete;
    WatchedMemory& operator=(WatchedMemory const&) = delete;

    /// All bytes that were asked for.
    std::size_t asked() const;
    /// The most bytes that were in use at once, beyond those at the beginning.
    std::size_t peak() const;
    /// How many more blocks are in use than at the beginning.
    long blocks() const;

private:
    std::size_t const used_;
    long const blocks_;
};

/// While it lives, the n-th request for memory from here on, counted from 0, fails; with `Lasts::on` all later ones as
/// well. One at a time.
class FailingAllocation {
public:
    enum class Lasts { once, on };

    explicit FailingAllocation(long n, Lasts lasts = Lasts::once);
    FailingAllocation(FailingAllocation const&) = delete;
    FailingAllocation& operator=(FailingAllocation const&) = delete;
    ~FailingAllocation();

    /// Whether the n-th request has come.
    static bool hasFailed();
    /// Counts no requests and fails none, until `resume`.
    static void pause();
    static void resume();
    /// Counts a request for memory that does not go through `new`, and says whether it has to fail.
    static bool failsNow() noexcept;
};

/// While it lives, requests for `limit` bytes and more fail. One at a time.
class RefusedAllocations {
public:
    explicit RefusedAllocations(std::size_t limit);
    RefusedAllocations(RefusedAllocations const&) = delete;
    RefusedAllocations& operator=(RefusedAllocations const&) = delete;
    ~RefusedAllocations();
};

/// Whether `operation` ends without `std::bad_alloc`.
template <class Operation>
bool hasMemory(Operation const& operation)
{
    try {
        operation();
    } catch (std::bad_alloc const&) {
        return false;
    }
    return true;
}

/// The same when there is memory for `limit` more requests.
template <class Operation>
bool worksWithin(long limit, Operation const& operation)
{
    FailingAllocation const failing(limit, FailingAllocation::Lasts::on);
    return hasMemory(operation);
}

/// The same when no block may have more than `size` bytes.
template <class Operation>
bool worksWithBlocksOf(std::size_t size, Operation const& operation)
{
    RefusedAllocations const refused(size + 1);
    return hasMemory(operation);
}

} // namespace support
