#include "host/repository/ignore_pattern.h"

#include "host/text/utf8.h"

#include <string>

namespace tav {

namespace {

/// Rules are matched with the bytes of a name, and a character of UTF-8 has up to four.
constexpr char const* kOneCharacter = R"([^\x80-\xBF][\x80-\xBF]*)";

bool isWildcard(std::string const& typed)
{
    return typed.find_first_of("*?") != std::string::npos && typed.find_first_of("\\^$()[]{}|+") == std::string::npos &&
           typed.compare(0, 2, ".*") != 0;
}

} // namespace

OdString ruleFor(std::string const& typed)
{
    if (!isWildcard(typed)) {
        return fromUtf8(typed);
    }
    std::string rule = "^";
    for (char const c : typed) {
        switch (c) {
        case '*': rule += ".*"; break;
        case '?': rule += kOneCharacter; break;
        case '.': rule += "\\."; break;
        default: rule += c;
        }
    }
    return fromUtf8(rule + "$");
}

OdString ruleForName(std::string const& name)
{
    std::string rule = "^";
    for (char const c : name) {
        rule += std::string("\\^$.[]{}()|+*?").find(c) == std::string::npos ? "" : "\\";
        rule += c;
    }
    return fromUtf8(rule + "$");
}

} // namespace tav
