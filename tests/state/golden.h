/// Documents as they must be, byte for byte.
#pragma once

#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>

namespace states {

/// The content of the file `path`, which is a part of the project.
inline std::string contentOf(std::string const& path)
{
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        throw std::runtime_error("cannot read " + path);
    }
    return {std::istreambuf_iterator<char>(file), {}};
}

/// A document of the folder tests/golden/state.
inline std::string golden(std::string const& name)
{
    return contentOf(MU_GOLDEN_STATE "/" + name);
}

} // namespace states
