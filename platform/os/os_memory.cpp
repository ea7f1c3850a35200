#include "platform/os/os_memory.h"

#include <cstdint>
#include <sys/mman.h>
#include <unistd.h>

namespace os {

void adviseLargePages(void* begin, std::size_t size)
{
    auto const page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    std::size_t const toPage = (page - reinterpret_cast<std::uintptr_t>(begin) % page) % page;
    if (toPage < size) {
        madvise(static_cast<char*>(begin) + toPage, size - toPage, MADV_HUGEPAGE);
    }
}

} // namespace os
