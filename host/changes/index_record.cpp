#include "host/changes/index_record.h"

#include <algorithm>

namespace tav {

namespace {

constexpr std::uint64_t kSecond = 1'000'000'000;
constexpr std::uint64_t kTick = 10'000'000; // The system's own clock for files moves in steps of 4 to 10 ms.

/// File systems of network drives know whole seconds only, some every other.
std::uint64_t granularity(std::uint64_t time)
{
    return time % kSecond == 0 ? 2 * kSecond : kTick;
}

} // namespace

std::uint64_t commandStart(common::RootPath const& root)
{
    return common::modifyTime(L".tav/tav.lock", root);
}

common::IndexData indexRecord(std::uint64_t time, std::uint64_t start)
{
    return {time, !isOver(time, start)};
}

bool isOver(std::uint64_t time, std::uint64_t later)
{
    return time + granularity(time) <= later;
}

std::uint64_t timeForWrittenFiles(std::uint64_t start)
{
    return start - granularity(start);
}

VerifiedFileList settledFiles(VerifiedFileList files, std::uint64_t time)
{
    auto const mayChange = [&](VerifiedFile const& file) {
        bool const isSettled = isOver(static_cast<std::uint64_t>(file.stamp.modified), time) &&
                               isOver(static_cast<std::uint64_t>(file.stamp.changed), time);
        return !isSettled;
    };
    files.erase(std::remove_if(files.begin(), files.end(), mayChange), files.end());
    return files;
}

} // namespace tav
