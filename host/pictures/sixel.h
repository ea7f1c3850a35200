/// The form of pictures that terminals have known longest.
#pragma once

#include "host/pictures/image.h"

#include <string>

namespace tav {

/// `image` in sixels, bands of six rows, in 216 colors.
std::string sixelText(Image const& image);

} // namespace tav
