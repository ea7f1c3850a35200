/// Texts merged by lines.
#pragma once

#include <optional>
#include <string>

namespace tav {

/// The text with the changes of both sides. None when they overlap or touch and are not the same change, or when one of
/// the three is no text that is merged by lines: it has a NUL in its first 8,000 bytes, is longer than 1 MiB, has more
/// than 50,000 lines (the time grows with their square), or other line ends than the others.
std::optional<std::string> mergeLines(std::string const& base, std::string const& mine, std::string const& theirs);

} // namespace tav
