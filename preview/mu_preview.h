/// The preview picture of a drawing, found in the bytes of its file.
///
/// Most programs that write drawings put a small picture of the drawing near the beginning of the file: a bitmap, a PNG
/// or a metafile. `preview::find` finds it and checks every field on the way, so that a caller can hand the picture to
/// a decoder. Nothing else in the drawing is read.
///
/// The library needs nothing but the C++ library. It keeps no state, so any thread may call it. It allocates nothing
/// and reads less than 3 KiB of a drawing, whatever the content.
///
///     preview::Preview const found = preview::find(bytesOfTheDrawing);
///     if (found.status == preview::Status::found && found.kind == preview::Kind::png) {
///         show(found.bytes);
///     }
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

/// Marks the exported symbols of libmu_preview; all others are hidden.
#define MU_PREVIEW_EXPORT __attribute__((visibility("default")))

namespace preview {

/// The outcome of a search.
enum class Status : std::uint8_t {
    found,     ///< there is a picture, and its fields are consistent
    none,      ///< the bytes are not a drawing, or a drawing without a picture
    damaged,   ///< a field contradicts another one, or points outside the file
    tooLarge,  ///< the picture claims more than the limits allow
    unreadable ///< the source could not be read
};

/// The form of a picture.
enum class Kind : std::uint8_t {
    none,    ///< no picture was found
    bitmap,  ///< a device-independent bitmap without the file header that a .bmp file begins with
    png,     ///< a PNG file
    metafile ///< a Windows metafile; only its place is checked, and its size in pixels is not known
};

/// The largest picture that is accepted. Real previews are far smaller: a few hundred pixels on each side.
struct Limits {
    std::uint64_t pixels = std::uint64_t(1) << 24U; ///< width times height
    std::uint64_t bytes = std::uint64_t(1) << 26U;  ///< length of the picture in the file
};

/// Where the parts of a bitmap are, as offsets from its first byte. All of them are inside the bitmap, and so are the
/// rows of an uncompressed one.
///
/// A file header turns the bitmap into a .bmp file. Its 14 bytes are, little-endian: "BM", 32 bits with the length of
/// the bitmap plus 14, 32 zero bits, and 32 bits with `pixels` plus 14.
struct BitmapLayout {
    std::uint32_t bitsPerPixel = 0;  ///< 1, 4, 8, 16, 24 or 32
    std::uint32_t compression = 0;   ///< as in the header: 0 none, 1 and 2 run lengths, 3 and 6 none but with masks
    std::uint32_t masks = 0;         ///< of red, green and blue, 32 bits each; 0 when there are none
    std::uint32_t palette = 0;       ///< blue, green, red and, in entries of four bytes, an unused byte
    std::uint32_t colors = 0;        ///< number of entries in the palette
    std::uint32_t bytesPerColor = 0; ///< 3 after a header of 12 bytes, otherwise 4
    std::uint32_t pixels = 0;        ///< the first row
    std::uint32_t bytesPerRow = 0;   ///< padding included; 0 for run lengths
    bool isTopDown = false;          ///< the first row is the upper one; usually it is the lowest
};

/// The picture of a drawing, or why there is none.
struct Preview {
    Status status = Status::none; ///< `found` when there is a picture
    char const* reason = "";      ///< why there is no picture: an English sentence, never freed; "" when there is one
    Kind kind = Kind::none;       ///< this and all that follows is set when the status is `found`
    std::uint64_t offset = 0;     ///< of the picture in the drawing
    std::uint32_t length = 0;     ///< of the picture in bytes
    std::uint32_t width = 0;      ///< in pixels, at least 1; 0 for a metafile
    std::uint32_t height = 0;     ///< the same
    BitmapLayout bitmap;          ///< of a bitmap
    std::string_view bytes;       ///< the picture, inside the bytes given to `find`; empty when a `Source` was read
};

/// A drawing that is read piece by piece, for files too long to be loaded whole. `find` reads at most five
/// pieces: the first 17 bytes, the head and the entries of the preview, and the header of each picture that it tries.
class MU_PREVIEW_EXPORT Source {
public:
    /// Length of the drawing in bytes.
    virtual std::uint64_t size() const = 0;
    /// Reads `count` bytes at `offset` into `bytes`. They are inside the drawing, by its `size`. False when not all of
    /// them could be read: `find` then ends with the status `unreadable`.
    virtual bool read(std::uint64_t offset, char* bytes, std::size_t count) = 0;

protected:
    Source() = default;
    Source(Source const&) = default;
    Source& operator=(Source const&) = default;
    ~Source() = default;
};

/// Finds the picture of a drawing that is in memory. `bytes` of the result are valid as long as `drawing` is.
///
/// A drawing can have its picture in several forms. A PNG is preferred to a bitmap and a bitmap to a metafile, as long
/// as they are valid; when none of them is, the result says what is wrong with the preferred one. Entries without bytes
/// and entries of unknown kinds are ignored.
MU_PREVIEW_EXPORT Preview find(std::string_view drawing, Limits const& limits = {});

/// The same for a drawing that is read piece by piece. Exceptions of `source` are passed on.
MU_PREVIEW_EXPORT Preview find(Source& source, Limits const& limits = {});

} // namespace preview
