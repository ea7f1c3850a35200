#include "host/protocol/members.h"

#include "host/history/tracked_path.h"
#include "host/storage/storage_url.h"

#include <algorithm>
#include <cstddef>

namespace tav {

namespace {

constexpr std::size_t kHashLength = 64;
constexpr std::size_t kIdLength = 32;
constexpr std::size_t kMostParents = 2;

bool isLowerHexDigit(wchar_t c)
{
    return (c >= L'0' && c <= L'9') || (c >= L'a' && c <= L'f');
}

bool isLowerHex(OdString const& text, std::size_t length)
{
    wchar_t const* const begin = text.c_str();
    return text.getLength() == length && std::all_of(begin, begin + length, isLowerHexDigit);
}

} // namespace

bool isHash(OdString const& hash)
{
    return isLowerHex(hash, kHashLength);
}

bool isRepositoryId(OdString const& id)
{
    return isLowerHex(id, kIdLength);
}

bool isContentUrl(OdString const& url)
{
    return parseUrl(url).has_value();
}

OdString readHash(Part const& part)
{
    OdString hash = part.text();
    if (!isHash(hash)) {
        part.refuse("must be a hash of 64 lower-case hexadecimal digits");
    }
    return hash;
}

OdString readPath(Part const& part)
{
    OdString path = part.text();
    if (auto const fault = whyUnsafe(path)) {
        part.refuse("cannot be recorded. " + fault->substr(0, fault->size() - 1));
    }
    return path;
}

OdString readUrl(Part const& part)
{
    OdString url = part.text();
    if (!isContentUrl(url)) {
        part.refuse("must name a content, such as 'po:' or 'tf:plan#' followed by a hash");
    }
    return url;
}

std::vector<OdString> readParents(Part const& part)
{
    std::size_t const count = part.size();
    if (count > kMostParents) {
        part.refuse("must not hold more than 2 parents");
    }
    std::vector<OdString> parents;
    for (std::size_t i = 0; i < count; ++i) {
        parents.push_back(readHash(part[i]));
    }
    if (count == 2 && parents[0] == parents[1]) {
        part.refuse("must not list a parent twice");
    }
    return parents;
}

} // namespace tav
