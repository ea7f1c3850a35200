/// Texts and documents.
#pragma once

#include "platform/sdk/OdString.h"
#include "json/json_value.h"

namespace tav {

/// A text as a member of a document. Characters beyond 16 bits become surrogate pairs, which JSON asks for in escapes.
kutils::json::Value jsonText(OdString const& text);

/// The text of a document, without any layout.
OdString compactText(kutils::json::Value const& document);

} // namespace tav
