#include "host/repository/last_commit.h"

#include "host/repository/local_database.h"

namespace tav {

Tree lastCommitFiles(common::RootPath const& root)
{
    LocalDatabase const database = LocalDatabase::open(root);
    return database.commits().files(database.base());
}

} // namespace tav
