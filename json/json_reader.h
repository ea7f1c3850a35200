/// Reading JSON text into a value.
#pragma once

#include "platform/sdk/OdString.h"
#include "json/json_export.h"
#include "json/json_value.h"

namespace kutils::json {

/// Reads one JSON value from the characters of `text` into `out`. True on success; false on a syntax error, and then
/// `out` is as it was. Neither position nor reason is kept. Throws only what allocation throws.
///
/// Text after the value is ignored. Beyond the JSON standard a comma may precede a closing bracket, the fraction of a
/// number may be empty (`1.`), vertical tab and form feed are blanks, and strings may hold control characters. Of
/// several members with one key the last counts. An integer without a minus sign becomes an unsigned 64-bit integer;
/// numbers out of range become the nearest number of their kind, reals infinity. A `\u` escape makes one character
/// each: halves of a surrogate pair stay halves. A NUL outside a string is treated as the end of the text, except
/// directly after a number, where it is skipped.
///
/// The text may be nested as deep as memory allows. The same text reads the same under every locale.
KUTILS_JSON_EXPORT bool read_string(Value& out, OdString const& text);

} // namespace kutils::json
