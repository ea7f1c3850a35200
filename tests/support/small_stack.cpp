#include "tests/support/small_stack.h"

#include "tests/support/sanitized.h"

#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <pthread.h>

namespace support {
namespace {

constexpr std::size_t kStackSize = (kIsSanitized ? 1024 : 256) * 1024;

void require(int error, char const* step)
{
    if (error != 0) {
        std::fprintf(stderr, "onSmallStack: %s failed with error %d\n", step, error);
        std::abort();
    }
}

void* run(void* body)
{
    (*static_cast<std::function<void()> const*>(body))();
    return nullptr;
}

} // namespace

void onSmallStack(std::function<void()> const& body)
{
    pthread_attr_t attributes;
    require(pthread_attr_init(&attributes), "pthread_attr_init");
    require(pthread_attr_setstacksize(&attributes, kStackSize), "pthread_attr_setstacksize");
    pthread_t thread;
    require(pthread_create(&thread, &attributes, run, const_cast<std::function<void()>*>(&body)), "pthread_create");
    require(pthread_join(thread, nullptr), "pthread_join");
    pthread_attr_destroy(&attributes);
}

} // namespace support
