#include "host/pictures/terminal.h"

#include "host/pictures/png_file.h"
#include "host/pictures/sixel.h"

#include <algorithm>

namespace tav {

namespace {

bool startsWith(std::string_view text, std::string_view start)
{
    return text.substr(0, start.size()) == start;
}

std::string base64(std::string_view bytes)
{
    constexpr std::string_view kDigits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string text;
    for (; !bytes.empty(); bytes.remove_prefix(std::min<std::size_t>(bytes.size(), 3))) {
        std::size_t const count = std::min<std::size_t>(bytes.size(), 3);
        std::uint32_t group = 0;
        for (std::size_t i = 0; i < 3; ++i) {
            group = group << 8U | (i < count ? static_cast<std::uint8_t>(bytes[i]) : 0U);
        }
        for (std::size_t i = 0; i < 4; ++i) {
            text += i <= count ? kDigits[group >> (18 - 6 * i) & 0x3FU] : '=';
        }
    }
    return text;
}

// The protocol takes no longer pieces than this.
std::string kittyText(Image const& image)
{
    constexpr std::size_t kMaxPiece = 4096;
    std::string const content = base64(encodePng(image));
    std::string text;
    for (std::size_t begin = 0; begin < content.size(); begin += kMaxPiece) {
        bool const isLast = begin + kMaxPiece >= content.size();
        text += begin == 0 ? "\x1B_Gf=100,a=T,q=2," : "\x1B_G";
        text += isLast ? "m=0;" : "m=1;";
        text += content.substr(begin, kMaxPiece) + "\x1B\\";
    }
    return text;
}

std::string iterm2Text(Image const& image)
{
    std::string const file = encodePng(image);
    return "\x1B]1337;File=inline=1;size=" + std::to_string(file.size()) + ":" + base64(file) + "\a";
}

} // namespace

PictureProtocol pictureProtocol(bool isTerminal, Environment const& environment)
{
    auto const value = [&](char const* name) {
        char const* const text = environment(name);
        return std::string_view(text != nullptr ? text : "");
    };
    std::string_view const term = value("TERM");
    std::string_view const program = value("TERM_PROGRAM");
    bool const isMultiplexed =
        !value("TMUX").empty() || !value("STY").empty() || startsWith(term, "screen") || startsWith(term, "tmux");
    if (!isTerminal || isMultiplexed || term.empty() || term == "dumb") {
        return PictureProtocol::none;
    }
    if (term == "xterm-kitty" || term == "xterm-ghostty") {
        return PictureProtocol::kitty;
    }
    if (program == "iTerm.app" || program == "WezTerm" || program == "mintty" || value("LC_TERMINAL") == "iTerm2") {
        return PictureProtocol::iterm2;
    }
    bool const hasSixel = startsWith(term, "foot") || startsWith(term, "mlterm") || startsWith(term, "yaft") ||
                          term.find("sixel") != std::string_view::npos;
    return hasSixel ? PictureProtocol::sixel : PictureProtocol::none;
}

std::string pictureText(PictureProtocol protocol, Image const& image)
{
    switch (protocol) {
    case PictureProtocol::kitty: return kittyText(image) + "\n";
    case PictureProtocol::iterm2: return iterm2Text(image) + "\n";
    case PictureProtocol::sixel: return sixelText(image) + "\n";
    case PictureProtocol::none: break;
    }
    return "";
}

} // namespace tav
