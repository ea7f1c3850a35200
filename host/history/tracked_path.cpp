#include "host/history/tracked_path.h"

#include "host/text/characters.h"
#include "host/text/utf8.h"
#include "platform/os/os_way.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <vector>

namespace tav {

namespace {

constexpr std::size_t kLongestPath = 4096;
constexpr std::size_t kLongestPart = 255;

bool isLetter(wchar_t c)
{
    return (c >= L'a' && c <= L'z') || (c >= L'A' && c <= L'Z');
}

bool isDigit(wchar_t c)
{
    return c >= L'0' && c <= L'9';
}

template <class Predicate>
bool hasAny(OdString const& text, Predicate const& predicate)
{
    wchar_t const* const begin = text.c_str();
    return std::any_of(begin, begin + text.getLength(), predicate);
}

std::vector<OdString> partsOf(OdString const& path)
{
    std::vector<OdString> parts(1);
    for (std::size_t i = 0; i < path.getLength(); ++i) {
        wchar_t const c = path.getAt(i);
        if (c == L'/') {
            parts.emplace_back();
        } else {
            parts.back() += c;
        }
    }
    return parts;
}

bool isHex(wchar_t c)
{
    return isDigit(c) || (c >= L'a' && c <= L'f');
}

/// Characters that Unicode's compatibility forms fold to a row of plain ones, which repeats after `period`.
struct Compatible {
    wchar_t first;
    wchar_t last;
    wchar_t plain;
    int period;
};

// Those that can spell a name of the own folder; some file systems compare names so.
constexpr std::array kCompatible = {
    Compatible{0xAA, 0xAA, L'a', 1},        Compatible{0x1D2C, 0x1D2C, L'a', 1},
    Compatible{0x1D40, 0x1D40, L't', 1},    Compatible{0x1D43, 0x1D43, L'a', 1},
    Compatible{0x1D57, 0x1D57, L't', 1},    Compatible{0x1D5B, 0x1D5B, L'v', 1},
    Compatible{0x1D65, 0x1D65, L'v', 1},    Compatible{0x2024, 0x2024, L'.', 1},
    Compatible{0x2090, 0x2090, L'a', 1},    Compatible{0x209C, 0x209C, L't', 1},
    Compatible{0x2164, 0x2164, L'v', 1},    Compatible{0x2174, 0x2174, L'v', 1},
    Compatible{0x24B6, 0x24E9, L'a', 26},   Compatible{0x2C7D, 0x2C7D, L'v', 1},
    Compatible{0xFE52, 0xFE52, L'.', 1},    Compatible{0xFF01, 0xFF5E, L'!', 94},
    Compatible{0x1D400, 0x1D6A3, L'a', 26}, Compatible{0x1D7CE, 0x1D7FF, L'0', 10},
    Compatible{0x1F130, 0x1F149, L'a', 26},
};

wchar_t inSmall(wchar_t c)
{
    return (c >= L'A' && c <= L'Z') ? static_cast<wchar_t>(c - L'A' + L'a') : c;
}

wchar_t plain(wchar_t c)
{
    if (c < kCompatible.front().first) {
        return inSmall(c);
    }
    for (Compatible const& range : kCompatible) {
        if (c >= range.first && c <= range.last) {
            return inSmall(static_cast<wchar_t>(range.plain + (c - range.first) % range.period));
        }
    }
    return inSmall(c);
}

/// What is left of a part on a file system that passes over invisible characters, letter case, compatibility forms, and
/// dots and blanks at the end.
OdString barePart(OdString const& part)
{
    OdString bare;
    for (std::size_t i = 0; i < part.getLength(); ++i) {
        wchar_t const c = part.getAt(i);
        if (!isInvisible(c)) {
            bare += plain(c);
        }
    }
    std::size_t length = bare.getLength();
    while (length > 0 && (bare.getAt(length - 1) == L'.' || bare.getAt(length - 1) == L' ')) {
        --length;
    }
    return bare.left(length);
}

OdString withoutStream(OdString const& part)
{
    std::size_t length = 0;
    while (length < part.getLength() && part.getAt(length) != L':') {
        ++length;
    }
    return part.left(length);
}

bool isNumbered(OdString const& text, OdString const& stem)
{
    std::size_t const length = stem.getLength();
    bool const isNumbered = text.getLength() > length && text.left(length) == stem;
    return isNumbered && !hasAny(text.mid(length), [](wchar_t c) { return !isDigit(c); });
}

/// "tav~1", or "ta3f0c~1" where many names begin alike.
bool isShortName(OdString const& bare)
{
    OdString const digits = bare.mid(2, 4);
    bool const isHashed = digits.getLength() == 4 && !hasAny(digits, [](wchar_t c) { return !isHex(c); });
    return isNumbered(bare, L"tav~") || (isHashed && isNumbered(bare.left(2) + bare.mid(6), L"ta~"));
}

bool isOwnFolder(OdString const& part)
{
    OdString const bare = barePart(withoutStream(part));
    return bare == L".tav" || isShortName(bare);
}

bool isAbsolute(OdString const& path)
{
    return path.getAt(0) == L'/';
}

bool hasDrive(OdString const& path)
{
    return path.getLength() > 1 && path.getAt(1) == L':' && isLetter(path.getAt(0));
}

bool hasBackslash(OdString const& path)
{
    return hasAny(path, [](wchar_t c) { return c == L'\\'; });
}

bool hasControls(OdString const& path)
{
    return hasAny(path, isControl);
}

bool isNotSound(OdString const& path)
{
    return !isSound(path);
}

bool isTooLong(OdString const& path)
{
    return path.ansi_str().size() > kLongestPath;
}

bool isLongPart(OdString const& part)
{
    return part.ansi_str().size() > kLongestPart;
}

bool isEmptyPart(OdString const& part)
{
    return part.isEmpty();
}

bool isDots(OdString const& part)
{
    return barePart(part).isEmpty();
}

struct Rule {
    bool (*isBroken)(OdString const& text);
    char const* fault;
};

// The order is that of the answers: a path that breaks several rules is told the first.
constexpr std::array kRulesOfPaths = {
    Rule{isAbsolute, "is absolute; a recorded path is relative to the working folder"},
    Rule{hasDrive, "begins with a drive; a recorded path is relative to the working folder"},
    Rule{isTooLong, "is longer than 4096 bytes"},
    Rule{hasControls, "holds a control character or a line end"},
    Rule{hasBackslash, "holds a backslash, which separates folders on other systems"},
    Rule{isNotSound, "holds a character that no file name has"},
};

constexpr std::array kRulesOfParts = {
    Rule{isEmptyPart, "has an empty part between its slashes"},
    Rule{isDots, "has a part that consists of dots and spaces, which may lead out of the working folder"},
    Rule{isLongPart, "has a part that is longer than 255 bytes"},
    Rule{isOwnFolder, "leads into the folder '.tav', which belongs to the repository"},
};

char const* faultOf(OdString const& path)
{
    for (Rule const& rule : kRulesOfPaths) {
        if (rule.isBroken(path)) {
            return rule.fault;
        }
    }
    std::vector<OdString> const parts = partsOf(path);
    bool const isProperty = parts.size() > 2 && parts[0] == L".tav" && parts[1] == L"properties";
    for (std::size_t i = isProperty ? 2 : 0; i < parts.size(); ++i) {
        for (Rule const& rule : kRulesOfParts) {
            if (rule.isBroken(parts[i])) {
                return rule.fault;
            }
        }
    }
    return nullptr;
}

} // namespace

std::optional<std::string> whyUnsafe(OdString const& path)
{
    if (path.isEmpty()) {
        return "The path is empty.";
    }
    char const* const fault = faultOf(path);
    return fault ? std::optional("The path " + quoted(path) + " " + fault + ".") : std::nullopt;
}

std::optional<std::string> linkOnTheWay(std::string const& root, OdString const& path)
{
    std::string const bytes = path.ansi_str();
    os::Obstacle const obstacle = os::findObstacle(root, bytes);
    OdString const way = fromUtf8(obstacle.length == 0 ? root : bytes.substr(0, obstacle.length));
    switch (obstacle.kind) {
    case os::Obstacle::Kind::none: return std::nullopt;
    case os::Obstacle::Kind::link:
        return quoted(way) + " is a symbolic link, which may lead out of the working folder.";
    case os::Obstacle::Kind::notFolder: return quoted(way) + " is not a folder.";
    case os::Obstacle::Kind::unknown: break;
    }
    return quoted(way) + " cannot be examined: " + obstacle.error.message() + ".";
}

} // namespace tav
