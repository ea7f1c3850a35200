/// Translation of messages. Internal to the library.
#pragma once

#include "platform/sdk/OdString.h"

namespace common {

/// The text of the user's language for `english`, from the catalogues that the host has installed; `english` itself
/// when there is none. Translate first, fill placeholders in afterwards: the English text is the catalogue's key.
/// A translation may leave placeholders out, and may number them to change their order: `"%2$ls" fehlt in %1$ls`. One
/// whose placeholders do not fit those of `english` is not used: a slip in a catalogue must not make a message read
/// arguments that are not there. Where `english` has no placeholders nothing is filled in, and any text will do.
OdString translate(wchar_t const* english);

} // namespace common
