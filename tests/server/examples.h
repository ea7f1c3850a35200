/// The examples in the descriptions of formats.
#pragma once

#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

namespace server {

/// The `number`-th fenced block, counted from 0, that follows the line `heading` in docs/formats/`file`, without its
/// fences and without a line feed at its end.
inline std::string example(std::string const& file, std::string const& heading, int number = 0)
{
    std::ifstream text(MU_FORMATS "/" + file);
    std::string line;
    while (std::getline(text, line) && line != heading) {
    }
    for (int fences = 0; fences <= 2 * number && std::getline(text, line);) {
        fences += line.rfind("```", 0) == 0 ? 1 : 0;
    }
    std::string block;
    while (std::getline(text, line) && line != "```") {
        block += (block.empty() ? "" : "\n") + line;
    }
    if (!text) {
        throw std::runtime_error("no example " + std::to_string(number) + " below '" + heading + "' in " + file);
    }
    return block;
}

} // namespace server
