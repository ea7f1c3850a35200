#include "host/cli/current_settings.h"

#include "host/repository/open.h"

namespace tav {

Settings currentSettings()
{
    auto const root = repositoryHere();
    return Settings(root ? root->tavPath().ansi_str() : "");
}

} // namespace tav
