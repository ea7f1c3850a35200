#include "host/pictures/terminal.h"

#include "host/pictures/png_file.h"
#include "tests/pictures/drawn_image.h"

#include <map>

namespace tav {

namespace {

using Variables = std::map<std::string, std::string>;

Environment environmentOf(Variables const& variables)
{
    return [&variables](char const* name) {
        auto const found = variables.find(name);
        return found == variables.end() ? nullptr : found->second.c_str();
    };
}

struct Row {
    char const* name;
    Variables variables;
    PictureProtocol protocol;
};

class Terminals : public testing::TestWithParam<Row> {};

TEST_P(Terminals, AreKnownByTheirVariables)
{
    EXPECT_EQ(pictureProtocol(true, environmentOf(GetParam().variables)), GetParam().protocol);
}

TEST_P(Terminals, GetNoPictureWhenTheOutputGoesElsewhere)
{
    EXPECT_EQ(pictureProtocol(false, environmentOf(GetParam().variables)), PictureProtocol::none);
}

TEST_P(Terminals, GetNoPictureInsideAMultiplexer)
{
    for (auto const& [name, value] :
         Variables{{"TMUX", "/tmp/1"}, {"STY", "1.tty"}, {"TERM", "screen-256color"}, {"TERM", "tmux-256color"}}) {
        Variables variables = GetParam().variables;
        variables[name] = value;
        EXPECT_EQ(pictureProtocol(true, environmentOf(variables)), PictureProtocol::none) << name;
    }
}

INSTANTIATE_TEST_SUITE_P(
    Known, Terminals,
    testing::Values(
        Row{"Kitty", {{"TERM", "xterm-kitty"}}, PictureProtocol::kitty},
        Row{"Ghostty", {{"TERM", "xterm-ghostty"}}, PictureProtocol::kitty},
        Row{"ITerm2", {{"TERM", "xterm-256color"}, {"TERM_PROGRAM", "iTerm.app"}}, PictureProtocol::iterm2},
        Row{"ITerm2FromAfar", {{"TERM", "xterm-256color"}, {"LC_TERMINAL", "iTerm2"}}, PictureProtocol::iterm2},
        Row{"WezTerm", {{"TERM", "xterm-256color"}, {"TERM_PROGRAM", "WezTerm"}}, PictureProtocol::iterm2},
        Row{"Mintty", {{"TERM", "xterm"}, {"TERM_PROGRAM", "mintty"}}, PictureProtocol::iterm2},
        Row{"Foot", {{"TERM", "foot"}}, PictureProtocol::sixel},
        Row{"FootExtra", {{"TERM", "foot-extra"}}, PictureProtocol::sixel},
        Row{"Mlterm", {{"TERM", "mlterm-256color"}}, PictureProtocol::sixel},
        Row{"NamedForSixels", {{"TERM", "xterm+sixel"}}, PictureProtocol::sixel},
        Row{"Xterm", {{"TERM", "xterm-256color"}}, PictureProtocol::none},
        Row{"Dumb", {{"TERM", "dumb"}, {"TERM_PROGRAM", "iTerm.app"}}, PictureProtocol::none},
        Row{"Nothing", {}, PictureProtocol::none}),
    [](auto const& row) { return row.param.name; });

// The bytes that `text` stands for in base 64.
std::string decoded(std::string const& text)
{
    std::string const digits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string bytes;
    unsigned group = 0;
    int bits = 0;
    for (char const c : text.substr(0, text.find('='))) {
        group = group << 6U | static_cast<unsigned>(digits.find(c));
        bits += 6;
        if (bits >= 8) {
            bits -= 8;
            bytes += static_cast<char>(group >> bits & 0xFFU);
        }
    }
    return bytes;
}

// Needs some thousands of bytes as a PNG.
Image noise()
{
    Image image(60, 60);
    std::uint32_t state = 1;
    for (std::size_t i = 0; i < 3 * 60 * 60; ++i) {
        state = state * 1664525 + 1013904223;
        image.bytes()[i] = static_cast<std::uint8_t>(state >> 24U);
    }
    return image;
}

TEST(PictureText, IsEmptyForATerminalWithoutPictures)
{
    EXPECT_EQ(pictureText(PictureProtocol::none, drawn({"."})), "");
}

TEST(PictureText, CarriesAPngForIterm2)
{
    // Their lengths leave every remainder of three, so the text ends in every way.
    for (std::string const row : {"r", "rg", "rgb", "rgb#", "rgb#.", "rrggbb"}) {
        std::string const file = encodePng(drawn({row}));
        std::string const begin = "\x1B]1337;File=inline=1;size=" + std::to_string(file.size()) + ":";
        std::string const text = pictureText(PictureProtocol::iterm2, drawn({row}));
        ASSERT_EQ(text.substr(0, begin.size()), begin);
        ASSERT_EQ(text.substr(text.size() - 2), "\a\n");
        std::string const content = text.substr(begin.size(), text.size() - 2 - begin.size());
        EXPECT_EQ(content.size() % 4, 0U);
        EXPECT_EQ(decoded(content), file);
    }
}

TEST(PictureText, CarriesASmallPngForKittyInOnePiece)
{
    std::string const text = pictureText(PictureProtocol::kitty, drawn({"r.", "#g"}));
    std::string const begin = "\x1B_Gf=100,a=T,q=2,m=0;";
    std::string const end = "\x1B\\\n";
    ASSERT_EQ(text.substr(0, begin.size()), begin);
    ASSERT_EQ(text.substr(text.size() - end.size()), end);
    EXPECT_EQ(
        decoded(text.substr(begin.size(), text.size() - begin.size() - end.size())), encodePng(drawn({"r.", "#g"})));
}

TEST(PictureText, CarriesALargePngForKittyInPieces)
{
    std::string text = pictureText(PictureProtocol::kitty, noise());
    std::string content;
    std::vector<std::string> heads;
    for (std::size_t end = text.find("\x1B\\"); end != std::string::npos; end = text.find("\x1B\\")) {
        std::size_t const semicolon = text.find(';');
        heads.push_back(text.substr(0, semicolon));
        EXPECT_LE(end - semicolon - 1, 4096U);
        content += text.substr(semicolon + 1, end - semicolon - 1);
        text.erase(0, end + 2);
    }
    EXPECT_EQ(text, "\n");
    ASSERT_GE(heads.size(), 3U);
    EXPECT_EQ(heads.front(), "\x1B_Gf=100,a=T,q=2,m=1");
    EXPECT_EQ(heads[1], "\x1B_Gm=1");
    EXPECT_EQ(heads.back(), "\x1B_Gm=0");
    EXPECT_EQ(decoded(content), encodePng(noise()));
}

TEST(PictureText, HasSixelsColorByColor)
{
    // Red is number 5 * 36, white 215, black 0; a sixel has its upper pixel in the lowest bit.
    EXPECT_EQ(
        pictureText(PictureProtocol::sixel, drawn({"r.", "##"})),
        "\x1BPq\"1;1;2;2#0;2;0;0;0#180;2;100;0;0#215;2;100;100;100"
        "#0AA$#180@?$#215?@-\x1B\\\n");
}

TEST(PictureText, CountsRepeatedSixels)
{
    EXPECT_EQ(
        pictureText(PictureProtocol::sixel, drawn({"####...", "####..."})),
        "\x1BPq\"1;1;7;2#0;2;0;0;0#215;2;100;100;100#0!4B???$#215!4?BBB-\x1B\\\n");
}

TEST(PictureText, HasABandOfSixelsForEverySixRows)
{
    EXPECT_EQ(
        pictureText(PictureProtocol::sixel, drawn({"#", "#", "#", "#", "#", "#", "#"})),
        "\x1BPq\"1;1;1;7#0;2;0;0;0#0~-#0@-\x1B\\\n");
}

TEST(PictureText, NamesTheNearestOf216Colors)
{
    Image image(1, 1, Color{25, 26, 230});
    EXPECT_EQ(pictureText(PictureProtocol::sixel, image), "\x1BPq\"1;1;1;1#11;2;0;20;100#11@-\x1B\\\n");
}

} // namespace

} // namespace tav
