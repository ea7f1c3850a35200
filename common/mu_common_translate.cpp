#include "common/mu_common_translate.h"

#include <string_view>

#include <wx/translation.h>

namespace common {

namespace {

constexpr int kMalformed = -1;

/// How many `%ls` a format has; `kMalformed` when a percent sign starts anything else but `%%`.
int countPlaceholders(std::wstring_view format)
{
    int count = 0;
    for (std::size_t i = format.find(L'%'); i != format.npos; i = format.find(L'%', i)) {
        if (format.substr(i, 3) == L"%ls") {
            ++count;
            i += 3;
        } else if (format.substr(i, 2) == L"%%") {
            i += 2;
        } else {
            return kMalformed;
        }
    }
    return count;
}

bool fits(std::wstring_view translation, std::wstring_view english)
{
    int const count = countPlaceholders(translation);
    return count != kMalformed && count <= countPlaceholders(english);
}

} // namespace

OdString translate(wchar_t const* english)
{
    wxTranslations const* const translations = wxTranslations::Get();
    wxString const* const translated = translations ? translations->GetTranslatedString(english) : nullptr;
    if (!translated || !fits(translated->ToStdWstring(), english)) {
        return english; // `GetUntranslatedString` gives the same, from a table that is gone at the end of the process.
    }
    return OdString(translated->wc_str(), translated->length());
}

} // namespace common
