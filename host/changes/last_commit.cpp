#include "host/changes/last_commit.h"

#include "host/repository/local_database.h"

namespace tav {

FileList lastCommitFiles(common::RootPath const& root)
{
    LocalDatabase const database = LocalDatabase::open(root);
    return database.commits().fileList(database.currentCommit());
}

} // namespace tav
