/// Characters of texts that come from documents.
#pragma once

#include "platform/sdk/OdString.h"

#include <string>

namespace tav {

/// `text` as documents carry it: each character beyond 16 bits as a surrogate pair, which JSON asks for in escapes.
OdString withPairs(OdString const& text);
/// The way back: pairs become the characters that they stand for. Halves that stand alone stay.
OdString withoutPairs(OdString const& text);

/// Whether `text` comes back the same from its bytes. Surrogates that stand for no byte do not, and neither do stray
/// bytes that make up a character: a second spelling of one name.
bool isSound(OdString const& text);

/// C0, DEL and C1, and the two separators that end a line or a paragraph.
bool isControl(wchar_t c);
/// Characters that Unicode asks programs to pass over, joiners and marks of direction among them. Some file systems
/// pass over them in names.
bool isInvisible(wchar_t c);

/// Whether a terminal obeys the character, passes over it, or may take it for another one: that may happen to a byte of
/// a name that is not valid UTF-8.
bool cannotBeSeen(wchar_t c);

/// The character as lists and messages show it when it cannot be seen: a byte as "\x0A", others as "\u200B".
OdString asEscape(wchar_t c);

/// `text` in quotes for messages, on one line: what cannot be seen is escaped, and a long text is cut off.
std::string quoted(OdString const& text);

} // namespace tav
