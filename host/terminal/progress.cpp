#include "host/terminal/progress.h"

#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <utility>

namespace tav {

namespace {

constexpr std::chrono::milliseconds kPatience(500);
constexpr std::chrono::milliseconds kInterval(100);
constexpr std::uint64_t kWidth = 30;

bool isHidden = false;

} // namespace

void hideProgress()
{
    isHidden = true;
}

Progress::Progress(std::string what, std::uint64_t total, Clock::time_point (*now)())
    : what_(std::move(what))
    , total_(std::max<std::uint64_t>(total, 1))
    , enabled_(!isHidden && isatty(STDERR_FILENO) == 1)
    , now_(now)
    , next_(now() + kPatience)
{
}

Progress::~Progress()
{
    if (drawn_) {
        std::fputs("\r\x1b[K", stderr);
    }
}

void Progress::advance(std::uint64_t count)
{
    done_ += count;
    if (!enabled_ || now_() < next_) {
        return;
    }
    next_ = now_() + kInterval;
    drawn_ = true;
    draw();
}

void Progress::draw() const
{
    std::uint64_t const filled = std::min(kWidth, done_ * kWidth / total_);
    std::string const bar = std::string(filled, '#') + std::string(kWidth - filled, '.');
    std::fprintf(
        stderr, "\r[%s] %llu of %llu %s", bar.c_str(), static_cast<unsigned long long>(done_),
        static_cast<unsigned long long>(total_), what_.c_str());
    std::fflush(stderr);
}

} // namespace tav
