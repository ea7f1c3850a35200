#include "json/json_writer.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <ios>
#include <new>
#include <streambuf>
#include <utility>

#include <sys/mman.h>
#include <unistd.h>

namespace kutils::json {
namespace detail {
namespace {

constexpr std::size_t kBufferSize = 4096;

// The largest reals have 309 digits before the point.
using NumberText = std::array<char, 400>;

constexpr wchar_t escapeLetter(wchar_t c)
{
    switch (c) {
    case L'\b': return L'b';
    case L'\t': return L't';
    case L'\n': return L'n';
    case L'\f': return L'f';
    case L'\r': return L'r';
    case L'"':
    case L'\\': return c;
    default: return L'\0';
    }
}

void addHexEscape(unsigned c, std::wstring& text)
{
    text += L"\\u";
    for (int shift = 12; shift >= 0; shift -= 4) {
        text += L"0123456789ABCDEF"[(c >> shift) & 15];
    }
}

std::wstring escape(std::wstring_view text, Plain_chars const& plain)
{
    std::wstring escaped;
    for (wchar_t const c : text) {
        if (plain.contains(c)) {
            escaped += c;
        } else if (!add_esc_char(c, escaped)) {
            addHexEscape(static_cast<unsigned>(c), escaped);
        }
    }
    return escaped;
}

char const* writeInteger(Value const& value, NumberText& text)
{
    char* const end = text.data() + text.size();
    if (value.is_uint64()) {
        return std::to_chars(text.data(), end, value.get_uint64()).ptr;
    }
    return std::to_chars(text.data(), end, value.get_int64()).ptr;
}

/// Tells how long the text of a value will be, so that it is put where it stays. Escapes and reals count at their
/// shortest, and what is nested deeper than any real document does not count at all, so that recursion is safe.
/// Of long arrays, the bulk of every large document, only a sample counts: to measure a million records takes 0.15 s,
/// to write them 0.4 s. Each value is visited once at most. A text that becomes longer than it seemed is moved once
/// more; what is not written to takes no memory.
class LengthEstimate {
public:
    explicit LengthEstimate(bool pretty) : pretty_(pretty) {}

    std::size_t of(Value const& value, std::size_t depth = 0) const
    {
        switch (value.type()) {
        case Value_type::object: return ofContainer(value.get_object(), depth);
        case Value_type::array: return ofArray(value.get_array(), depth);
        case Value_type::string: return value.get_string().size() + 2;
        case Value_type::integer: return ofInteger(value);
        case Value_type::real: return 18;
        default: return 4;
        }
    }

private:
    std::size_t of(Object::value_type const& member, std::size_t depth) const
    {
        return member.first.size() + (pretty_ ? 5 : 3) + of(member.second, depth);
    }

    template <class Container>
    std::size_t ofContainer(Container const& container, std::size_t depth) const
    {
        std::size_t length = 2 + lineStart(depth);
        if (depth == kDeepest) {
            return length;
        }
        for (auto const& item : container) {
            length += ofItem(item, depth + 1);
        }
        return length;
    }

    // Visits no element twice: in nested arrays that would double the work at every level.
    std::size_t ofArray(Array const& array, std::size_t depth) const
    {
        std::size_t const stride = array.size() / kSample;
        if (stride < 2 || depth == kDeepest) {
            return ofContainer(array, depth);
        }
        std::size_t sample = 0;
        std::size_t longest = 0;
        for (std::size_t i = 0; i < array.size(); i += stride) {
            std::size_t const item = ofItem(array[i], depth + 1);
            sample += item;
            longest = std::max(longest, item);
        }
        std::size_t const sampled = (array.size() + stride - 1) / stride;
        return longest > kLongItem ? sample + ofTheOthers(array, depth, stride) : sample / sampled * array.size();
    }

    std::size_t ofTheOthers(Array const& array, std::size_t depth, std::size_t stride) const
    {
        std::size_t length = 0;
        for (std::size_t i = 0; i < array.size(); ++i) {
            length += i % stride != 0 ? ofItem(array[i], depth + 1) : 0;
        }
        return length;
    }

    template <class Item>
    std::size_t ofItem(Item const& item, std::size_t depth) const
    {
        return 1 + lineStart(depth) + of(item, depth);
    }

    static std::size_t ofInteger(Value const& value)
    {
        NumberText text;
        return static_cast<std::size_t>(writeInteger(value, text) - text.data());
    }

    std::size_t lineStart(std::size_t depth) const { return pretty_ ? 1 + 4 * depth : 0; }

    static constexpr std::size_t kDeepest = 64;
    static constexpr std::size_t kSample = 1024;
    static constexpr std::size_t kLongItem = 16'384; // A few of these in the sample would mislead by far too much.

    bool const pretty_;
};

// The first touch of a page costs more than writing the text into it: with large pages a million records, 212 million
// characters, take 0.43 s instead of 0.98 s. Smaller blocks may be parts of the heap, and the advice would stay with
// them.
void adviseLargePages(std::wstring& text)
{
    constexpr std::size_t kAlwaysMapped = std::size_t{32} << 20;
    std::size_t const size = text.capacity() * sizeof(wchar_t);
    if (size <= kAlwaysMapped) {
        return;
    }
    auto const page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    auto const start = reinterpret_cast<std::uintptr_t>(text.data());
    std::uintptr_t const first = (start + page - 1) / page * page;
    std::uintptr_t const last = (start + size) / page * page;
    madvise(reinterpret_cast<char*>(text.data()) + (first - start), last - first, MADV_HUGEPAGE);
}

/// A string stream that hands out its text without copying it.
class TextStream : public std::wostringstream {
public:
    explicit TextStream(std::size_t expectedLength)
    {
        reserve(expectedLength + expectedLength / 8);
        std::wios::rdbuf(&buffer_);
        exceptions(std::ios_base::badbit); // Lets what the allocation throws pass.
    }

    std::wstring take() { return std::move(buffer_.text); }

private:
    // The expected length is a guess. Where that much memory is not to be had, the text may still fit as it grows.
    void reserve(std::size_t length)
    {
        try {
            buffer_.text.reserve(std::min(length, buffer_.text.max_size()));
            adviseLargePages(buffer_.text);
        } catch (std::bad_alloc const&) {
            return;
        }
    }

    class Buffer : public std::wstreambuf {
    public:
        std::wstring text;

    private:
        std::streamsize xsputn(wchar_t const* characters, std::streamsize count) override
        {
            text.append(characters, static_cast<std::size_t>(count));
            return count;
        }
    };

    Buffer buffer_;
};

} // namespace

std::wstring add_esc_chars(std::wstring const& text)
{
    return escape(text, Plain_chars());
}

bool add_esc_char(wchar_t c, std::wstring& text)
{
    wchar_t const letter = escapeLetter(c);
    if (letter == L'\0') {
        return false;
    }
    text += L'\\';
    text += letter;
    return true;
}

std::wstring non_printable_to_string(unsigned c)
{
    std::wstring text;
    addHexEscape(c, text);
    return text;
}

Plain_chars::Plain_chars()
{
    for (int c = 0; c < 128; ++c) {
        ascii_[static_cast<std::size_t>(c)] = std::isprint(c) && escapeLetter(static_cast<wchar_t>(c)) == L'\0';
    }
}

template <class Value, class Stream>
Generator<Value, Stream>::Generator(Stream& stream, bool pretty)
    : stream_(stream)
    , pretty_(pretty)
    , lineStart_(1, L'\n')
    , buffer_(kBufferSize, Char())
{
}

template <class Value, class Stream>
void Generator<Value, Stream>::output(Value const& value)
{
    place(value);
    finish(0);
    flush();
}

template <class Value, class Stream>
void Generator<Value, Stream>::output(String const& text)
{
    placeText(text);
    flush();
}

template <class Value, class Stream>
void Generator<Value, Stream>::output(bool value)
{
    place(value);
    flush();
}

template <class Value, class Stream>
void Generator<Value, Stream>::output(Member const& member)
{
    place(member);
    finish(0);
    flush();
}

template <class Value, class Stream>
template <class Container>
void Generator<Value, Stream>::output_array_or_obj(Container const& container, Char open, Char close)
{
    enter(container, open, close);
    finish(0);
    flush();
}

template <class Value, class Stream>
void Generator<Value, Stream>::key(std::basic_string_view<Char> text)
{
    startItem();
    placeKey(text);
}

template <class Value, class Stream>
void Generator<Value, Stream>::value(Value const& value)
{
    std::size_t const depth = levels_.size();
    place(value);
    finish(depth);
}

template <class Value, class Stream>
void Generator<Value, Stream>::value(std::uint64_t value)
{
    NumberText text;
    append(text.data(), std::to_chars(text.data(), text.data() + text.size(), value).ptr);
}

// Writes the rest of the open containers but for the outermost `depth`.
template <class Value, class Stream>
void Generator<Value, Stream>::finish(std::size_t depth)
{
    while (levels_.size() > depth) {
        placeItem();
    }
}

template <class Value, class Stream>
void Generator<Value, Stream>::place(Value const& value)
{
    switch (value.type()) {
    case Value_type::object: return enter(value.get_object(), L'{', L'}');
    case Value_type::array: return enter(value.get_array(), L'[', L']');
    case Value_type::string: return placeText(value.get_string());
    case Value_type::boolean: return place(value.get_bool());
    case Value_type::integer: {
        NumberText text;
        return append(text.data(), writeInteger(value, text));
    }
    case Value_type::real: return placeReal(value.get_real());
    case Value_type::null: return append(L"null", 4);
    }
}

template <class Value, class Stream>
void Generator<Value, Stream>::placeText(std::basic_string_view<Char> text)
{
    append(L'"');
    if (!appendPlain(text)) {
        String const escaped = escape(text, plain_);
        append(escaped.data(), escaped.size());
    }
    append(L'"');
}

template <class Value, class Stream>
void Generator<Value, Stream>::place(bool value)
{
    if (value) {
        append(L"true", 4);
    } else {
        append(L"false", 5);
    }
}

template <class Value, class Stream>
void Generator<Value, Stream>::place(Member const& member)
{
    placeKey(member.first);
    place(member.second);
}

template <class Value, class Stream>
void Generator<Value, Stream>::placeKey(std::basic_string_view<Char> text)
{
    placeText(text);
    if (pretty_) {
        append(L" : ", 3);
    } else {
        append(L':');
    }
}

template <class Value, class Stream>
void Generator<Value, Stream>::placeReal(double value)
{
    NumberText text;
    char* const end = text.data() + text.size();
    append(text.data(), std::to_chars(text.data(), end, value, std::chars_format::fixed, 16).ptr);
}

template <class Value, class Stream>
void Generator<Value, Stream>::begin(Level level, Char open)
{
    levels_.push_back(level);
    append(open);
}

template <class Value, class Stream>
void Generator<Value, Stream>::enter(Array const& array, Char open, Char close)
{
    begin({close, &array, nullptr, array.begin(), {}}, open);
}

template <class Value, class Stream>
void Generator<Value, Stream>::enter(Object const& object, Char open, Char close)
{
    begin({close, nullptr, &object, {}, object.begin()}, open);
}

// Goes to where the next item of the innermost container stands.
template <class Value, class Stream>
void Generator<Value, Stream>::startItem()
{
    bool& isEmpty = levels_.back().isEmpty;
    if (!isEmpty) {
        append(L',');
    }
    isEmpty = false;
    startLine();
}

// Writes the item that is due in the innermost open container, or the end of the container.
template <class Value, class Stream>
void Generator<Value, Stream>::placeItem()
{
    Level& level = levels_.back();
    if (level.array ? level.element == level.array->end() : level.member == level.object->end()) {
        return leave();
    }
    startItem();
    if (level.array) {
        place(*level.element++);
    } else {
        place(*level.member++);
    }
}

template <class Value, class Stream>
void Generator<Value, Stream>::leave()
{
    Char const close = levels_.back().close;
    levels_.pop_back();
    startLine();
    append(close);
}

template <class Value, class Stream>
void Generator<Value, Stream>::startLine()
{
    if (!pretty_) {
        return;
    }
    std::size_t const length = 1 + 4 * levels_.size();
    if (lineStart_.size() < length) {
        lineStart_.resize(length, L' ');
    }
    append(lineStart_.data(), length);
}

template <class Value, class Stream>
void Generator<Value, Stream>::append(Char const* text, std::size_t length)
{
    if (length <= kBufferSize) {
        std::copy_n(text, length, room(length));
        used_ += length;
        return;
    }
    flush();
    stream_.write(text, static_cast<std::streamsize>(length));
}

template <class Value, class Stream>
void Generator<Value, Stream>::append(char const* begin, char const* end)
{
    auto const length = static_cast<std::size_t>(end - begin);
    std::copy(begin, end, room(length));
    used_ += length;
}

template <class Value, class Stream>
bool Generator<Value, Stream>::appendPlain(std::basic_string_view<Char> text)
{
    if (text.size() > kBufferSize) {
        return false;
    }
    Char* out = room(text.size());
    for (Char const c : text) {
        if (!plain_.contains(c)) {
            return false;
        }
        *out++ = c;
    }
    used_ += text.size();
    return true;
}

// Where the next `length` characters, no more than the whole buffer takes, can be put.
template <class Value, class Stream>
auto Generator<Value, Stream>::room(std::size_t length) -> Char*
{
    if (length > kBufferSize - used_) {
        flush();
    }
    return buffer_.data() + used_;
}

template <class Value, class Stream>
void Generator<Value, Stream>::flush()
{
    stream_.write(buffer_.data(), static_cast<std::streamsize>(used_));
    used_ = 0;
}

template class Generator<Value, std::wostringstream>;
template void Generator<Value, std::wostringstream>::output_array_or_obj(Array const&, wchar_t, wchar_t);
template void Generator<Value, std::wostringstream>::output_array_or_obj(Object const&, wchar_t, wchar_t);

std::wstring write_pieces(
    std::size_t expectedLength, bool pretty,
    std::function<void(Generator<Value, std::wostringstream>& generator)> const& write)
{
    TextStream stream(expectedLength);
    Generator<Value, std::wostringstream> generator(stream, pretty);
    write(generator);
    generator.flush();
    return stream.take();
}

} // namespace detail

std::wstring write_string(Value const& value, bool pretty)
{
    detail::TextStream stream(detail::LengthEstimate(pretty).of(value));
    detail::Generator<Value, std::wostringstream>(stream, pretty).output(value);
    return stream.take();
}

} // namespace kutils::json
