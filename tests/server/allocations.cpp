#include "tests/server/allocations.h"

#include <atomic>
#include <cstdlib>
#include <limits>
#include <new>

namespace {

constexpr std::size_t kUnlimited = std::numeric_limits<std::size_t>::max();

std::atomic<bool> counting = false;
std::atomic<std::size_t> counted = 0;
std::atomic<std::size_t> limit = kUnlimited;

void* allocate(std::size_t size) noexcept
{
    if (counting) {
        counted += size;
    }
    return size < limit ? std::malloc(size == 0 ? 1 : size) : nullptr;
}

void* allocateOrThrow(std::size_t size)
{
    void* const memory = allocate(size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}

} // namespace

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
    std::free(memory);
}
void operator delete[](void* memory) noexcept
{
    std::free(memory);
}
void operator delete(void* memory, std::size_t /*size*/) noexcept
{
    std::free(memory);
}
void operator delete[](void* memory, std::size_t /*size*/) noexcept
{
    std::free(memory);
}
void operator delete(void* memory, std::nothrow_t const& /*tag*/) noexcept
{
    std::free(memory);
}
void operator delete[](void* memory, std::nothrow_t const& /*tag*/) noexcept
{
    std::free(memory);
}

namespace server {

CountedAllocations::CountedAllocations()
{
    counted = 0;
    counting = true;
}

CountedAllocations::~CountedAllocations()
{
    counting = false;
}

std::size_t CountedAllocations::bytes() const
{
    return counted;
}

RefusedAllocations::RefusedAllocations(std::size_t refused)
{
    limit = refused;
}

RefusedAllocations::~RefusedAllocations()
{
    limit = kUnlimited;
}

} // namespace server
