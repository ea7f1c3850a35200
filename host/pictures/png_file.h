/// PNG files, read and written by libpng.
#pragma once

#include "host/pictures/image.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace tav {

/// The pixels of a PNG file, on a white ground where it is transparent. Nothing when it is damaged or has more than
/// `maxPixels`: that is checked before memory is taken for them.
std::optional<Image> decodePng(std::string_view file, std::uint64_t maxPixels);

/// A PNG file of `image`.
std::string encodePng(Image const& image);

} // namespace tav
