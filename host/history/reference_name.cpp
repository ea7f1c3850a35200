#include "host/history/reference_name.h"

#include "host/text/characters.h"

#include <algorithm>
#include <cstddef>
#include <string_view>

namespace tav {

namespace {

constexpr std::size_t kHashLength = 64;
constexpr std::size_t kLongestName = 255;

bool isDigit(wchar_t c)
{
    return c >= L'0' && c <= L'9';
}

bool isHex(wchar_t c)
{
    return isDigit(c) || (c >= L'a' && c <= L'f') || (c >= L'A' && c <= L'F');
}

template <class Predicate>
bool all(OdString const& text, Predicate const& predicate)
{
    wchar_t const* const begin = text.c_str();
    return std::all_of(begin, begin + text.getLength(), predicate);
}

bool contains(OdString const& text, wchar_t const* part)
{
    return std::wstring_view(text.c_str(), text.getLength()).find(part) != std::wstring_view::npos;
}

bool isEdge(OdString const& name, wchar_t c)
{
    return name.getAt(0) == c || name.getAt(name.getLength() - 1) == c;
}

char const* faultOfName(OdString const& name)
{
    if (name.isEmpty()) {
        return "is empty";
    }
    if (name.ansi_str().size() > kLongestName) {
        return "is longer than 255 bytes";
    }
    if (!all(name, [](wchar_t c) { return !isControl(c); })) {
        return "holds a control character";
    }
    if (!isSound(name)) {
        return "holds half a character";
    }
    return isEdge(name, L' ') ? "begins or ends with a blank" : nullptr;
}

char const* faultOfReferenceName(OdString const& name)
{
    if (char const* const fault = faultOfName(name)) {
        return fault;
    }
    if (name.getAt(0) == L'-') {
        return "begins with a dash";
    }
    if (isEdge(name, L'/')) {
        return "begins or ends with a slash";
    }
    if (contains(name, L"..")) {
        return "holds two dots in a row";
    }
    if (all(name, isDigit)) {
        return "could be taken for the number of a commit";
    }
    return name.getLength() == kHashLength && all(name, isHex) ? "could be taken for the hash of a commit" : nullptr;
}

std::optional<std::string> sentence(char const* fault)
{
    return fault ? std::optional<std::string>(fault) : std::nullopt;
}

} // namespace

std::optional<std::string> whyNotName(OdString const& name)
{
    return sentence(faultOfName(name));
}

std::optional<std::string> whyNotReferenceName(OdString const& name)
{
    return sentence(faultOfReferenceName(name));
}

} // namespace tav
