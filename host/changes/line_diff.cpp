#include "host/changes/line_diff.h"

#include "host/text/characters.h"
#include "host/text/utf8.h"

#include <dtl/dtl.hpp>

#include <sstream>
#include <vector>

namespace tav {

namespace {

bool isText(std::string const& content)
{
    bool const isPlain = content.size() <= kLongestText && content.find('\0') == std::string::npos;
    if (!isPlain) {
        return false;
    }
    OdString const text = fromUtf8(content);
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        if (text.getAt(i) >= 0xD800 && text.getAt(i) <= 0xDFFF) { // stands for a byte that is no UTF-8
            return false;
        }
    }
    return true;
}

std::vector<std::string> linesOf(std::string const& text)
{
    std::vector<std::string> lines;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);) {
        lines.push_back(std::move(line));
    }
    return lines;
}

} // namespace

std::optional<std::string> lineDiff(std::string const& before, std::string const& after)
{
    if (!isText(before) || !isText(after)) {
        return std::nullopt;
    }
    dtl::Diff<std::string> diff(linesOf(before), linesOf(after));
    diff.compose();
    diff.composeUnifiedHunks();
    std::ostringstream text;
    diff.printUnifiedFormat(text);
    return text.str();
}

} // namespace tav
