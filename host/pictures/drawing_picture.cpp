#include "host/pictures/drawing_picture.h"

#include "host/pictures/picture.h"

#include "preview/mu_preview.h"

#include <utility>

namespace tav {

DrawingPicture pictureIn(std::string_view drawing)
{
    preview::Preview const found = preview::find(drawing);
    if (found.status != preview::Status::found) {
        return {std::nullopt, found.reason};
    }
    if (found.kind == preview::Kind::metafile) {
        return {std::nullopt, "Its picture is a metafile, which is not shown."};
    }
    auto image = decode(found);
    return image ? DrawingPicture{std::move(image), ""} : DrawingPicture{std::nullopt, "Its picture is damaged."};
}

} // namespace tav
