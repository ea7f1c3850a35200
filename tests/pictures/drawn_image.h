/// Pictures for tests, drawn with letters.
#pragma once

#include "host/pictures/image.h"

#include <cstdint>
#include <string>
#include <vector>

namespace tav {

inline Color colorOf(char letter)
{
    switch (letter) {
    case '.': return {255, 255, 255};
    case '#': return {0, 0, 0};
    case 'r': return {255, 0, 0};
    case 'g': return {0, 255, 0};
    case 'b': return {0, 0, 255};
    default: return {128, 128, 128};
    }
}

inline Image drawn(std::vector<std::string> const& rows)
{
    Image image(static_cast<std::uint32_t>(rows[0].size()), static_cast<std::uint32_t>(rows.size()));
    for (std::uint32_t y = 0; y < image.height(); ++y) {
        for (std::uint32_t x = 0; x < image.width(); ++x) {
            image.row(y)[x] = colorOf(rows[y][x]);
        }
    }
    return image;
}

} // namespace tav
