#include "platform/ut/text.h"

#include "platform/os/os_files.h"

#include <cstring>
#include <new>
#include <string_view>

namespace ut {
namespace {

// Not strerror: that one follows the locale.
OdString reasonOf(std::error_code const& error)
{
    if (error == std::errc::invalid_argument) {
        return L"Not a regular file";
    }
    char const* const text = strerrordesc_np(error.value());
    return {text == nullptr ? "Unknown error" : text, CP_UTF_8};
}

[[noreturn]] void throwUnreadable(OdString const& path, std::error_code const& error)
{
    if (error == std::errc::not_enough_memory) { // Says nothing about the file, which must not count as empty.
        throw std::bad_alloc();
    }
    OdString message;
    throw OdError(message.format(L"Could not read file '%ls': %ls", path.c_str(), reasonOf(error).c_str()));
}

std::string_view withoutByteOrderMark(std::string_view bytes)
{
    constexpr std::string_view kMark = "\xEF\xBB\xBF";
    return bytes.substr(0, kMark.size()) == kMark ? bytes.substr(kMark.size()) : bytes;
}

} // namespace

OdString readEntireFile(OdString const& path)
{
    std::string bytes;
    if (auto const error = os::readFile(path.ansi_str(), bytes)) {
        throwUnreadable(path, error);
    }
    std::string_view const text = withoutByteOrderMark(bytes);
    return {text.data(), text.size(), CP_UTF_8};
}

OdString correctSlashes(OdString const& path)
{
    return path;
}

OdArray<OdString> splitByChar(OdString const& text, wchar_t separator, bool keepEmpty)
{
    OdArray<OdString> pieces;
    std::size_t begin = 0;
    for (std::size_t i = 0; i <= text.getLength(); ++i) {
        if (i < text.getLength() && text.getAt(i) != separator) {
            continue;
        }
        if (keepEmpty || i > begin) {
            pieces.append(text.mid(begin, i - begin));
        }
        begin = i + 1;
    }
    return pieces;
}

} // namespace ut
