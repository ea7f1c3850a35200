#include "host/text/characters.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>

namespace tav {

namespace {

constexpr std::size_t kLongestQuote = 100;

struct Range {
    std::uint32_t first;
    std::uint32_t last;
};

// Unicode's property Default_Ignorable_Code_Point, in ascending order.
constexpr std::array kInvisible = {
    Range{0xAD, 0xAD},       Range{0x34F, 0x34F},   Range{0x61C, 0x61C},     Range{0x115F, 0x1160},
    Range{0x17B4, 0x17B5},   Range{0x180B, 0x180F}, Range{0x200B, 0x200F},   Range{0x202A, 0x202E},
    Range{0x2060, 0x206F},   Range{0x3164, 0x3164}, Range{0xFE00, 0xFE0F},   Range{0xFEFF, 0xFEFF},
    Range{0xFFA0, 0xFFA0},   Range{0xFFF0, 0xFFF8}, Range{0x1BCA0, 0x1BCA3}, Range{0x1D173, 0x1D17A},
    Range{0xE0000, 0xE0FFF},
};

bool isHigh(wchar_t c)
{
    return c >= 0xD800 && c <= 0xDBFF;
}

bool isLow(wchar_t c)
{
    return c >= 0xDC00 && c <= 0xDFFF;
}

wchar_t joined(wchar_t high, wchar_t low)
{
    return 0x10000 + ((high - 0xD800) << 10) + (low - 0xDC00);
}

bool mustBeEscaped(wchar_t c)
{
    return isControl(c) || isInvisible(c) || isHigh(c) || isLow(c);
}

/// A byte of a name that is not valid UTF-8.
bool isStrayByte(wchar_t c)
{
    return c >= 0xDC80 && c <= 0xDCFF;
}

OdString asText(std::wstring const& characters)
{
    return OdString(characters.data(), characters.size());
}

} // namespace

OdString withPairs(OdString const& text)
{
    std::wstring units;
    units.reserve(text.getLength());
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        wchar_t const c = text.getAt(i);
        if (static_cast<std::uint32_t>(c) <= 0xFFFF) {
            units += c;
        } else {
            units += static_cast<wchar_t>(0xD800 + ((c - 0x10000) >> 10));
            units += static_cast<wchar_t>(0xDC00 + ((c - 0x10000) & 0x3FF));
        }
    }
    return asText(units);
}

OdString withoutPairs(OdString const& text)
{
    std::wstring characters;
    characters.reserve(text.getLength());
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        wchar_t const c = text.getAt(i);
        bool const isPair = isHigh(c) && i + 1 < text.getLength() && isLow(text.getAt(i + 1));
        characters += isPair ? joined(c, text.getAt(++i)) : c;
    }
    return asText(characters);
}

bool isSound(OdString const& text)
{
    std::string const bytes = text.ansi_str();
    return OdString(bytes.data(), bytes.size(), CP_UTF_8) == text;
}

bool isControl(wchar_t c)
{
    return (c >= 0 && c < 0x20) || (c >= 0x7F && c < 0xA0) || c == 0x2028 || c == 0x2029;
}

bool isInvisible(wchar_t c)
{
    auto const code = static_cast<std::uint32_t>(c);
    auto const* const range = std::find_if(
        kInvisible.begin(), kInvisible.end(), [code](Range const& candidate) { return code <= candidate.last; });
    return range != kInvisible.end() && code >= range->first;
}

bool cannotBeSeen(wchar_t c)
{
    return isControl(c) || isInvisible(c) || isStrayByte(c);
}

OdString asEscape(wchar_t c)
{
    auto const code = static_cast<unsigned>(c);
    bool const isByte = code <= 0xFF || isStrayByte(c);
    return OdString().format(isByte ? L"\\x%02X" : L"\\u%04X", isByte ? code & 0xFF : code);
}

std::string quoted(OdString const& text)
{
    OdString shown;
    for (std::size_t i = 0; i < std::min(text.getLength(), kLongestQuote); ++i) {
        wchar_t const c = text.getAt(i);
        shown += mustBeEscaped(c) ? asEscape(c) : OdString(&c, 1);
    }
    return "'" + shown.ansi_str() + (text.getLength() > kLongestQuote ? "...'" : "'");
}

} // namespace tav
