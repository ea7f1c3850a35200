/// How a document is read: tokens, values made of them, and long arrays that never become values. Callers that read
/// whole documents need only `json/json_reader.h`.
#pragma once

#include "platform/sdk/OdString.h"
#include "json/json_export.h"
#include "json/json_value.h"

#include <cstdint>
#include <string>
#include <vector>

namespace kutils::json::detail {

enum class Token_kind : std::int32_t {
    open_array,
    close_array,
    open_object,
    close_object,
    colon,
    comma,
    null_value,
    true_value,
    false_value,
    signed_integer,
    unsigned_integer,
    real,
    string,
    end,
    invalid,
};

template <class String>
struct Token {
    Token_kind kind = Token_kind::end;
    String text;              ///< of a string, without quotes and escapes; free to be moved from
    std::uint64_t number = 0; ///< of a number: its 64 bits, read according to the kind
};

/// Cuts a range of characters into tokens. The range must outlive the scanner.
///
/// The range is read as if it were followed by an endless sequence of the character 0. A character that turns out not
/// to belong to a token is put back for the next one, except the character 0: at the end of a number it is consumed.
template <class String, class Iterator>
class KUTILS_JSON_EXPORT Scanner {
public:
    using Char = typename String::value_type;

    Scanner(Iterator begin, Iterator end) : at_(begin), end_(end) {}

    /// The next token; it lives until the next call.
    Token<String>& nextToken();

    /// Continue after the first character of a token.
    Token<String>& readNumber(Char first);
    Token<String>& readString();
    Token<String>& readTrue();
    Token<String>& readFalse();
    Token<String>& readNull();

    /// The position of the next character.
    Iterator position() const { return at_; }
    /// Continues from a former position of this scanner.
    void moveTo(Iterator position) { at_ = position; }

private:
    Char next() { return at_ == end_ ? Char() : *at_++; }
    void putBack(Char c)
    {
        if (c != Char()) {
            --at_;
        }
    }

    void skipBlanks();
    Token<String>& readReal(Char first, Iterator rest, Char c);
    Token<String>& readWord(Char const* rest, Token_kind kind);
    bool readEscape();
    bool readHexEscape();

    Token<String>& give(Token_kind kind, std::uint64_t number = 0);
    Token<String>& refuse(Char c);

    Iterator at_;
    Iterator end_;
    Token<String> token_;
};

/// Receives long arrays element by element while the document is read. As values, they would need many times the memory
/// of the final result, and most of the time would go into making and destroying them.
class KUTILS_JSON_EXPORT Element_sink {
public:
    using Tokens = Scanner<std::wstring, wchar_t const*>;

    virtual ~Element_sink() = default;

    /// Whether the sink wants the elements of the array that is the member `key` of the document's object. Elements of
    /// an earlier member of that name are then void.
    virtual bool begin(std::wstring const& key) = 0;
    /// Takes an element that is an object directly from its tokens, from the one after `{` up to `}`, if it has the
    /// usual form. If this returns false, the element is read again, as a value.
    virtual bool take(Tokens& tokens) = 0;
    /// Takes an element of any other form.
    virtual void take(Value element) = 0;
};

/// Builds values from the tokens of a range. The range must outlive the parser.
template <class Value, class Iterator>
class KUTILS_JSON_EXPORT Parser {
public:
    /// A syntax error.
    struct Error {};

    Parser(Iterator begin, Iterator end, Element_sink* sink = nullptr) : scanner_(begin, end), sink_(sink) {}

    /// Reads one value into `out` and moves `begin` past the last character that was used. False on a syntax error or
    /// an empty range; `out` is then unchanged.
    static bool parse(Iterator& begin, Iterator end, Value& out, Element_sink* sink = nullptr);

    /// Reads the next value into `out`. False if there was a `]` instead and `closeAllowed` is set; throws `Error` on
    /// anything else that is not a value. `out` changes only when a whole value was read.
    bool get(Value& out, bool closeAllowed);

private:
    using Object = typename Value::Object;
    using Array = typename Value::Array;

    void place(Value& slot, Token<typename Value::String>& token);
    void open(Value& slot, Value container);
    void readItem();
    bool readElement(Array& array);
    bool handOverElement(Array& array);
    bool readMember(Object& object);
    Token<typename Value::String>& nextItem(bool isFirst, Token_kind close);

    Scanner<typename Value::String, Iterator> scanner_;
    std::vector<Value*> open_; ///< The containers being read, each the last item of the one before.
    Element_sink* sink_;
    Value* handedOver_ = nullptr; ///< The array whose elements go to the sink; it holds the last one at most.
    bool isFirstElement_ = false; ///< Whether none of them has been read.
};

/// As `json::read_string`, but the elements of arrays that `sink` wants go to it, and these arrays are empty in `out`.
/// After a syntax error, discard what the sink has received.
KUTILS_JSON_EXPORT bool read_string(Value& out, OdString const& text, Element_sink& sink);

extern template class Scanner<std::wstring, wchar_t const*>;
extern template class Parser<Value, wchar_t const*>;

} // namespace kutils::json::detail
