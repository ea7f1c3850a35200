/// Bitmaps without compression.
#pragma once

#include "host/pictures/image.h"

#include "preview/mu_preview.h"

#include <optional>

namespace tav {

/// The pixels of a bitmap. Nothing when they are run lengths.
std::optional<Image> copyRows(preview::Preview const& bitmap);

} // namespace tav
