#include "host/cli/moved_project.h"

#include "host/errors/failure.h"
#include "host/repository/identity.h"
#include "host/repository/open.h"
#include "host/user/projects.h"

#include "platform/sdk/OdError.h"

#include <algorithm>
#include <exception>
#include <filesystem>
#include <vector>

namespace tav {

namespace {

bool contains(std::vector<OdString> const& ids, OdString const& id)
{
    return std::find(ids.begin(), ids.end(), id) != ids.end();
}

/// A folder that cannot be examined may be there: its drive may only be away for those who have no right to it.
bool isGoneFrom(OdString const& path, OdString const& id)
{
    std::error_code ignored;
    auto const type = std::filesystem::status(common::RootPath::tavPath(path).ansi_str(), ignored).type();
    if (type == std::filesystem::file_type::directory) {
        std::vector<OdString> const ids = identities(common::RootPath(path));
        return !ids.empty() && !contains(ids, id);
    }
    return type == std::filesystem::file_type::not_found;
}

void follow(common::RootPath const& root)
{
    std::vector<OdString> const ids = identities(root);
    for (auto const& [path, project] : readProjects().projects) {
        if (path != root.path() && contains(ids, project.cloud) && isGoneFrom(path, project.cloud)) {
            moveProject(path, root.path());
        }
    }
}

} // namespace

void followMovedProject()
{
    try {
        auto const root = hasProjects() ? repositoryHere() : std::nullopt;
        if (root) {
            follow(*root);
        }
    } catch (Failure const&) {
        // The list stays as it is: the command itself has succeeded, and says so.
    } catch (OdError const&) {
    } catch (std::exception const&) { // among them memory that is too short
    }
}

} // namespace tav
