#include "host/cli/small_pictures.h"

#include "host/cli/drawing_version.h"
#include "host/errors/failure.h"
#include "host/pictures/scaling.h"

#include <cstdint>
#include <cstdlib>
#include <optional>
#include <string_view>
#include <unistd.h>
#include <utility>

namespace tav {

namespace {

constexpr std::uint32_t kWidth = 160;
constexpr std::uint32_t kHeight = 120;

bool isDrawing(OdString const& path)
{
    std::string const extension = path.right(4).ansi_str();
    return extension == ".dwg" || extension == ".DWG";
}

} // namespace

SmallPictures::SmallPictures(common::RootPath root)
    : root_(std::move(root))
    , protocol_(pictureProtocol(isatty(STDOUT_FILENO) == 1, std::getenv))
{
}

std::string SmallPictures::textFor(OdString const& url, OdString const& path) const
{
    if (!canBeShown() || url.isEmpty() || !isDrawing(path)) {
        return {};
    }
    try {
        std::optional<Image> image = storedPictureIfAny(root_, url);
        return image ? pictureText(protocol_, scaledToFit(std::move(*image), kWidth, kHeight)) : std::string();
    } catch (Failure const&) {
        return {};
    }
}

} // namespace tav
