/// Documents on the disk: reading one whole, and replacing one whole. Internal to the library.
#pragma once

#include "common/mu_common_expected.h"

#include "platform/sdk/OdString.h"
#include "json/json_value.h"

#include <string>

namespace kutils::json::detail {
class Element_sink;
}

namespace common {

/// The object that the file `path` holds. Throws `OdError` when the file cannot be read, is not JSON or holds something
/// else than an object.
kutils::json::Value readDocument(OdString const& path);

/// The same; arrays that `sink` wants go there, element by element.
kutils::json::Value readDocument(OdString const& path, kutils::json::detail::Element_sink& sink);

/// Replaces the content of the file `path` by `document`, in the pretty layout. Error: the file cannot be written. It
/// then holds what it held before, or, when only its folder cannot be flushed, the new content.
WriteOutcome writeDocument(OdString const& path, kutils::json::Value const& document);

/// The same for the text of a document.
WriteOutcome writeText(OdString const& path, std::wstring const& text);

} // namespace common
