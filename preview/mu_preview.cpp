#include "preview/mu_preview.h"

#include "preview/picture_headers.h"

#include <algorithm>
#include <array>

namespace preview {

namespace {

using detail::byteAt;
using detail::littleEndian32;

constexpr std::size_t kHeadSize = 17; ///< "AC10", two digits, seven other bytes, and where the preview begins
constexpr std::size_t kPlaceAt = 13;
constexpr std::string_view kMark("\x1F\x25\x6D\x07\xD4\x36\x28\x28\x9D\x57\xCA\x3F\x9D\x44\x10\x2B", 16);
constexpr std::size_t kListAt = 21; ///< after the mark, a length of 32 bits and the number of entries
constexpr std::size_t kEntrySize = 9;
constexpr std::size_t kMaxEntries = 255;

// In the order in which they are preferred.
struct KindOfEntry {
    std::uint32_t code;
    Kind kind;
};
constexpr std::array<KindOfEntry, 3> kKinds = {{{6, Kind::png}, {2, Kind::bitmap}, {3, Kind::metafile}}};

Preview refusal(Status status, char const* reason)
{
    Preview result;
    result.status = status;
    result.reason = reason;
    return result;
}

Preview damaged(char const* reason)
{
    return refusal(Status::damaged, reason);
}

Preview unreadable()
{
    return refusal(Status::unreadable, "The drawing could not be read.");
}

Preview noPicture()
{
    return refusal(Status::none, "The drawing has no preview picture.");
}

bool isDigit(char c)
{
    return c >= '0' && c <= '9';
}

bool isDrawing(std::string_view head)
{
    return head.size() >= 6 && head.substr(0, 4) == "AC10" && isDigit(head[4]) && isDigit(head[5]);
}

bool canHavePreview(std::string_view head)
{
    return head.substr(4, 2) >= "12";
}

class Finder {
public:
    Finder(Source& source, Limits const& limits) : source_(source), limits_(limits), size_(source.size()) {}

    Preview find()
    {
        std::array<char, kHeadSize> buffer;
        std::string_view const head(buffer.data(), std::min<std::uint64_t>(size_, buffer.size()));
        if (!source_.read(0, buffer.data(), head.size())) {
            return unreadable();
        }
        if (!isDrawing(head)) {
            return refusal(Status::none, "The bytes are not a drawing.");
        }
        if (!canHavePreview(head)) {
            return refusal(Status::none, "Drawings of this version have no preview picture.");
        }
        if (head.size() < kHeadSize) {
            return damaged("The drawing ends before the place of its preview.");
        }
        std::uint32_t const place = littleEndian32(head, kPlaceAt);
        return place == 0 ? noPicture() : findAt(place);
    }

private:
    Preview findAt(std::uint64_t place)
    {
        place_ = place;
        if (place < kHeadSize || place + kListAt > size_) {
            return damaged("The place of the preview is not inside the drawing.");
        }
        std::array<char, kListAt> buffer;
        if (!source_.read(place, buffer.data(), buffer.size())) {
            return unreadable();
        }
        std::string_view const head(buffer.data(), buffer.size());
        if (head.substr(0, kMark.size()) != kMark) {
            return damaged("The preview does not begin with its mark.");
        }
        std::uint64_t const length = littleEndian32(head, kMark.size());
        listSize_ = byteAt(head, kListAt - 1) * kEntrySize;
        if (length < 1 + listSize_) {
            return damaged("The preview is shorter than its list of pictures.");
        }
        if (place + kListAt - 1 + length > size_) {
            return damaged("The preview ends after the end of the drawing.");
        }
        return findInList();
    }

    Preview findInList()
    {
        std::array<char, kMaxEntries * kEntrySize> buffer;
        std::string_view const list(buffer.data(), listSize_);
        if (!source_.read(place_ + kListAt, buffer.data(), list.size())) {
            return unreadable();
        }
        Preview best = noPicture();
        for (KindOfEntry const& wanted : kKinds) {
            Preview const candidate = findKind(list, wanted);
            if (candidate.status == Status::found || candidate.status == Status::unreadable) {
                return candidate;
            }
            if (best.status == Status::none) {
                best = candidate;
            }
        }
        return best;
    }

    Preview findKind(std::string_view list, KindOfEntry const& wanted)
    {
        for (; !list.empty(); list.remove_prefix(kEntrySize)) {
            std::uint32_t const length = littleEndian32(list, 5);
            if (byteAt(list, 0) == wanted.code && length != 0) {
                return check(wanted.kind, littleEndian32(list, 1), length);
            }
        }
        return noPicture();
    }

    Preview check(Kind kind, std::uint64_t offset, std::uint32_t length)
    {
        if (offset + length > size_) {
            return damaged("A picture ends after the end of the drawing.");
        }
        bool const isBeforeList = offset >= kHeadSize && offset + length <= place_;
        if (!isBeforeList && offset < place_ + kListAt + listSize_) {
            return damaged("A picture overlaps the list of pictures.");
        }
        if (length > limits_.bytes) {
            return refusal(Status::tooLarge, "The picture has too many bytes.");
        }
        Preview result;
        result.status = Status::found;
        result.kind = kind;
        result.offset = offset;
        result.length = length;
        return kind == Kind::metafile ? result : checkHeader(result);
    }

    Preview checkHeader(Preview picture)
    {
        std::array<char, detail::kMaxHeaderSize> buffer;
        std::string_view const header(buffer.data(), std::min<std::size_t>(picture.length, buffer.size()));
        if (!source_.read(picture.offset, buffer.data(), header.size())) {
            return unreadable();
        }
        auto const read = picture.kind == Kind::png ? detail::readPngHeader : detail::readBitmapHeader;
        if (char const* problem = read(header, picture)) {
            return damaged(problem);
        }
        bool const isTooLarge = std::uint64_t(picture.width) * picture.height > limits_.pixels;
        return isTooLarge ? refusal(Status::tooLarge, "The picture has too many pixels.") : picture;
    }

    Source& source_;
    Limits limits_;
    std::uint64_t size_;
    std::uint64_t place_ = 0;  ///< where the preview begins
    std::size_t listSize_ = 0; ///< of all entries
};

class Memory final : public Source {
public:
    explicit Memory(std::string_view bytes) : bytes_(bytes) {}

    std::uint64_t size() const override { return bytes_.size(); }
    bool read(std::uint64_t offset, char* bytes, std::size_t count) override
    {
        bytes_.copy(bytes, count, offset);
        return true;
    }

private:
    std::string_view bytes_;
};

} // namespace

Preview find(std::string_view drawing, Limits const& limits)
{
    Memory memory(drawing);
    Preview result = find(memory, limits);
    if (result.status == Status::found) {
        result.bytes = drawing.substr(result.offset, result.length);
    }
    return result;
}

Preview find(Source& source, Limits const& limits)
{
    return Finder(source, limits).find();
}

} // namespace preview
