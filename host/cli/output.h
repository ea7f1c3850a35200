/// What commands print: names, documents and errors.
#pragma once

#include "host/cli/terminal.h"
#include "host/text/digest.h"
#include "host/text/json_text.h"

#include "platform/sdk/OdString.h"
#include "json/json_value.h"

#include <string>

namespace tav {

/// Prints `text`, in UTF-8, as it stands.
void print(std::string const& text);
/// Prints a document for programs, with a line feed after it.
void printJson(kutils::json::Value const& document);
/// Prints "tav: <what> <next>" as one line on the error stream.
void printError(std::string const& what, std::string const& next);
/// Prints "tav: <note>" as one line on the error stream, beside what the command does.
void printNote(std::string const& note);
/// Prints a line of details that follows an error, indented.
void printErrorDetail(std::string const& detail);
/// Hands over what was printed; false when anything could not be written.
bool flushOutput();

/// A name as people see it. Control characters are escaped: a name may hold any of them, a terminal obeys them, and a
/// line feed would make two names of one. On a terminal so are characters that cannot be seen, and bytes that are no
/// UTF-8; elsewhere these stay as they are.
std::string shown(OdString const& name);
/// A line of a message or of a file: on a terminal with the same escapes, tabs excepted; elsewhere as it stands.
std::string shownLine(OdString const& line);

/// A line in the form of sha256sum, so that it can check the list: a name with a line end or a backslash is escaped,
/// and its line begins with a backslash.
std::string digestLine(Digest const& digest, OdString const& path);

enum class Colour { none, red, green };

/// `text` in that colour where people see it: on a terminal, unless the environment sets NO_COLOR.
std::string coloured(Colour colour, std::string text);

} // namespace tav
