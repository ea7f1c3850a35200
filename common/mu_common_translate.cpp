#include "common/mu_common_translate.h"

#include <set>
#include <string_view>

#include <wx/translation.h>

namespace common {

namespace {

constexpr int kMalformed = -1;

/// Whether `format` begins with a placeholder like `%2$ls`.
bool startsWithNumbered(std::wstring_view format)
{
    return format.substr(0, 1) == L"%" && format.size() > 1 && format[1] >= L'1' && format[1] <= L'9' &&
           format.substr(2, 3) == L"$ls";
}

/// How many arguments the placeholders of a format read, either all of them `%ls` or all of them numbered from 1
/// without gaps, as only that is defined; `kMalformed` when a percent sign starts anything else but `%%`.
int countArguments(std::wstring_view format)
{
    int count = 0;
    std::set<wchar_t> numbers;
    for (std::size_t i = format.find(L'%'); i != format.npos; i = format.find(L'%', i)) {
        std::wstring_view const rest = format.substr(i);
        if (rest.substr(0, 3) == L"%ls") {
            ++count;
            i += 3;
        } else if (startsWithNumbered(rest)) {
            numbers.insert(rest[1]);
            i += 5;
        } else if (rest.substr(0, 2) == L"%%") {
            i += 2;
        } else {
            return kMalformed;
        }
    }
    if (numbers.empty()) {
        return count;
    }
    int const largest = *numbers.rbegin() - L'0';
    bool const isDefined = count == 0 && largest == static_cast<int>(numbers.size());
    return isDefined ? largest : kMalformed;
}

/// A text without placeholders is not formatted, so a percent sign in it is nothing but that.
bool fits(std::wstring_view translation, std::wstring_view english)
{
    int const available = countArguments(english);
    int const read = countArguments(translation);
    return available == 0 || (read != kMalformed && read <= available);
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
