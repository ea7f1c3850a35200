#include "host/cli/output.h"

#include "host/cli/current_settings.h"
#include "host/errors/failure.h"
#include "host/text/characters.h"
#include "host/text/utf8.h"

#include "json/json_writer.h"

#include <algorithm>
#include <cstdio>
#include <string_view>

namespace tav {

namespace {

bool cannotBeSeenInALine(wchar_t c)
{
    return c != L'\t' && cannotBeSeen(c);
}

std::string escaped(OdString const& text, bool (*mustBe)(wchar_t))
{
    wchar_t const* const begin = text.c_str();
    if (std::none_of(begin, begin + text.getLength(), mustBe)) {
        return text.ansi_str(); // Most names are so, and there may be 200,000 of them.
    }
    OdString result;
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        wchar_t const c = text.getAt(i);
        result += mustBe(c) ? asEscape(c) : OdString(&c, 1);
    }
    return result.ansi_str();
}

/// Messages of several lines become one; whatever else could move the cursor is escaped.
std::string onOneLine(std::string text)
{
    while (!text.empty() && text.back() == '\n') {
        text.pop_back();
    }
    for (char& c : text) {
        c = c == '\n' || c == '\t' ? ' ' : c;
    }
    return escaped(fromUtf8(text), cannotBeSeen);
}

std::string asSentence(std::string const& text)
{
    bool const isEnded = !text.empty() && std::string_view(".!?:").find(text.back()) != std::string_view::npos;
    return isEnded ? text : text + ".";
}

/// Settings that cannot be used are no reason to show nothing: 'tav config' says what is wrong with them.
std::string colourSetting()
{
    try {
        return currentSettings().value("color");
    } catch (Failure const&) {
        return "auto";
    }
}

bool wantsColours()
{
    std::string const& chosen = terminalOptions().colour;
    std::string const when = chosen.empty() ? colourSetting() : chosen;
    return when == "always" || (when == "auto" && isTerminal());
}

} // namespace

void print(std::string const& text)
{
    std::fwrite(text.data(), 1, text.size(), stdout);
}

void report(std::string const& text)
{
    if (!terminalOptions().isQuiet) {
        print(text);
    }
}

void printJson(kutils::json::Value const& document)
{
    std::wstring const text = kutils::json::write_string(document, true);
    print(OdString(text.c_str(), text.size()).ansi_str() + "\n");
}

void printError(std::string const& what, std::string const& next)
{
    std::string const line = "tav: " + asSentence(onOneLine(what)) + " " + onOneLine(next) + "\n";
    std::fwrite(line.data(), 1, line.size(), stderr);
}

void printNote(std::string const& note)
{
    std::string const line = "tav: " + onOneLine(note) + "\n";
    std::fwrite(line.data(), 1, line.size(), stderr);
}

void printErrorDetail(std::string const& detail)
{
    std::string const line = "  " + onOneLine(detail) + "\n";
    std::fwrite(line.data(), 1, line.size(), stderr);
}

void printErrorText(std::string const& text)
{
    std::fwrite(text.data(), 1, text.size(), stderr);
}

bool flushOutput()
{
    return std::fflush(stdout) == 0 && std::ferror(stdout) == 0;
}

std::string shown(OdString const& name)
{
    return escaped(name, isTerminal() ? cannotBeSeen : isControl);
}

std::string shownLine(OdString const& line)
{
    return isTerminal() ? escaped(line, cannotBeSeenInALine) : line.ansi_str();
}

std::string digestLine(Digest const& digest, OdString const& path)
{
    std::string const bytes = path.ansi_str();
    std::string name;
    for (char const c : bytes) {
        name += c == '\\' ? "\\\\" : c == '\n' ? "\\n" : c == '\r' ? "\\r" : std::string(1, c);
    }
    bool const isEscaped = name.size() != bytes.size();
    return (isEscaped ? "\\" : "") + hexOf(digest) + "  " + (isTerminal() ? shown(path) : name) + "\n";
}

std::string coloured(Colour colour, std::string text)
{
    static bool const isWanted = wantsColours();
    if (!isWanted || colour == Colour::none) {
        return text;
    }
    return (colour == Colour::red ? "\x1b[31m" : "\x1b[32m") + text + "\x1b[m";
}

} // namespace tav
