#include "tests/server/translations.h"

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <utility>

#include <wx/arrstr.h>
#include <wx/translation.h>

namespace server {
namespace {

using Entry = std::pair<std::string, std::string>;

void appendNumber(std::string& bytes, std::size_t number)
{
    auto const narrow = static_cast<std::uint32_t>(number);
    char digits[sizeof narrow];
    std::memcpy(digits, &narrow, sizeof narrow);
    bytes.append(digits, sizeof narrow);
}

/// A compiled catalogue: the head, for either side of all entries the lengths and places of the texts, then the texts.
std::string compiled(std::vector<Entry> entries)
{
    std::sort(entries.begin(), entries.end());
    constexpr std::size_t kHead = 7 * sizeof(std::uint32_t);
    std::size_t const table = entries.size() * 2 * sizeof(std::uint32_t);
    std::string bytes;
    for (std::size_t const number :
         {std::size_t{0x950412DE}, std::size_t{0}, entries.size(), kHead, kHead + table, std::size_t{0},
          kHead + 2 * table}) {
        appendNumber(bytes, number);
    }
    std::string texts;
    for (std::string Entry::*const side : {&Entry::first, &Entry::second}) {
        for (Entry const& entry : entries) {
            appendNumber(bytes, (entry.*side).size());
            appendNumber(bytes, kHead + 2 * table + texts.size());
            texts.append((entry.*side).c_str(), (entry.*side).size() + 1);
        }
    }
    return bytes + texts;
}

class Loader : public wxTranslationsLoader {
public:
    explicit Loader(std::vector<Entry> const& entries) : catalogue_(compiled(entries)) {}

    wxMsgCatalog* LoadCatalog(wxString const& domain, wxString const& /*language*/) override
    {
        wxScopedCharBuffer const bytes = wxScopedCharBuffer::CreateNonOwned(catalogue_.data(), catalogue_.size());
        return wxMsgCatalog::CreateFromData(bytes, domain);
    }

    wxArrayString GetAvailableTranslations(wxString const& /*domain*/) const override
    {
        wxArrayString languages;
        languages.Add("de");
        return languages;
    }

private:
    std::string catalogue_;
};

} // namespace

Translations::Translations(std::vector<std::string> const& texts)
{
    std::vector<Entry> entries = {{"", "Content-Type: text/plain; charset=UTF-8\n"}};
    for (std::string const& text : texts) {
        entries.emplace_back(text, "{" + text + "}");
    }
    auto* const translations = new wxTranslations; // Becomes the property of wxWidgets.
    translations->SetLoader(new Loader(entries));
    translations->SetLanguage("de");
    if (!translations->AddCatalog("mu_common")) {
        std::fputs("Translations: the catalogue is refused\n", stderr);
        std::abort();
    }
    wxTranslations::Set(translations);
}

Translations::~Translations()
{
    wxTranslations::Set(nullptr);
}

} // namespace server
