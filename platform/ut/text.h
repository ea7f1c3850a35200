/// Small helpers on texts and whole files.
#pragma once

#include "platform/mu_platform_export.h"
#include "platform/sdk/OdArray.h"
#include "platform/sdk/OdString.h"

namespace ut {

/// The whole content of the text file `path`, a byte-order mark skipped, line ends as they stand; UTF-8, see `OdString`
/// for bytes that are not. Throws `OdError`, naming the file, when it is no regular file or cannot be read, and
/// `std::bad_alloc` when it does not fit into memory.
MU_PLATFORM_EXPORT OdString readEntireFile(OdString const& path);

/// `path` with the separators of this platform. The slash is the only one here, so every path is left as it is: a
/// backslash may belong to a name.
MU_PLATFORM_EXPORT OdString correctSlashes(OdString const& path);

/// The pieces of `text` between the characters `separator`, in order. Without `keepEmpty` empty pieces are left out, so
/// an empty text has none; with it a text of n separators has n + 1.
MU_PLATFORM_EXPORT OdArray<OdString> splitByChar(OdString const& text, wchar_t separator, bool keepEmpty);

} // namespace ut
