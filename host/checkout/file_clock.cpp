#include "host/checkout/file_clock.h"

#include "host/changes/index_record.h"

#include "platform/os/os_files.h"
#include "platform/os/os_open_file.h"

#include <chrono>
#include <thread>

namespace tav {

namespace {

constexpr std::chrono::milliseconds kPatience{50};

/// The time that the file gets when it is written now.
std::uint64_t timeNow(os::OpenFile const& file, std::string const& path)
{
    constexpr std::uint64_t kSecond = 1'000'000'000;
    struct statx status;
    if (file.writeAt(0, ".") || os::examine(path, status)) {
        return 0;
    }
    return static_cast<std::uint64_t>(status.stx_mtime.tv_sec) * kSecond + status.stx_mtime.tv_nsec;
}

} // namespace

std::uint64_t waitForNextTick(std::string const& scratch)
{
    os::OpenFile file;
    if (file.create(scratch, 0600)) {
        return 0;
    }
    auto const end = std::chrono::steady_clock::now() + kPatience;
    std::uint64_t const start = timeNow(file, scratch);
    std::uint64_t now = start;
    while (now != 0 && !isOver(start, now) && std::chrono::steady_clock::now() < end) {
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
        now = timeNow(file, scratch);
    }
    return now;
}

} // namespace tav
