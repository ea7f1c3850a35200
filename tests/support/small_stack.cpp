#include "tests/support/small_stack.h"

#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <pthread.h>

namespace support {
namespace {

#if defined(__SANITIZE_ADDRESS__)
constexpr std::size_t kStackSize = 1024 * 1024;
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
constexpr std::size_t kStackSize = 1024 * 1024;
#else
constexpr std::size_t kStackSize = 256 * 1024;
#endif
#else
constexpr std::size_t kStackSize = 256 * 1024;
#endif

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
