/// Translation of messages. Internal to the library.
#pragma once

#include "platform/sdk/OdString.h"

namespace common {

/// The text of the user's language for `english`, from the catalogues that the host has installed; `english` itself
/// when there is none. Translate first, fill placeholders in afterwards: the English text is the catalogue's key.
/// A translation whose placeholders do not fit those of `english` is not used: a slip in a catalogue must not make a
/// message read arguments that are not there.
OdString translate(wchar_t const* english);

} // namespace common
