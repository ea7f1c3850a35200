#include "host/repository/conflicts.h"

#include "host/errors/failure.h"

#include "platform/os/os_files.h"

#include <cerrno>
#include <string>
#include <system_error>

namespace tav {

namespace {

/// The library passes over folders that cannot be read.
void requireReadable(std::string const& folder)
{
    os::FolderReader const reader = os::openFolder(folder);
    if (!reader && errno != ENOENT) {
        std::string const why = std::generic_category().message(errno);
        throw Failure(
            "The conflict folder '" + folder + "' cannot be read: " + why + ".", "Check your permissions for it.");
    }
    while (dirent const* const entry = reader ? readdir(reader.get()) : nullptr) {
        std::string const name = entry->d_name;
        if (entry->d_type == DT_DIR && name != "." && name != "..") {
            requireReadable(std::string(folder).append("/").append(name));
        }
    }
}

} // namespace

std::vector<common::ConflictInfo> openConflicts(common::RootPath const& root)
{
    requireReadable(root.conflictPath().ansi_str());
    std::vector<common::ConflictInfo> conflicts;
    for (auto const& conflict : common::collectConflictPaths(root)) {
        conflicts.push_back(*conflict);
    }
    return conflicts;
}

void requireNoConflicts(common::RootPath const& root)
{
    std::vector<common::ConflictInfo> const conflicts = openConflicts(root);
    if (conflicts.empty()) {
        return;
    }
    Failure failure(
        "These drawings are in conflict.",
        "Put the version to keep in its place, remove the others from '.tav/conflict', and run the command "
        "again:");
    for (common::ConflictInfo const& conflict : conflicts) {
        failure.details.push_back(conflict.path.ansi_str());
    }
    throw failure;
}

} // namespace tav
