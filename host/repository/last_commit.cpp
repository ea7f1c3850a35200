#include "host/repository/last_commit.h"

namespace tav {

std::vector<common::VersionedFile> lastCommitFiles(common::RootPath const& /*root*/)
{
    return {}; // Every repository stands on the empty commit so far.
}

} // namespace tav
