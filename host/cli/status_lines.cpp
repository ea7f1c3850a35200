#include "host/cli/status_lines.h"

#include "host/cli/output.h"

namespace tav {

std::string lineOf(StagedEntry const& entry)
{
    if (entry.isMissing) {
        return "gone:     " + shown(entry.path);
    }
    if (!entry.previousPath.isEmpty()) {
        return "renamed:  " + shown(entry.previousPath) + " -> " + shown(entry.path);
    }
    switch (entry.change) {
    case common::FileChange::added: return "new:      " + shown(entry.path);
    case common::FileChange::modified: return "modified: " + shown(entry.path);
    case common::FileChange::removed: return "removed:  " + shown(entry.path);
    }
    return shown(entry.path);
}

} // namespace tav
