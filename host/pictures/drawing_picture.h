/// The picture that a drawing has in its file.
#pragma once

#include "host/pictures/image.h"

#include <optional>
#include <string>
#include <string_view>

namespace tav {

struct DrawingPicture {
    std::optional<Image> image;
    std::string reason; ///< why there is no image, an English sentence; else empty
};

/// The picture in the bytes of a drawing.
DrawingPicture pictureIn(std::string_view drawing);

} // namespace tav
