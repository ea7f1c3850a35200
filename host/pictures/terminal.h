/// Pictures in a terminal.
#pragma once

#include "host/pictures/image.h"

#include <functional>
#include <string>
#include <string_view>

namespace tav {

/// How a terminal takes pictures.
enum class PictureProtocol { none, kitty, iterm2, sixel };

/// The value of an environment variable, null when it is not set: what `std::getenv` does.
using Environment = std::function<char const*(char const*)>;

/// The protocol of the terminal that the output goes to, as far as its environment variables tell; `none` when it is
/// not a terminal, when nothing is known, and inside a terminal multiplexer, which would pass on a part of a picture.
/// A terminal is never asked: its answer could come late and be taken for input.
PictureProtocol pictureProtocol(bool isTerminal, Environment const& environment);

/// What shows `image` in a terminal of this protocol, with a line feed behind it; empty for `none`.
std::string pictureText(PictureProtocol protocol, Image const& image);

} // namespace tav
