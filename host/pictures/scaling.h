/// Making pictures smaller.
#pragma once

#include "host/pictures/image.h"

#include <cstdint>

namespace tav {

/// `image` made so small that it fits, in its proportions; as it is when it fits already. Thin lines grow paler and do
/// not vanish: each pixel is the average of those that it covers. Both maxima are at least 1.
Image scaledToFit(Image image, std::uint32_t maxWidth, std::uint32_t maxHeight);

} // namespace tav
