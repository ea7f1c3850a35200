#include "host/cli/unreadable_folders.h"

#include "host/cli/output.h"

namespace tav {

void noteUnreadable(std::string const& consequence, Folders const& folders)
{
    if (!folders.empty()) {
        printNote(consequence);
    }
    for (OdString const& folder : folders) {
        printErrorDetail((folder.isEmpty() ? OdString(L".") : folder).ansi_str() + "/");
    }
}

} // namespace tav
