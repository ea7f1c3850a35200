/// Files and folders of the storage. Everything throws `StorageError`.
#pragma once

#include <string>
#include <vector>

namespace tav {

/// Whether there is anything at `path`, links followed.
bool exists(std::string const& path);
/// Makes the folder `path` and those above it, where they are missing.
void makeFolders(std::string const& path);
/// Names of the entries of `folder` in ascending order, "." and ".." left out; none when it is missing.
std::vector<std::string> entriesOf(std::string const& folder);

/// Waits until the file `path` is safe on the disk.
void flushFile(std::string const& path);
/// Waits until the names in the folder `path` are safe on the disk.
void flushFolder(std::string const& path);

} // namespace tav
