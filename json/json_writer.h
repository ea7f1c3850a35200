/// Writing a value as JSON text.
#pragma once

#include "json/json_export.h"
#include "json/json_value.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <cwctype>
#include <functional>
#include <sstream>
#include <string>
#include <string_view>
#include <vector>

namespace kutils::json {

/// The text of `value`, without a line feed at its end, in time proportional to its length. Throws `std::bad_alloc`
/// when there is no memory for it, and `std::length_error` when it would be longer than a string can be.
///
/// Members are in ascending order of their keys. Reals are written in fixed notation with 16 decimals, so a real with
/// more decimals does not read back unchanged; infinity and NaN become `inf` and `nan`, which cannot be read back at
/// all. With `pretty`, each item is on its own line, indented four spaces more than its container, and a key is
/// followed by ` : `; without it, there are no spaces and no line feeds.
///
/// A character that is not printable is written as `\u` and the four hexadecimal digits of its low 16 bits. The C
/// library decides which characters are printable, by the current locale of the process: in the "C" locale no character
/// beyond ASCII is. A character above U+FFFF that is not printable therefore loses its upper bits. Nothing else depends
/// on any locale.
///
/// The value may be nested as deep as memory allows, but the indentation of the pretty layout grows with the square of
/// the depth.
KUTILS_JSON_EXPORT std::wstring write_string(Value const& value, bool pretty);

namespace detail {

/// `text` with every character escaped that must be escaped in a string.
KUTILS_JSON_EXPORT std::wstring add_esc_chars(std::wstring const& text);

/// If `c` has an escape of two characters, appends that to `text` and returns true: backspace, tab, line feed, form
/// feed, carriage return, quote and backslash. The slash has none.
KUTILS_JSON_EXPORT bool add_esc_char(wchar_t c, std::wstring& text);

/// `\u` and four upper-case hexadecimal digits for the low 16 bits of `c`.
KUTILS_JSON_EXPORT std::wstring non_printable_to_string(unsigned c);

/// The characters that are written unescaped: the printable ones that need no escape. ASCII follows the locale at the
/// time of construction; all other characters follow the locale at the time of the call.
class KUTILS_JSON_EXPORT Plain_chars {
public:
    Plain_chars();

    bool contains(wchar_t c) const
    {
        auto const code = static_cast<std::uint32_t>(c);
        return code < ascii_.size() ? ascii_[code] : std::iswprint(code) != 0;
    }

private:
    std::array<bool, 128> ascii_;
};

/// Writes texts to a stream, one after another. The stream must outlive the generator. When an operation throws, the
/// stream has received a part of the text, and the generator must not be used any more.
template <class Value, class Stream>
class KUTILS_JSON_EXPORT Generator {
public:
    using String = typename Value::String;
    using Char = typename String::value_type;
    using Object = typename Value::Object;
    using Array = typename Value::Array;
    using Member = typename Object::value_type;

    Generator(Stream& stream, bool pretty);

    void output(Value const& value);
    void output(String const& text);
    void output(bool value);
    void output(Member const& member);
    /// Writes an `Array` or `Object` between the given brackets.
    template <class Container>
    void output_array_or_obj(Container const& container, Char open, Char close);

    /// Write a document piece by piece, when it is too large to be built as a value first. Containers are begun and
    /// ended, a member is a key followed by a value or container, and `element` announces an element in the same way.
    /// Do not mix this with the operations above: they end all open containers.
    ///@{
    void begin_object() { begin({L'}'}, L'{'); }
    void begin_array() { begin({L']'}, L'['); }
    void key(std::basic_string_view<Char> text);
    void element() { startItem(); }
    void value(Value const& value);
    void value(std::basic_string_view<Char> text) { placeText(text); }
    void value(bool value) { place(value); }
    /// Only a bool is written as a bool; a pointer is not.
    template <class T>
    void value(T const*) = delete;
    void value(std::uint64_t value);
    /// Ends the innermost container.
    void end() { leave(); }
    /// Passes what was written so far to the stream.
    void flush();
    ///@}

private:
    /// An open container. One that is a value has the item that is due in `array` or `object`.
    struct Level {
        Char close;
        Array const* array = nullptr;
        Object const* object = nullptr;
        typename Array::const_iterator element{};
        typename Object::const_iterator member{};
        bool isEmpty = true; ///< Nothing has been written of it yet.
    };

    void place(Value const& value);
    void placeText(std::basic_string_view<Char> text);
    void place(bool value);
    void place(Member const& member);
    void placeKey(std::basic_string_view<Char> text);
    void placeReal(double value);
    void begin(Level level, Char open);
    void enter(Array const& array, Char open, Char close);
    void enter(Object const& object, Char open, Char close);
    void startItem();
    void placeItem();
    void leave();
    void startLine();
    void finish(std::size_t depth);

    void append(Char c)
    {
        *room(1) = c;
        ++used_;
    }
    void append(Char const* text, std::size_t length);
    void append(char const* begin, char const* end);
    /// Does nothing and returns false for a text that has to be escaped, or is too long for the buffer.
    bool appendPlain(std::basic_string_view<Char> text);
    Char* room(std::size_t length);

    Stream& stream_;
    bool const pretty_;
    Plain_chars const plain_;
    std::vector<Level> levels_;
    String lineStart_; ///< A line feed and as many spaces as were needed so far.
    String buffer_;    ///< Its first `used_` characters are still to go to the stream.
    std::size_t used_ = 0;
};

extern template class Generator<Value, std::wostringstream>;

/// The text of a document that `write` writes piece by piece, and that is likely to be `expectedLength` long.
KUTILS_JSON_EXPORT std::wstring write_pieces(
    std::size_t expectedLength, bool pretty,
    std::function<void(Generator<Value, std::wostringstream>& generator)> const& write);

} // namespace detail
} // namespace kutils::json
