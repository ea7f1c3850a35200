#include "tests/state/memory.h"

#include <algorithm>
#include <cstdlib>
#include <malloc.h>
#include <new>

namespace {

// The tests of this program run on one thread.
std::size_t used = 0;
std::size_t peak = 0;
long demandsLeft = -1; // until one fails; negative when none will
bool failed = false;

void* allocate(std::size_t size) noexcept
{
    if (demandsLeft >= 0 && demandsLeft-- == 0) {
        failed = true;
        return nullptr;
    }
    void* const memory = std::malloc(size == 0 ? 1 : size);
    used += malloc_usable_size(memory);
    peak = std::max(peak, used);
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
    used -= malloc_usable_size(memory);
    std::free(memory);
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

namespace states {

PeakOfMemory::PeakOfMemory() : before_(used)
{
    peak = used;
}

std::size_t PeakOfMemory::bytes() const
{
    return peak - before_;
}

FailingDemand::FailingDemand(long n)
{
    failed = false;
    demandsLeft = n;
}

FailingDemand::~FailingDemand()
{
    stop();
}

bool FailingDemand::hasFailed()
{
    return failed;
}

void FailingDemand::stop()
{
    demandsLeft = -1;
}

} // namespace states
