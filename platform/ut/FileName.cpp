#include "platform/ut/FileName.h"

#include "platform/os/os_files.h"
#include "platform/ut/Dir.h"

#include <limits>
#include <sys/stat.h>

namespace ut {
namespace {

constexpr wchar_t kSeparator = L'/';

// Where a component lies in a path.
struct Range {
    std::size_t begin;
    std::size_t end;
};

// Of the last component, separators after it skipped. Empty, at the beginning, when there is none.
Range lastComponent(OdString const& path)
{
    std::size_t end = path.getLength();
    while (end > 0 && path.getAt(end - 1) == kSeparator) {
        --end;
    }
    std::size_t begin = end;
    while (begin > 0 && path.getAt(begin - 1) != kSeparator) {
        --begin;
    }
    return {begin, end};
}

OdString lastName(OdString const& path)
{
    Range const last = lastComponent(path);
    return path.mid(last.begin, last.end - last.begin);
}

// How many characters of the name stand before the dot of its extension; all of them when it has none.
std::size_t stemLength(OdString const& name)
{
    std::size_t const length = name.getLength();
    std::size_t dot = length;
    while (dot > 0 && name.getAt(dot - 1) != L'.') {
        --dot;
    }
    bool const startsExtension = dot > 1 && dot < length;
    return startsExtension ? dot - 1 : length;
}

// A moment outside of the range of ticks, before 1678 or after 2261, counts as the nearest inside.
DateTime toDateTime(statx_timestamp const& time)
{
    constexpr std::int64_t kTicksPerSecond = 1'000'000'000;
    using Limits = std::numeric_limits<std::int64_t>;
    std::int64_t ticks = 0;
    if (__builtin_mul_overflow(time.tv_sec, kTicksPerSecond, &ticks) ||
        __builtin_add_overflow(ticks, static_cast<std::int64_t>(time.tv_nsec), &ticks)) {
        ticks = time.tv_sec < 0 ? Limits::min() : Limits::max();
    }
    return DateTime(ticks);
}

void give(DateTime* date, struct statx const& status, unsigned kind, statx_timestamp const& time)
{
    if (date != nullptr) {
        *date = (status.stx_mask & kind) != 0 ? toDateTime(time) : DateTime();
    }
}

} // namespace

FileName::FileName(OdString const& path) : path_(path) {}

FileName::FileName(OdString const& folder, OdString const& name, OdString const& extension)
    : path_(folder + kSeparator + name)
{
    if (!extension.isEmpty()) {
        path_ += L'.';
        path_ += extension;
    }
}

OdString FileName::getName() const
{
    OdString const name = lastName(path_);
    return name.left(stemLength(name));
}

OdString FileName::getExt() const
{
    OdString const name = lastName(path_);
    return name.mid(stemLength(name) + 1);
}

bool FileName::hasExt() const
{
    return !getExt().isEmpty();
}

std::size_t FileName::getDirCount() const
{
    std::size_t count = 0;
    bool inside = false;
    for (std::size_t i = 0; i < path_.getLength(); ++i) {
        bool const belongs = path_.getAt(i) != kSeparator;
        count += belongs && !inside ? 1 : 0;
        inside = belongs;
    }
    return count;
}

void FileName::removeLastDir()
{
    Range const last = lastComponent(path_);
    if (last.begin == last.end) {
        return;
    }
    std::size_t length = last.begin;
    while (length > 1 && path_.getAt(length - 1) == kSeparator) {
        --length;
    }
    path_ = path_.left(length);
}

bool FileName::exists(std::uint32_t /*kinds*/) const
{
    struct statx status;
    return !os::examine(path_.ansi_str(), status);
}

bool FileName::isDirWritable() const
{
    return os::mayWriteIn(path_.ansi_str());
}

bool FileName::getTimes(DateTime* access, DateTime* modification, DateTime* creation) const
{
    struct statx status;
    if (os::examine(path_.ansi_str(), status)) {
        return false;
    }
    give(access, status, STATX_ATIME, status.stx_atime);
    give(modification, status, STATX_MTIME, status.stx_mtime);
    give(creation, status, STATX_BTIME, status.stx_btime);
    return true;
}

bool FileName::fileExists(OdString const& path)
{
    struct statx status;
    return !os::examine(path.ansi_str(), status) && S_ISREG(status.stx_mode);
}

bool FileName::mkdir(OdString const& path, int permissions, int flags)
{
    auto const make = (flags & kFullPath) != 0 ? os::makeFolders : os::makeFolder;
    return !make(path.ansi_str(), static_cast<mode_t>(permissions)) || Dir::exists(path);
}

OdString FileName::getPathSeparator()
{
    return OdString(&kSeparator, 1);
}

bool FileName::isPathSeparator(wchar_t character)
{
    return character == kSeparator;
}

} // namespace ut
