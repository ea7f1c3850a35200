/// From the preview picture of a drawing to pixels.
#pragma once

#include "host/pictures/image.h"

#include "preview/mu_preview.h"

#include <optional>

namespace tav {

/// The pixels of a picture that was found in bytes. Memory is taken for the size that `picture` has, which is within
/// the limits of the search. Nothing for a metafile, a bitmap of run lengths, and a picture whose content is damaged.
std::optional<Image> decode(preview::Preview const& picture);

} // namespace tav
