#include "host/pictures/png_file.h"

#include <new>
#include <png.h>

namespace tav {

namespace {

// What libpng knows of a file between two calls.
class PngState {
public:
    PngState() { image_.version = PNG_IMAGE_VERSION; }
    PngState(PngState const&) = delete;
    PngState& operator=(PngState const&) = delete;
    ~PngState() { png_image_free(&image_); }

    png_image& operator*() { return image_; }
    png_image* operator->() { return &image_; }

private:
    png_image image_ = {};
};

} // namespace

std::optional<Image> decodePng(std::string_view file, std::uint64_t maxPixels)
{
    PngState png;
    if (png_image_begin_read_from_memory(&*png, file.data(), file.size()) == 0 ||
        std::uint64_t(png->width) * png->height > maxPixels) {
        return std::nullopt;
    }
    png->format = PNG_FORMAT_RGB;
    Image image(png->width, png->height);
    png_color const white = {0xFF, 0xFF, 0xFF};
    if (png_image_finish_read(&*png, &white, image.bytes(), 0, nullptr) == 0) {
        return std::nullopt;
    }
    return image;
}

std::string encodePng(Image const& image)
{
    PngState png;
    png->width = image.width();
    png->height = image.height();
    png->format = PNG_FORMAT_RGB;
    png_alloc_size_t size = PNG_IMAGE_PNG_SIZE_MAX(*png);
    std::string file(size, '\0');
    if (png_image_write_to_memory(&*png, file.data(), &size, 0, image.bytes(), 0, nullptr) == 0) {
        throw std::bad_alloc(); // There is room for every image: nothing else fails.
    }
    file.resize(size);
    file.shrink_to_fit();
    return file;
}

} // namespace tav
