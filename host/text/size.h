/// Sizes as users write them.
#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace tav {

/// The bytes of a whole number that a unit may follow, with or without a space before it: kB, MB, GB or TB, thousands
/// each. None when `typed` is anything else, or too much for the result.
std::optional<std::uint64_t> parseSize(std::string const& typed);

} // namespace tav
