#include "host/text/json_text.h"

#include "host/text/characters.h"

#include "json/json_writer.h"

#include <string>

namespace tav {

kutils::json::Value jsonText(OdString const& text)
{
    OdString const units = withPairs(text);
    return std::wstring(units.c_str(), units.getLength());
}

OdString compactText(kutils::json::Value const& document)
{
    std::wstring const text = kutils::json::write_string(document, false);
    return {text.c_str(), text.size()};
}

} // namespace tav
