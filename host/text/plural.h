/// Numbers of things in messages.
#pragma once

#include <cstddef>
#include <string>

namespace tav {

/// "1 file", "2 files".
inline std::string counted(std::size_t count, std::string const& noun)
{
    return std::to_string(count) + " " + noun + (count == 1 ? "" : "s");
}

/// "1 commit that is", "2 commits that are".
inline std::string countedThatAre(std::size_t count, std::string const& noun)
{
    return counted(count, noun) + (count == 1 ? " that is" : " that are");
}

} // namespace tav
