// Any bytes as a drawing: its picture is decoded, made smaller, written, compared and shown.
#include "preview/mu_preview.h"

#include "host/pictures/comparison.h"
#include "host/pictures/picture.h"
#include "host/pictures/png_file.h"
#include "host/pictures/scaling.h"
#include "host/pictures/terminal.h"

#include <cstdlib>
#include <optional>

namespace {

constexpr preview::Limits kLimits = {1U << 14U, 1U << 16U};

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

void use(tav::Image const& image)
{
    std::optional<tav::Image> const again = tav::decodePng(tav::encodePng(image), kLimits.pixels);
    require(again && *again == image);
    tav::Image const small = tav::scaledToFit(image, 16, 12);
    require(small.width() <= 16 && small.height() <= 12);
    tav::Comparison const same = tav::compare(small, small);
    require(same.removed == 0 && same.added == 0 && same.recolored == 0);
    tav::compare(small, image);
    require(!tav::pictureText(tav::PictureProtocol::sixel, small).empty());
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    preview::Preview const found = preview::find({reinterpret_cast<char const*>(data), size}, kLimits);
    if (found.status != preview::Status::found) {
        return 0;
    }
    if (std::optional<tav::Image> const image = tav::decode(found)) {
        require(image->width() == found.width && image->height() == found.height);
        use(*image);
    }
    return 0;
}
