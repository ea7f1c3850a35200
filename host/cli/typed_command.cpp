#include "host/cli/typed_command.h"

#include "host/text/plural.h"
#include "host/text/utf8.h"

#include <algorithm>

namespace tav {

namespace {

constexpr std::size_t kNamesShown = 3;

} // namespace

OdString typedCommand(std::string const& command, std::vector<std::string> const& names, bool all)
{
    std::string text = command + (all ? " --all" : "");
    std::size_t const count = std::min(names.size(), kNamesShown);
    for (std::size_t i = 0; i < count; ++i) {
        text += " " + names[i];
    }
    if (names.size() > count) {
        text += " and " + counted(names.size() - count, "other name");
    }
    return fromUtf8(text);
}

} // namespace tav
