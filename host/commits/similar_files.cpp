#include "host/commits/similar_files.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <string>
#include <string_view>

namespace tav {

namespace {

constexpr std::size_t kMostOnASide = 2;
constexpr std::size_t kFarthest = 16; // files, those of other kinds included

/// Other letters than those of ASCII are compared as they are: extensions have none.
wchar_t lowerCase(wchar_t c)
{
    return c >= L'A' && c <= L'Z' ? static_cast<wchar_t>(c - L'A' + L'a') : c;
}

std::wstring extensionOf(OdString const& path)
{
    std::wstring_view const text(path.c_str(), path.getLength());
    std::wstring_view const name = text.substr(text.rfind(L'/') + 1);
    std::wstring extension(name.substr(std::min(name.rfind(L'.'), name.size())));
    std::transform(extension.begin(), extension.end(), extension.begin(), lowerCase);
    return extension;
}

/// The first ones with this extension from `file` on.
template <class Iterator>
std::vector<OdString> nearest(Iterator file, Iterator end, std::wstring const& extension)
{
    std::vector<OdString> urls;
    for (std::size_t i = 0; i < kFarthest && file != end && urls.size() < kMostOnASide; ++i, ++file) {
        if (extensionOf(file->first) == extension) {
            urls.push_back(file->second);
        }
    }
    return urls;
}

} // namespace

std::vector<OdString> similarFiles(Tree const& files, OdString const& path)
{
    std::wstring const extension = extensionOf(path);
    auto const place = files.lower_bound(path);
    std::vector<OdString> urls = nearest(std::make_reverse_iterator(place), files.rend(), extension);
    auto const after = place != files.end() && place->first == path ? std::next(place) : place;
    std::vector<OdString> const others = nearest(after, files.end(), extension);
    urls.insert(urls.end(), others.begin(), others.end());
    return urls;
}

} // namespace tav
