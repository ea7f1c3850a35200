#include "host/text/size.h"

#include <charconv>
#include <limits>
#include <string_view>
#include <utility>

namespace tav {

std::optional<std::uint64_t> parseSize(std::string const& typed)
{
    std::uint64_t number = 0;
    char const* const end = typed.data() + typed.size();
    auto const [rest, error] = std::from_chars(typed.data(), end, number);
    if (error != std::errc()) {
        return std::nullopt;
    }
    std::string_view unit(rest, static_cast<std::size_t>(end - rest));
    unit.remove_prefix(!unit.empty() && unit.front() == ' ' ? 1 : 0);
    std::uint64_t factor = 1;
    if (unit.empty()) {
        return rest == end ? std::optional(number) : std::nullopt;
    }
    for (std::string_view const known : {"kB", "MB", "GB", "TB"}) {
        factor *= 1000;
        if (unit == known && number <= std::numeric_limits<std::uint64_t>::max() / factor) {
            return number * factor;
        }
    }
    return std::nullopt;
}

} // namespace tav
