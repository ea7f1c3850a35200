#include "platform/ut/TextFile.h"

#include "platform/os/os_files.h"
#include "platform/ut/FileName.h"
#include "platform/ut/text.h"

#include <utility>

namespace ut {
namespace {

std::vector<OdString> splitLines(OdString const& text)
{
    std::vector<OdString> lines;
    std::size_t begin = 0;
    for (std::size_t i = 0; i < text.getLength(); ++i) {
        if (text.getAt(i) == L'\n') {
            std::size_t const end = i > begin && text.getAt(i - 1) == L'\r' ? i - 1 : i;
            lines.push_back(text.mid(begin, end - begin));
            begin = i + 1;
        }
    }
    if (begin < text.getLength()) {
        lines.push_back(text.mid(begin));
    }
    return lines;
}

std::string joinLines(std::vector<OdString> const& lines)
{
    std::string bytes = lines.empty() ? std::string() : lines.front().ansi_str();
    for (std::size_t i = 1; i < lines.size(); ++i) {
        bytes += '\n';
        bytes += lines[i].ansi_str();
    }
    return bytes;
}

} // namespace

TextFile::TextFile(OdString const& path) : path_(path) {}

bool TextFile::exists() const
{
    return FileName::fileExists(path_);
}

bool TextFile::open()
{
    create();
    try {
        lines_ = splitLines(readEntireFile(path_));
    } catch (OdError const&) {
        return false;
    }
    return true;
}

OdString TextFile::getFirstLine()
{
    next_ = 0;
    return getNextLine();
}

OdString TextFile::getNextLine()
{
    return next_ < lines_.size() ? lines_[next_++] : OdString::kEmpty;
}

void TextFile::create()
{
    lines_.clear();
    next_ = 0;
}

void TextFile::addLine(OdString line)
{
    lines_.push_back(std::move(line));
}

bool TextFile::write()
{
    return !os::replaceFile(path_.ansi_str(), joinLines(lines_));
}

} // namespace ut
