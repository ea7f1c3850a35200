#include "tests/host/failing_memory.h"

#include <cstddef>
#include <dlfcn.h>
#include <sqlite3.h>
#include <zstd.h>
#include <zstd_errors.h>

namespace {

using support::FailingAllocation;

sqlite3_mem_methods ofSqlite;

void* requestForSqlite(int size)
{
    return FailingAllocation::failsNow() ? nullptr : ofSqlite.xMalloc(size);
}

void* repeatForSqlite(void* memory, int size)
{
    return FailingAllocation::failsNow() ? nullptr : ofSqlite.xRealloc(memory, size);
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

// zstd asks for memory where nobody can stand in; its operations say so.
extern "C" {

ZSTD_CCtx* ZSTD_createCCtx()
{
    return FailingAllocation::failsNow() ? nullptr : next<ZSTD_CCtx* (*)()>("ZSTD_createCCtx")();
}

ZSTD_DCtx* ZSTD_createDCtx()
{
    return FailingAllocation::failsNow() ? nullptr : next<ZSTD_DCtx* (*)()>("ZSTD_createDCtx")();
}

std::size_t ZSTD_compress2(ZSTD_CCtx* context, void* frame, std::size_t room, void const* bytes, std::size_t count)
{
    if (FailingAllocation::failsNow()) {
        return std::size_t{0} - ZSTD_error_memory_allocation;
    }
    using Compress = std::size_t (*)(ZSTD_CCtx*, void*, std::size_t, void const*, std::size_t);
    return next<Compress>("ZSTD_compress2")(context, frame, room, bytes, count);
}

} // extern "C"

namespace host_tests {

FailingMemory::FailingMemory(long n, support::FailingAllocation::Lasts lasts) : failing_(n, lasts)
{
    FailingAllocation::pause();
    sqlite3_shutdown();
    sqlite3_config(SQLITE_CONFIG_GETMALLOC, &ofSqlite);
    sqlite3_mem_methods failing = ofSqlite;
    failing.xMalloc = requestForSqlite;
    failing.xRealloc = repeatForSqlite;
    setForSqlite(failing);
}

FailingMemory::~FailingMemory()
{
    FailingAllocation::pause();
    setForSqlite(ofSqlite);
}

} // namespace host_tests
