// Any bytes as a drawing: what is found is inside the drawing and within the limits, and reading piece by piece comes
// to the same as reading whole.
#include "preview/mu_preview.h"

#include <cstdlib>
#include <string_view>

namespace {

using preview::Kind;
using preview::Preview;
using preview::Status;

constexpr preview::Limits kLimits = {1U << 20U, 1U << 16U};

void require(bool holds)
{
    if (!holds) {
        std::abort();
    }
}

class Pieces final : public preview::Source {
public:
    explicit Pieces(std::string_view drawing) : drawing_(drawing) {}

    std::uint64_t size() const override { return drawing_.size(); }
    bool read(std::uint64_t offset, char* bytes, std::size_t count) override
    {
        require(offset <= drawing_.size() && count <= drawing_.size() - offset);
        drawing_.copy(bytes, count, offset);
        return true;
    }

private:
    std::string_view drawing_;
};

void checkBitmap(Preview const& picture)
{
    preview::BitmapLayout const& layout = picture.bitmap;
    require(layout.palette + std::uint64_t(layout.colors) * layout.bytesPerColor <= layout.pixels);
    require(layout.masks == 0 || layout.masks + 12 <= layout.pixels);
    require(layout.pixels < picture.length);
    require(std::uint64_t(layout.bytesPerRow) * picture.height <= picture.length - layout.pixels);
}

void checkPicture(Preview const& picture, std::string_view drawing)
{
    require(picture.offset <= drawing.size() && picture.length <= drawing.size() - picture.offset);
    require(picture.bytes == drawing.substr(picture.offset, picture.length));
    require(picture.length <= kLimits.bytes);
    require(std::uint64_t(picture.width) * picture.height <= kLimits.pixels);
    require((picture.width != 0 && picture.height != 0) == (picture.kind != Kind::metafile));
    if (picture.kind == Kind::bitmap) {
        checkBitmap(picture);
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string_view const drawing(reinterpret_cast<char const*>(data), size);
    Preview const found = preview::find(drawing, kLimits);
    require((found.status == Status::found) == (found.kind != Kind::none));
    require((found.status == Status::found) == (*found.reason == '\0'));
    if (found.status == Status::found) {
        checkPicture(found, drawing);
    }
    Pieces pieces(drawing);
    Preview const again = preview::find(pieces, kLimits);
    require(again.status == found.status && again.reason == found.reason && again.kind == found.kind);
    require(again.offset == found.offset && again.length == found.length);
    return 0;
}
