// Until the host keeps commits, this stands in for the last one: a file that a test writes.
#include "host/repository/last_commit.h"

#include <fstream>
#include <string>

namespace tav {

std::vector<common::VersionedFile> lastCommitFiles(common::RootPath const& root)
{
    std::vector<common::VersionedFile> files;
    std::ifstream list((root.tavPath() + L"/last_commit").ansi_str());
    for (std::string digest, path; list >> digest && list.get() && std::getline(list, path);) {
        files.push_back(
            {OdString(path.data(), path.size(), CP_UTF_8), OdString(digest.data(), digest.size(), CP_UTF_8)});
    }
    return files;
}

} // namespace tav
