#include "host/pictures/picture.h"

#include "host/pictures/bitmap_rows.h"
#include "host/pictures/png_file.h"

namespace tav {

std::optional<Image> decode(preview::Preview const& picture)
{
    switch (picture.kind) {
    case preview::Kind::bitmap: return copyRows(picture);
    case preview::Kind::png: return decodePng(picture.bytes, std::uint64_t(picture.width) * picture.height);
    case preview::Kind::metafile:
    case preview::Kind::none: break;
    }
    return std::nullopt;
}

} // namespace tav
