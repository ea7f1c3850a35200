#include "host/cli/commit_author.h"

#include "host/cli/current_settings.h"
#include "host/cli/terminal.h"

namespace tav {

namespace {

std::string askForName(std::string const& usual)
{
    auto const answer = ask("Your name for commits [" + usual + "]:");
    if (!answer) {
        return usual;
    }
    std::string const name = answer->empty() ? usual : *answer;
    saveSetting("user.name", name, Origin::user);
    return name;
}

} // namespace

std::string commitAuthor()
{
    SettingEntry const name = currentSettings().effective("user.name");
    return name.origin == Origin::standard && canAsk() ? askForName(name.value) : name.value;
}

} // namespace tav
