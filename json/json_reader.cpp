#include "json/json_reader.h"

#include "json/json_parser.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cstring>
#include <limits>

namespace kutils::json {
namespace detail {
namespace {

constexpr std::uint64_t kLargest = std::numeric_limits<std::uint64_t>::max();
constexpr std::uint64_t kLargestNegative = std::uint64_t{1} << 63;

// Not iswspace: that one follows the locale, and a document must read the same everywhere.
constexpr bool isBlank(wchar_t c)
{
    return c == L' ' || (c >= L'\t' && c <= L'\r');
}

constexpr bool isDigit(wchar_t c)
{
    return c >= L'0' && c <= L'9';
}

constexpr bool isExponentMark(wchar_t c)
{
    return c == L'e' || c == L'E';
}

constexpr int hexDigit(wchar_t c)
{
    if (isDigit(c)) {
        return c - L'0';
    }
    if (c >= L'A' && c <= L'F') {
        return c - L'A' + 10;
    }
    if (c >= L'a' && c <= L'f') {
        return c - L'a' + 10;
    }
    return -1;
}

// A number that becomes too large stays at the largest one.
constexpr std::uint64_t appendDigit(std::uint64_t number, wchar_t digit)
{
    auto const value = static_cast<std::uint64_t>(digit - L'0');
    return number > (kLargest - value) / 10 ? kLargest : number * 10 + value;
}

constexpr std::uint64_t negate(std::uint64_t number)
{
    return std::uint64_t{0} - std::min(number, kLargestNegative);
}

/// A decimal number of any length, shortened to what decides the double nearest to it.
class Decimal {
public:
    void add(wchar_t c)
    {
        if (c == L'-') {
            negative_ = true;
        } else if (c == L'.') {
            inFraction_ = true;
        } else if (isDigit(c)) {
            addDigit(static_cast<char>(c));
        }
    }

    void scale(std::int64_t exponent) { exponent_ += exponent; }

    double value()
    {
        double const magnitude = this->magnitude();
        return negative_ ? -magnitude : magnitude;
    }

private:
    void addDigit(char digit)
    {
        exponent_ -= inFraction_;
        if (count_ == 0 && digit == '0') {
            return;
        }
        if (count_ < kDecisive) {
            digits_[count_++] = digit;
            return;
        }
        ++exponent_;
        moreFollows_ = moreFollows_ || digit != '0';
    }

    double magnitude()
    {
        if (count_ == 0) {
            return 0;
        }
        if (moreFollows_) {
            digits_[count_++] = '1';
            --exponent_;
        }
        std::int64_t const tens = static_cast<std::int64_t>(count_) + exponent_;
        if (tens < -kOutOfRange || tens > kOutOfRange) {
            return outOfRange(tens);
        }
        return convert(tens);
    }

    double convert(std::int64_t tens)
    {
        char* const end = digits_.data() + digits_.size();
        digits_[count_] = 'e';
        char* const last = std::to_chars(digits_.data() + count_ + 1, end, exponent_).ptr;
        double result = 0;
        auto const error = std::from_chars(digits_.data(), last, result).ec;
        return error == std::errc() ? result : outOfRange(tens);
    }

    static double outOfRange(std::int64_t tens) { return tens > 0 ? std::numeric_limits<double>::infinity() : 0; }

    // No more digits are needed to tell on which side of the middle between two doubles a number lies.
    static constexpr std::size_t kDecisive = 768;
    static constexpr std::int64_t kOutOfRange = 400;

    std::array<char, kDecisive + 32> digits_;
    std::size_t count_ = 0;
    std::int64_t exponent_ = 0;
    bool negative_ = false;
    bool inFraction_ = false;
    bool moreFollows_ = false;
};

template <class Iterator>
std::int64_t readExponent(Iterator at, Iterator end)
{
    constexpr std::int64_t kEnough = 1'000'000'000'000'000; // No document has as many digits to outweigh it.
    bool const negative = *at == L'-';
    std::int64_t exponent = 0;
    for (; at != end; ++at) {
        if (isDigit(*at) && exponent < kEnough) {
            exponent = exponent * 10 + (*at - L'0');
        }
    }
    return negative ? -exponent : exponent;
}

template <class Iterator>
double toReal(wchar_t first, Iterator rest, Iterator end)
{
    Iterator const exponent = std::find_if(rest, end, isExponentMark);
    Decimal decimal;
    decimal.add(first);
    std::for_each(rest, exponent, [&](wchar_t c) { decimal.add(c); });
    if (exponent != end) {
        decimal.scale(readExponent(exponent + 1, end));
    }
    return decimal.value();
}

std::uint64_t bitsOf(double real)
{
    std::uint64_t bits = 0;
    static_assert(sizeof bits == sizeof real);
    std::memcpy(&bits, &real, sizeof bits);
    return bits;
}

double realOf(std::uint64_t bits)
{
    double real = 0;
    std::memcpy(&real, &bits, sizeof real);
    return real;
}

} // namespace

template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::nextToken()
{
    skipBlanks();
    Char const c = next();
    switch (c) {
    case L'\0': return give(Token_kind::end);
    case L'[': return give(Token_kind::open_array);
    case L']': return give(Token_kind::close_array);
    case L'{': return give(Token_kind::open_object);
    case L'}': return give(Token_kind::close_object);
    case L':': return give(Token_kind::colon);
    case L',': return give(Token_kind::comma);
    case L'"': return readString();
    case L't': return readTrue();
    case L'f': return readFalse();
    case L'n': return readNull();
    default: return c == L'-' || isDigit(c) ? readNumber(c) : give(Token_kind::invalid);
    }
}

template <class String, class Iterator>
void Scanner<String, Iterator>::skipBlanks()
{
    while (at_ != end_ && isBlank(*at_)) {
        ++at_;
    }
}

template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::readNumber(Char first)
{
    Iterator const rest = at_;
    bool const negative = first == L'-';
    Char const lead = negative ? next() : first;
    if (!isDigit(lead)) {
        return refuse(lead);
    }
    std::uint64_t number = appendDigit(0, lead);
    Char c = next();
    if (lead != L'0') {
        for (; isDigit(c); c = next()) {
            number = appendDigit(number, c);
        }
    }
    if (c == L'.' || isExponentMark(c)) {
        return readReal(first, rest, c);
    }
    putBack(c);
    if (negative && lead != L'0') {
        return give(Token_kind::signed_integer, negate(number));
    }
    return give(Token_kind::unsigned_integer, number);
}

// `c` is the character that made the number a real one.
template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::readReal(Char first, Iterator rest, Char c)
{
    if (c == L'.') {
        do {
            c = next();
        } while (isDigit(c));
    }
    if (isExponentMark(c)) {
        c = next();
        if (c == L'+' || c == L'-') {
            c = next();
        }
        if (!isDigit(c)) {
            return refuse(c);
        }
        while (isDigit(c)) {
            c = next();
        }
    }
    putBack(c);
    return give(Token_kind::real, bitsOf(toReal(first, rest, at_)));
}

template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::readTrue()
{
    return readWord(L"rue", Token_kind::true_value);
}

template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::readFalse()
{
    return readWord(L"alse", Token_kind::false_value);
}

template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::readNull()
{
    return readWord(L"ull", Token_kind::null_value);
}

template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::readWord(Char const* rest, Token_kind kind)
{
    for (; *rest != Char(); ++rest) {
        Char const c = next();
        if (c != *rest) {
            return refuse(c);
        }
    }
    return give(kind);
}

template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::readString()
{
    token_.text.clear();
    for (;;) {
        Iterator const run = at_;
        while (at_ != end_ && *at_ != L'"' && *at_ != L'\\') {
            ++at_;
        }
        token_.text.append(run, at_);
        if (at_ == end_) {
            return give(Token_kind::invalid);
        }
        if (*at_++ == L'"') {
            return give(Token_kind::string);
        }
        if (!readEscape()) {
            return give(Token_kind::invalid);
        }
    }
}

template <class String, class Iterator>
bool Scanner<String, Iterator>::readEscape()
{
    Char const c = next();
    switch (c) {
    case L'"':
    case L'\\':
    case L'/': token_.text += c; return true;
    case L'b': token_.text += L'\b'; return true;
    case L'f': token_.text += L'\f'; return true;
    case L'n': token_.text += L'\n'; return true;
    case L'r': token_.text += L'\r'; return true;
    case L't': token_.text += L'\t'; return true;
    case L'u': return readHexEscape();
    default: putBack(c); return false;
    }
}

template <class String, class Iterator>
bool Scanner<String, Iterator>::readHexEscape()
{
    int value = 0;
    for (int i = 0; i < 4; ++i) {
        Char const c = next();
        int const digit = hexDigit(c);
        if (digit < 0) {
            putBack(c);
            return false;
        }
        value = value * 16 + digit;
    }
    token_.text += static_cast<Char>(value);
    return true;
}

template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::give(Token_kind kind, std::uint64_t number)
{
    token_.kind = kind;
    token_.number = number;
    return token_;
}

template <class String, class Iterator>
Token<String>& Scanner<String, Iterator>::refuse(Char c)
{
    putBack(c);
    return give(Token_kind::invalid);
}

template <class Value, class Iterator>
bool Parser<Value, Iterator>::parse(Iterator& begin, Iterator end, Value& out, Element_sink* sink)
{
    if (begin == end) {
        return false;
    }
    Parser parser(begin, end, sink);
    try {
        parser.get(out, false);
    } catch (Error const&) {
        begin = parser.scanner_.position();
        return false;
    }
    begin = parser.scanner_.position();
    return true;
}

template <class Value, class Iterator>
bool Parser<Value, Iterator>::get(Value& out, bool closeAllowed)
{
    auto& token = scanner_.nextToken();
    if (closeAllowed && token.kind == Token_kind::close_array) {
        return false;
    }
    Value root;
    open_.clear();
    handedOver_ = nullptr;
    place(root, token);
    while (!open_.empty()) {
        readItem();
    }
    out = std::move(root);
    return true;
}

template <class Value, class Iterator>
void Parser<Value, Iterator>::place(Value& slot, Token<typename Value::String>& token)
{
    switch (token.kind) {
    case Token_kind::open_array: return open(slot, Array());
    case Token_kind::open_object: return open(slot, Object());
    case Token_kind::null_value: slot = Value(); return;
    case Token_kind::true_value: slot = true; return;
    case Token_kind::false_value: slot = false; return;
    case Token_kind::signed_integer: slot = static_cast<std::int64_t>(token.number); return;
    case Token_kind::unsigned_integer: slot = token.number; return;
    case Token_kind::real: slot = realOf(token.number); return;
    case Token_kind::string: slot = std::move(token.text); return;
    default: throw Error();
    }
}

template <class Value, class Iterator>
void Parser<Value, Iterator>::open(Value& slot, Value container)
{
    slot = std::move(container);
    open_.push_back(&slot);
}

// Reads one more item of the innermost open container, or its end.
template <class Value, class Iterator>
void Parser<Value, Iterator>::readItem()
{
    Value& container = *open_.back();
    bool const isArray = container.type() == Value_type::array;
    bool const goesOn = &container == handedOver_ ? handOverElement(container.get_array())
                        : isArray                 ? readElement(container.get_array())
                                                  : readMember(container.get_object());
    if (!goesOn) {
        open_.pop_back();
    }
}

template <class Value, class Iterator>
bool Parser<Value, Iterator>::readElement(Array& array)
{
    auto& token = nextItem(array.empty(), Token_kind::close_array);
    if (token.kind == Token_kind::close_array) {
        return false;
    }
    place(array.emplace_back(), token);
    return true;
}

// The element that was read as a value before is whole now, and goes to the sink.
template <class Value, class Iterator>
bool Parser<Value, Iterator>::handOverElement(Array& array)
{
    if (!array.empty()) {
        sink_->take(std::move(array.back()));
        array.clear();
    }
    auto& token = nextItem(isFirstElement_, Token_kind::close_array);
    isFirstElement_ = false;
    if (token.kind == Token_kind::close_array) {
        handedOver_ = nullptr;
        return false;
    }
    if (token.kind != Token_kind::open_object) {
        place(array.emplace_back(), token);
        return true;
    }
    Iterator const start = scanner_.position();
    if (!sink_->take(scanner_)) {
        scanner_.moveTo(start);
        open(array.emplace_back(), Object());
    }
    return true;
}

template <class Value, class Iterator>
bool Parser<Value, Iterator>::readMember(Object& object)
{
    auto& token = nextItem(object.empty(), Token_kind::close_object);
    if (token.kind == Token_kind::close_object) {
        return false;
    }
    if (token.kind != Token_kind::string) {
        throw Error();
    }
    // Written documents are in ascending order: the end is where nearly every key goes.
    auto const member = object.insert_or_assign(object.end(), std::move(token.text), Value());
    if (scanner_.nextToken().kind != Token_kind::colon) {
        throw Error();
    }
    place(member->second, scanner_.nextToken());
    bool const isArrayOfDocument = open_.size() == 2 && member->second.type() == Value_type::array;
    if (sink_ && isArrayOfDocument && sink_->begin(member->first)) {
        handedOver_ = open_.back();
        isFirstElement_ = true;
    }
    return true;
}

// The token that the next item starts with, behind the comma that it needs unless it is the first; or `close`.
template <class Value, class Iterator>
Token<typename Value::String>& Parser<Value, Iterator>::nextItem(bool isFirst, Token_kind close)
{
    auto& token = scanner_.nextToken();
    if (isFirst || token.kind == close) {
        return token;
    }
    if (token.kind != Token_kind::comma) {
        throw Error();
    }
    return scanner_.nextToken();
}

template class Scanner<std::wstring, wchar_t const*>;
template class Parser<Value, wchar_t const*>;

bool read_string(Value& out, OdString const& text, Element_sink& sink)
{
    wchar_t const* begin = text.c_str();
    return Parser<Value, wchar_t const*>::parse(begin, begin + text.getLength(), out, &sink);
}

} // namespace detail

bool read_string(Value& out, OdString const& text)
{
    wchar_t const* begin = text.c_str();
    return detail::Parser<Value, wchar_t const*>::parse(begin, begin + text.getLength(), out);
}

} // namespace kutils::json
