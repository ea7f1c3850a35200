#include "tests/host/failing_allocation.h"

#include <cstddef>
#include <cstdlib>
#include <dlfcn.h>
#include <new>
#include <sqlite3.h>
#include <zstd.h>
#include <zstd_errors.h>

namespace {

struct Plan {
    bool isActive = false;
    bool goesOn = false;
    long failing = 0;
    long count = 0; // requests so far
};

Plan plan;
sqlite3_mem_methods ofSqlite;

bool mustFail() noexcept
{
    if (!plan.isActive) {
        return false;
    }
    long const number = plan.count++;
    return plan.goesOn ? number >= plan.failing : number == plan.failing;
}

void* requestForSqlite(int size)
{
    return mustFail() ? nullptr : ofSqlite.xMalloc(size);
}

void* repeatForSqlite(void* memory, int size)
{
    return mustFail() ? nullptr : ofSqlite.xRealloc(memory, size);
}

/// The operation of zstd that this file stands in for.
template <class Operation>
Operation next(char const* name)
{
    return reinterpret_cast<Operation>(dlsym(RTLD_NEXT, name));
}

/// The settings count from the next start of SQLite.
void setForSqlite(sqlite3_mem_methods& methods)
{
    sqlite3_shutdown();
    sqlite3_config(SQLITE_CONFIG_MALLOC, &methods);
    sqlite3_config(SQLITE_CONFIG_LOOKASIDE, 0, 0); // Small pieces are requests too.
}

} // namespace

// All of a kind: the address sanitizer has its own, and sees when memory comes from one kind and goes to another.
void* operator new(std::size_t size)
{
    void* const memory = mustFail() ? nullptr : std::malloc(size == 0 ? 1 : size);
    if (memory == nullptr) {
        throw std::bad_alloc();
    }
    return memory;
}

void* operator new(std::size_t size, std::nothrow_t const& /*nothrow*/) noexcept
{
    return mustFail() ? nullptr : std::malloc(size == 0 ? 1 : size);
}

void* operator new[](std::size_t size)
{
    return operator new(size);
}

void* operator new[](std::size_t size, std::nothrow_t const& nothrow) noexcept
{
    return operator new(size, nothrow);
}

void operator delete(void* memory) noexcept
{
    std::free(memory);
}

void operator delete(void* memory, std::size_t /*size*/) noexcept
{
    std::free(memory);
}

void operator delete[](void* memory) noexcept
{
    std::free(memory);
}

void operator delete[](void* memory, std::size_t /*size*/) noexcept
{
    std::free(memory);
}

// zstd asks for memory where nobody can stand in; its operations say so.
extern "C" {

ZSTD_CCtx* ZSTD_createCCtx()
{
    return mustFail() ? nullptr : next<ZSTD_CCtx* (*)()>("ZSTD_createCCtx")();
}

ZSTD_DCtx* ZSTD_createDCtx()
{
    return mustFail() ? nullptr : next<ZSTD_DCtx* (*)()>("ZSTD_createDCtx")();
}

std::size_t ZSTD_compress2(ZSTD_CCtx* context, void* frame, std::size_t room, void const* bytes, std::size_t count)
{
    if (mustFail()) {
        return std::size_t{0} - ZSTD_error_memory_allocation;
    }
    using Compress = std::size_t (*)(ZSTD_CCtx*, void*, std::size_t, void const*, std::size_t);
    return next<Compress>("ZSTD_compress2")(context, frame, room, bytes, count);
}

} // extern "C"

namespace host_tests {

FailingAllocation::FailingAllocation(long n, Lasts lasts)
{
    sqlite3_shutdown();
    sqlite3_config(SQLITE_CONFIG_GETMALLOC, &ofSqlite);
    sqlite3_mem_methods failing = ofSqlite;
    failing.xMalloc = requestForSqlite;
    failing.xRealloc = repeatForSqlite;
    setForSqlite(failing);
    plan = {false, lasts == Lasts::on, n, 0};
}

FailingAllocation::~FailingAllocation()
{
    end();
    setForSqlite(ofSqlite);
}

void FailingAllocation::begin()
{
    plan.isActive = true;
}

bool FailingAllocation::hasFailed()
{
    return plan.count > plan.failing;
}

void FailingAllocation::end()
{
    plan.isActive = false;
}

} // namespace host_tests
