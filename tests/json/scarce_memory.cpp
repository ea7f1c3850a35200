#include "tests/json/scarce_memory.h"

#include <cstddef>
#include <cstdlib>
#include <new>

namespace {

thread_local long remaining = -1; // Negative while there is no limit.
thread_local std::size_t largest = static_cast<std::size_t>(-1);
thread_local long used = 0;

bool works(std::function<void()> const& operation)
{
    try {
        operation();
    } catch (std::bad_alloc const&) {
        return false;
    }
    return true;
}

} // namespace

void* operator new(std::size_t size)
{
    void* const block = remaining == 0 || size > largest ? nullptr : std::malloc(size > 0 ? size : 1);
    if (!block) {
        throw std::bad_alloc();
    }
    remaining -= remaining > 0;
    ++used;
    return block;
}

void operator delete(void* block) noexcept
{
    used -= block != nullptr;
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept
{
    operator delete(block);
}

namespace scarce_memory {

long usedBlocks()
{
    return used;
}

bool worksWithin(long limit, std::function<void()> const& operation)
{
    remaining = limit;
    bool const isEnough = works(operation);
    remaining = -1;
    return isEnough;
}

bool worksWithBlocksOf(std::size_t size, std::function<void()> const& operation)
{
    largest = size;
    bool const isEnough = works(operation);
    largest = static_cast<std::size_t>(-1);
    return isEnough;
}

} // namespace scarce_memory
