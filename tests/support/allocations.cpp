#include "tests/support/allocations.h"

#include <atomic>
#include <cstdlib>
#include <limits>
#include <malloc.h>

namespace {

constexpr std::size_t kUnlimited = std::numeric_limits<std::size_t>::max();

std::atomic<std::size_t> asked = 0;
std::atomic<std::size_t> used = 0;
std::atomic<std::size_t> peak = 0;
std::atomic<long> blocks = 0;
std::atomic<std::size_t> limit = kUnlimited;

struct Plan {
    std::atomic<bool> isActive = false;
    std::atomic<bool> goesOn = false;
    std::atomic<long> failing = 0;
    std::atomic<long> count = 0; // requests so far
};

Plan plan;

void raisePeak(std::size_t now) noexcept
{
    std::size_t before = peak;
    while (before < now && !peak.compare_exchange_weak(before, now)) {
    }
}

void* allocate(std::size_t size) noexcept
{
    bool const mustFail = support::FailingAllocation::failsNow() || size >= limit;
    void* const memory = mustFail ? nullptr : std::malloc(size == 0 ? 1 : size);
    if (memory == nullptr) {
        return nullptr;
    }
    asked += size;
    ++blocks;
    raisePeak(used += malloc_usable_size(memory));
    return memory;
}

void* allocateOrThrow(std::size_t size)
{
    void* const memory = allocate(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}

void release(void* memory) noexcept
{
    if (memory != nullptr) {
        --blocks;
        used -= malloc_usable_size(memory);
        std::free(memory);
    }
}

} // namespace

// A request that no machine can meet fails as it does without the address sanitizer, which would end the process
// instead.
// NOLINTNEXTLINE(bugprone-reserved-identifier): the sanitizer, a shared library, asks for this name.
extern "C" __attribute__((visibility("default"))) char const* __asan_default_options()
{
    return "allocator_may_return_null=1";
}

// All of them: a sanitizer's own would refuse memory that comes from another family.
void* operator new(std::size_t size)
{
    return allocateOrThrow(size);
}
void* operator new[](std::size_t size)
{
    return allocateOrThrow(size);
}
void* operator new(std::size_t size, std::nothrow_t const& /*tag*/) noexcept
{
    return allocate(size);
}
void* operator new[](std::size_t size, std::nothrow_t const& /*tag*/) noexcept
{
    return allocate(size);
}
void operator delete(void* memory) noexcept
{
    release(memory);
}
void operator delete[](void* memory) noexcept
{
    release(memory);
}
void operator delete(void* memory, std::size_t /*size*/) noexcept
{
    release(memory);
}
void operator delete[](void* memory, std::size_t /*size*/) noexcept
{
    release(memory);
}
void operator delete(void* memory, std::nothrow_t const& /*tag*/) noexcept
{
    release(memory);
}
void operator delete[](void* memory, std::nothrow_t const& /*tag*/) noexcept
{
    release(memory);
}

namespace support {

WatchedMemory::WatchedMemory() : used_(used), blocks_(::blocks)
{
    ::asked = 0;
    ::peak = used_;
}

std::size_t WatchedMemory::asked() const
{
    return ::asked;
}

std::size_t WatchedMemory::peak() const
{
    return ::peak - used_;
}

long WatchedMemory::blocks() const
{
    return ::blocks - blocks_;
}

FailingAllocation::FailingAllocation(long n, Lasts lasts)
{
    plan.goesOn = lasts == Lasts::on;
    plan.failing = n;
    plan.count = 0;
    resume();
}

FailingAllocation::~FailingAllocation()
{
    pause();
}

bool FailingAllocation::hasFailed()
{
    return plan.count > plan.failing;
}

void FailingAllocation::pause()
{
    plan.isActive = false;
}

void FailingAllocation::resume()
{
    plan.isActive = true;
}

bool FailingAllocation::failsNow() noexcept
{
    if (!plan.isActive) {
        return false;
    }
    long const number = plan.count++;
    return plan.goesOn ? number >= plan.failing : number == plan.failing;
}

RefusedAllocations::RefusedAllocations(std::size_t refused)
{
    limit = refused;
}

RefusedAllocations::~RefusedAllocations()
{
    limit = kUnlimited;
}

} // namespace support
