/// Whether contents are alike enough to keep one as the difference to the other.
#pragma once

#include "host/storage/content.h"

#include <cstdint>

namespace tav {

/// Shorter contents win little, longer ones are too much to read for a guess.
constexpr bool canBeCompared(std::uint64_t length)
{
    return length >= std::uint64_t{1} << 12 && length <= std::uint64_t{1} << 24;
}

/// Whether `content` would take clearly less room on `candidate`. Both are in memory. Only three samples are tried, so
/// this takes the same time however long the contents are.
bool resembles(Content const& content, Content const& candidate);

} // namespace tav
