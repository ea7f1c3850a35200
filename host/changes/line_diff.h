/// Differences of texts, line by line.
#pragma once

#include <optional>
#include <string>

namespace tav {

/// No more than so many bytes of a text are compared line by line.
inline constexpr std::size_t kLongestText = std::size_t{1} << 20;

/// The differences in the unified form, without file names; none when one of the two is no text in UTF-8 or is longer
/// than `kLongestText`.
std::optional<std::string> lineDiff(std::string const& before, std::string const& after);

} // namespace tav
