/// What commands print: names, documents and errors.
#pragma once

#include "host/cli/terminal.h"
#include "host/text/digest.h"
#include "host/text/json_text.h"

#include "platform/sdk/OdString.h"
#include "json/json_value.h"

#include <string>

namespace tav {

/// Prints `text`, in UTF-8, unchanged.
void print(std::string const& text);
/// Prints what a command has done, unless the user asked for quiet.
void report(std::string const& text);
/// Prints a document for programs, with a line feed after it.
void printJson(kutils::json::Value const& document);
/// Prints "tav: <what> <next>" as one line on the error stream.
void printError(std::string const& what, std::string const& next);
/// Prints "tav: <note>" as one line on the error stream, beside what the command does.
void printNote(std::string const& note);
/// Prints a line of details that follows an error, indented.
void printErrorDetail(std::string const& detail);
/// Prints `text` on the error stream as it stands.
void printErrorText(std::string const& text);
/// Flushes what was printed; false when anything could not be written.
bool flushOutput();

/// A name in the form that people see. Control characters are escaped: a name may contain any of them, a terminal obeys
/// them, and a line feed would split the name. On a terminal, invisible characters and bytes that are not valid UTF-8
/// are escaped too; elsewhere they are unchanged.
std::string shown(OdString const& name);
/// A line of a message or of a file: on a terminal with the same escapes, except for tabs; elsewhere unchanged.
std::string shownLine(OdString const& line);

/// A line in the form of sha256sum, so that it can check the list: a name with a line end or a backslash is escaped,
/// and its line begins with a backslash.
std::string digestLine(Digest const& digest, OdString const& path);

enum class Colour { none, red, green };

/// `text` in that colour if the user wants colours: by default on a terminal.
std::string coloured(Colour colour, std::string text);

} // namespace tav
